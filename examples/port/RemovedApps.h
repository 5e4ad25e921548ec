// The list of removed apps, in a text file.
#pragma once

#include <functional>
#include <mutex>
#include <optional>
#include <set>
#include <string>
#include <string_view>
#include <utility>
#include <vector>

#include "platform/UninstalledAppsList.h"

namespace port {

/// One bundle identifier per line. A missing file is an empty list.
///
/// The contract requires persistence, atomic clearing and thread safety. So each change reads the file, changes the set
/// in memory and replaces the file atomically, under one lock.
class RemovedApps final : public appsync::platform::UninstalledAppsList {
 public:
  explicit RemovedApps(std::string path) : path_(std::move(path)) {}

  // For the plug-in.
  [[nodiscard]] std::optional<appsync::plist::Dictionary> lookupUninstalled() override;
  [[nodiscard]] int clearUninstalled(const std::vector<std::string>& bundleIdentifiers) override;

  // For this device's installer, when an app was removed or reinstalled. Return 0 or an error number.
  [[nodiscard]] int add(std::string_view bundleIdentifier);
  [[nodiscard]] int remove(std::string_view bundleIdentifier);

 private:
  using Identifiers = std::set<std::string, std::less<>>;

  [[nodiscard]] std::optional<Identifiers> read() const;
  [[nodiscard]] int replace(const Identifiers& identifiers) const;

  const std::string path_;
  std::mutex mutex_;
};

}  // namespace port
