// The device's app store, the client that delivers the packages of restored apps.
#pragma once

#include <atomic>
#include <cstdint>
#include <functional>
#include <memory>
#include <optional>
#include <string>
#include <string_view>
#include <thread>
#include <vector>

#include "base/Error.h"
#include "device/coordination/InstallCoordination.h"
#include "device/storage/DeviceFileSystem.h"

namespace appsync::device {

/// The result of delivering an app's package.
struct StoreDelivery {
  std::string identifier;
  std::string name;                   ///< the placeholder's
  std::string path;                   ///< device path of the delivered package
  std::uint64_t bytes = 0;            ///< size of the package
  std::optional<Error> failure = {};  ///< the coordinator then waits for the next store client
};

/// Delivers packages, one at a time on its own thread, to the coordinators for whose app asset `CXClientBazaarly` is
/// responsible: copies the package to the device, with progress, and fulfils the promise, so that the service installs
/// the app. Tries each coordinator that exists at construction once.
///
/// Crash-safe: the next store client delivers the remaining packages.
class StoreClient {
 public:
  /// Device path of the directory of packages to install.
  static constexpr std::string_view kPackagesPath = "/var/mobile/Library/Bazaarly";

  /// Returns the host path of the app's package, or an error.
  using FindPackage = std::function<Result<std::string>(std::string_view identifier)>;
  /// Receives the result for each app, on the store's thread and before the promise is fulfilled.
  using Report = std::function<void(const StoreDelivery& delivery)>;

  /// The services must outlive this object. The functions are called on its thread.
  StoreClient(InstallCoordination& service, DeviceFileSystem& files, FindPackage find, Report report);
  /// Stops after the block that is being copied.
  ~StoreClient();
  StoreClient(const StoreClient&) = delete;
  StoreClient& operator=(const StoreClient&) = delete;

  /// Blocks until every delivery was tried. Must not be called by several threads at once.
  void wait();

  /// Returns the coordinators that wait for a package of the store, the oldest first.
  [[nodiscard]] static Result<std::vector<CoordinatorSummary>> awaited(InstallCoordination& service);

 private:
  void run();
  /// Removes the incomplete packages of earlier store clients.
  void sweep(const std::vector<CoordinatorSummary>& awaited);
  void deliver(const CoordinatorSummary& app);
  [[nodiscard]] Status copy(const std::string& hostPath, StoreDelivery& delivery,
                            platform::PromisedTransferToPath& promise);

  InstallCoordination& service_;
  DeviceFileSystem& files_;
  const FindPackage find_;
  const Report report_;
  std::atomic<bool> isStopping_ = false;
  std::thread thread_;
};

}  // namespace appsync::device
