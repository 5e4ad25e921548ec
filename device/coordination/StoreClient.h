// The device's app store, as the client that brings the packages of restored apps.
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

/// What became of one app that the store is to bring.
struct StoreDelivery {
  std::string identifier;
  std::string name;                   ///< as the placeholder shows it
  std::string path;                   ///< device path of the package, when it was delivered
  std::uint64_t bytes = 0;            ///< of the package
  std::optional<Error> failure = {};  ///< why it was not delivered; its coordinator waits for the next store client
};

/// Delivers, on a thread of its own, one package after the other to the coordinators for whose app asset
/// `CXClientBazaarly` is responsible: copies it into the device, with progress, and fulfils the promise, at which the
/// service installs the app. One object tries each coordinator that there is by then once.
///
/// Nothing is lost by ending it at any moment: what was not delivered is tried again by the next one.
class StoreClient {
 public:
  /// Device path of the folder in which packages lie until they are installed.
  static constexpr std::string_view kPackagesPath = "/var/mobile/Library/Bazaarly";

  /// The host path of the app's package, or why there is none.
  using FindPackage = std::function<Result<std::string>(std::string_view identifier)>;
  /// Hears of each app when it was tried, on the store's thread; of a delivered one before its promise is fulfilled.
  using Report = std::function<void(const StoreDelivery& delivery)>;

  /// The services must outlive it. The functions are called on the store's thread.
  StoreClient(InstallCoordination& service, DeviceFileSystem& files, FindPackage find, Report report);
  /// Stops after the piece that is being copied.
  ~StoreClient();
  StoreClient(const StoreClient&) = delete;
  StoreClient& operator=(const StoreClient&) = delete;

  /// Blocks until all were tried. Any one thread.
  void wait();

  /// The apps for whose package coordinators rely on the store just now, the oldest first.
  [[nodiscard]] static Result<std::vector<CoordinatorSummary>> awaited(InstallCoordination& service);

 private:
  void run();
  /// Removes packages that an earlier store client left half done.
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
