// A daemon that syncs a platform of fakes.
#pragma once

#include <functional>
#include <memory>
#include <optional>
#include <string>

#include "core/AppsClient.h"
#include "kit/fakes/FakePlatform.h"

namespace appsync::test {

/// The way a device installs apps.
enum class Mode { direct, coordinated };

/// Sets the mode of a new device. Its install coordination runs only while a test waits for it.
void setMode(FakePlatform& platform, Mode mode);

/// Runs one sync, one asset at a time, so that the order of all platform calls is the same in every run.
class DaemonSync {
 public:
  /// The host.
  struct Host {
    std::function<Bytes(const std::string& identifier)> packageOf;
    /// The error of the app's transfer, or nullopt if it succeeds.
    std::function<std::optional<Error>(const std::string& identifier)> failureOf;
  };

  DaemonSync(FakePlatform& platform, Mode mode, Host host) : platform_(platform), mode_(mode), host_(std::move(host)) {}

  /// Runs a sync with a new client. `meanwhile` runs on the device during the transfers.
  void run(const std::function<void()>& meanwhile = [] {});

 private:
  using Asset = std::shared_ptr<platform::ZTAsset>;

  void transferAssets(const std::function<void()>& meanwhile);
  void transfer(const Asset& asset);
  void send(const Asset& asset);
  void sendData(const Asset& asset);
  void waitForInstalls();
  void waitForDirectInstalls();

  FakePlatform& platform_;
  const Mode mode_;
  const Host host_;
  std::shared_ptr<AppsClient> client_;
};

}  // namespace appsync::test
