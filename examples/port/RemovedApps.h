// The installer's memory of removed apps, in a plain file.
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

/// One bundle identifier a line. A file that is not there is an empty list.
///
/// The header in platform/ promises more than "a list": it outlives the process, clearing takes off all or none, and
/// every operation may come on any thread. So each change reads the file, changes the set in memory, and replaces the
/// file in one step, under one lock.
class RemovedApps final : public appsync::platform::UninstalledAppsList {
 public:
  explicit RemovedApps(std::string path) : path_(std::move(path)) {}

  // For the plug-in.
  [[nodiscard]] std::optional<appsync::plist::Dictionary> lookupUninstalled() override;
  [[nodiscard]] int clearUninstalled(const std::vector<std::string>& bundleIdentifiers) override;

  // For this device's installer: a real app was removed, or is installed again. Each returns 0, or an error number.
  [[nodiscard]] int remember(std::string_view bundleIdentifier);
  [[nodiscard]] int forget(std::string_view bundleIdentifier);

 private:
  using Identifiers = std::set<std::string, std::less<>>;

  [[nodiscard]] std::optional<Identifiers> read() const;
  [[nodiscard]] int replace(const Identifiers& identifiers) const;

  const std::string path_;
  std::mutex mutex_;
};

}  // namespace port
