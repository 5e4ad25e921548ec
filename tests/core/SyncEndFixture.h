// A client at the end of a sync.
#pragma once

#include <memory>
#include <optional>
#include <string>
#include <string_view>

#include "kit/fakes/CallsInLog.h"
#include "tests/support/ClientFixture.h"

namespace appsync::test {

inline constexpr std::string_view kSyncFolder = "/var/mobile/Library/ApplicationSync";
inline constexpr std::string_view kLastSyncState = "/var/mobile/Library/ApplicationSync/LastSyncAppState.plist";

class SyncEndFixture : public ClientFixture {
 protected:
  AppsClient& client = makeClient();

  std::shared_ptr<platform::ZTAsset> receivedAsset(const std::string& identifier) {
    auto asset = std::make_shared<platform::ZTAsset>(identifier, "Application", std::nullopt);
    asset->setIsDownload(true);
    asset->setPath("/var/mobile/Media/PublicStaging/" + identifier);
    platform.files.put(*asset->path(), "package");
    return asset;
  }

  /// The host has begun to send that app's package and not ended.
  void beginTransfer(const std::string& identifier) {
    platform.registry.add(FakeApp::placeholder(identifier));
    client.assetTransferUpdatedProgress(receivedAsset(identifier), 0.25);
  }

  void attemptInstall() { client._performAssetInstall(receivedAsset("com.attempted")); }

  /// What has been logged and called from now on.
  void startTrace() {
    platform.log.clear();
    platform.journal.clear();
    logCalls(platform);
  }
};

}  // namespace appsync::test
