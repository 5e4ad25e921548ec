#include "kit/fakes/FakeProfileConnection.h"

namespace appsync::test {

using platform::RestrictionSetting;
using platform::RestrictionValue;

void FakeProfileConnection::set(RestrictionSetting setting, RestrictionValue value) {
  const std::scoped_lock lock(mutex_);
  values_[setting] = value;
}

RestrictionValue FakeProfileConnection::effectiveBoolValueForSetting(RestrictionSetting setting) {
  const bool isInstallation = setting == RestrictionSetting::appInstallationAllowed;
  if (journal_.beforeCall("profileConnection.effectiveBoolValueForSetting",
                          isInstallation ? "appInstallationAllowed" : "appRemovalAllowed")) {
    return RestrictionValue::unset;
  }
  const std::scoped_lock lock(mutex_);
  const auto found = values_.find(setting);
  return found == values_.end() ? RestrictionValue::unset : found->second;
}

}  // namespace appsync::test
