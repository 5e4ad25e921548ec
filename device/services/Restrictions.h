// The profile service: reads restrictions from the device's settings.
#pragma once

#include "device/services/Settings.h"
#include "platform/ProfileConnection.h"

namespace appsync::device {

class Restrictions final : public platform::ProfileConnection {
 public:
  /// `settings` must outlive this object.
  explicit Restrictions(Settings& settings) : settings_(settings) {}

  [[nodiscard]] platform::RestrictionValue effectiveBoolValueForSetting(platform::RestrictionSetting setting) override {
    return settings_.restriction(setting);
  }

 private:
  Settings& settings_;
};

}  // namespace appsync::device
