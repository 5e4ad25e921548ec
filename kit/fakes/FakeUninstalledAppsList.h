// The installer's list of removed apps.
#pragma once

#include <mutex>
#include <set>
#include <string>
#include <string_view>
#include <vector>

#include "kit/fakes/CallJournal.h"
#include "platform/UninstalledAppsList.h"

namespace appsync::test {

/// Journal lines: "uninstalledApps.lookupUninstalled", "uninstalledApps.clearUninstalled com.a com.b".
class FakeUninstalledAppsList final : public platform::UninstalledAppsList {
 public:
  explicit FakeUninstalledAppsList(CallJournal& journal) : journal_(journal) {}

  void add(std::string_view identifier);
  void remove(std::string_view identifier);
  [[nodiscard]] std::set<std::string> identifiers() const;

  /// Makes all later look-ups return nullopt.
  void loseAnswers();
  /// Sets the error number of all later clearing; 0 means success.
  void failClearingWith(int errorNumber);

  [[nodiscard]] std::optional<plist::Dictionary> lookupUninstalled() override;
  [[nodiscard]] int clearUninstalled(const std::vector<std::string>& bundleIdentifiers) override;

 private:
  CallJournal& journal_;
  mutable std::mutex mutex_;
  std::set<std::string> identifiers_;
  bool answers_ = true;
  int clearError_ = 0;
};

}  // namespace appsync::test
