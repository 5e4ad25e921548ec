// A daemon that syncs a device of fakes.
#pragma once

#include <functional>
#include <memory>
#include <optional>
#include <string>

#include "core/AppsClient.h"
#include "kit/fakes/FakePlatform.h"

namespace appsync::test {

/// How a device installs.
enum class Mode { direct, coordinated };

/// Makes a new device one of that mode. Its install coordination stands still but for when it is waited for.
void setMode(FakePlatform& platform, Mode mode);

/// One sync, one asset at a time: the order of all platform calls is the same in every run.
class DaemonSync {
 public:
  /// The host's side.
  struct Host {
    std::function<Bytes(const std::string& identifier)> packageOf;
    /// Why the app's transfer fails; none when it does not.
    std::function<std::optional<Error>(const std::string& identifier)> failureOf;
  };

  DaemonSync(FakePlatform& platform, Mode mode, Host host) : platform_(platform), mode_(mode), host_(std::move(host)) {}

  /// From the making of the client to its end. `meanwhile` is what happens on the device while assets come.
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
