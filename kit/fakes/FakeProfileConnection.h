// Restrictions that configuration profiles impose on the device.
#pragma once

#include <map>
#include <mutex>

#include "kit/fakes/CallJournal.h"
#include "platform/ProfileConnection.h"

namespace appsync::test {

/// All settings are initially unset. Journal line: "profileConnection.effectiveBoolValueForSetting appRemovalAllowed".
class FakeProfileConnection final : public platform::ProfileConnection {
 public:
  explicit FakeProfileConnection(CallJournal& journal) : journal_(journal) {}

  void set(platform::RestrictionSetting setting, platform::RestrictionValue value);

  [[nodiscard]] platform::RestrictionValue effectiveBoolValueForSetting(platform::RestrictionSetting setting) override;

 private:
  CallJournal& journal_;
  std::mutex mutex_;
  std::map<platform::RestrictionSetting, platform::RestrictionValue> values_;
};

}  // namespace appsync::test
