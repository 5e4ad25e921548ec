// A host and a daemon that sync an embedded device, with as many installs at once as there may be.
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

/// One app that the host wants on the device.
struct HostApp {
  /// Of a stalled one the first part comes, and then nothing, until the host gives all transfers up.
  enum class Package { good, damaged, lost, stalled };

  std::string identifier;
  std::string version;
  Package package = Package::good;
};

/// Drives `AppsClient` itself through whole syncs, as the daemon would.
class DeviceSync {
 public:
  /// The device stays the caller's.
  explicit DeviceSync(TestDevice& device) : device_(device) {}

  /// Stages instructions, makes the fixed sequence of calls and returns when all is done. Transfers are reported on
  /// `threads` threads at once. Returns the identifiers of the assets that were asked for.
  std::vector<std::string> run(const std::vector<HostApp>& apps, const std::vector<std::string>& toRemove,
                               std::size_t threads = 1);

  /// Called when every transfer was reported, and the end of them all was not.
  std::function<void()> beforeTransfersEnd = [] {};

  /// What the todo list says now, by identifier.
  [[nodiscard]] std::map<std::string, std::string> todoWords();

 private:
  void stage(const std::vector<HostApp>& apps, const std::vector<std::string>& toRemove);
  void transfer(AppsClient& client, const std::shared_ptr<platform::ZTAsset>& asset, const HostApp& app);

  TestDevice& device_;
};

}  // namespace appsync::test
