#include "kit/fakes/FakeUninstalledAppsList.h"

namespace appsync::test {

namespace {

constexpr int kInjectedFailure = 5;

}  // namespace

void FakeUninstalledAppsList::add(std::string_view identifier) {
  const std::scoped_lock lock(mutex_);
  identifiers_.emplace(identifier);
}

void FakeUninstalledAppsList::remove(std::string_view identifier) {
  const std::scoped_lock lock(mutex_);
  identifiers_.erase(std::string(identifier));
}

std::set<std::string> FakeUninstalledAppsList::identifiers() const {
  const std::scoped_lock lock(mutex_);
  return identifiers_;
}

void FakeUninstalledAppsList::loseAnswers() {
  const std::scoped_lock lock(mutex_);
  answers_ = false;
}

void FakeUninstalledAppsList::failClearingWith(int errorNumber) {
  const std::scoped_lock lock(mutex_);
  clearError_ = errorNumber;
}

std::optional<plist::Dictionary> FakeUninstalledAppsList::lookupUninstalled() {
  if (journal_.beforeCall("uninstalledApps.lookupUninstalled")) return std::nullopt;
  const std::scoped_lock lock(mutex_);
  if (!answers_) return std::nullopt;
  plist::Dictionary answer;
  for (const std::string& identifier : identifiers_)
    answer.set(identifier, plist::Dictionary());
  return answer;
}

int FakeUninstalledAppsList::clearUninstalled(const std::vector<std::string>& bundleIdentifiers) {
  std::string arguments;
  for (const std::string& identifier : bundleIdentifiers) {
    arguments.append(arguments.empty() ? "" : " ").append(identifier);
  }
  if (journal_.beforeCall("uninstalledApps.clearUninstalled", arguments)) return kInjectedFailure;
  const std::scoped_lock lock(mutex_);
  if (clearError_ != 0) return clearError_;
  for (const std::string& identifier : bundleIdentifiers)
    identifiers_.erase(identifier);
  return 0;
}

}  // namespace appsync::test
