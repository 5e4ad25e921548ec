// The plug-in on a platform of fakes.
#pragma once

#include <memory>
#include <string>
#include <string_view>
#include <utility>

#include <gtest/gtest.h>

#include "core/AppsClient.h"
#include "kit/fakes/FakePlatform.h"

namespace appsync::test {

using platform::kDaemonBundleIdentifier;

/// Base of the plug-in's tests: `platform` to prepare and to look at, `makeClient()` when it is prepared. After the
/// test it lets go of the client and waits until it is gone, wherever its last owner runs.
class ClientFixture : public testing::Test {
 protected:
  /// The plug-in in a process that is not the daemon; the fixture keeps it. The journal begins after construction.
  AppsClient& makeClient() {
    client_ = AppsClient::create(platform);
    platform.journal.clear();
    return *client_;
  }

  /// The same inside the daemon.
  AppsClient& makeDaemonClient() {
    platform.bundleFolders.setMainBundleIdentifier(std::string(kDaemonBundleIdentifier));
    return makeClient();
  }

  /// Gives the fixture's share of the client up.
  std::shared_ptr<AppsClient> takeClient() { return std::move(client_); }

  void TearDown() override {
    client_.reset();
    // What is still scheduled keeps the client alive, and goes with the platform.
    if (platform.time.pendingTasks() == 0) platform.backups.waitUntilReleased();
  }

  FakePlatform platform;

 private:
  std::shared_ptr<AppsClient> client_;
};

}  // namespace appsync::test
