// A host and a daemon that sync an embedded device with the maximum number of concurrent installs.
#pragma once

#include <cstddef>
#include <functional>
#include <map>
#include <memory>
#include <optional>
#include <string>
#include <string_view>
#include <vector>

#include "core/AppsClient.h"
#include "tests/support/TestDevice.h"

namespace appsync::test {

/// An app that the host wants on the device.
struct HostApp {
  /// A stalled package stops after its first part, until the host cancels all transfers.
  enum class Package { good, damaged, lost, stalled };

  std::string identifier;
  std::string version;
  Package package = Package::good;
};

/// Drives `AppsClient` through syncs as the daemon does.
class DeviceSync {
 public:
  /// The caller owns the device.
  explicit DeviceSync(TestDevice& device) : device_(device) {}

  /// Stages the host's files and runs a complete sync. Reports transfers on `threads` threads concurrently. Returns the
  /// identifiers of the requested assets.
  std::vector<std::string> run(const std::vector<HostApp>& apps, const std::vector<std::string>& toRemove,
                               std::size_t threads = 1);

  /// Called after every transfer was reported, before the end of all transfers is.
  std::function<void()> beforeTransfersEnd = [] {};

  /// The operations in the todo list, by identifier.
  [[nodiscard]] std::map<std::string, std::string> todoOperations();

 private:
  void stage(const std::vector<HostApp>& apps, const std::vector<std::string>& toRemove);
  void transfer(AppsClient& client, const std::shared_ptr<platform::ZTAsset>& asset, const HostApp& app);

  TestDevice& device_;
};

}  // namespace appsync::test
