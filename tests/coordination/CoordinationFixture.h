// A client on a device that installs through coordinators, and an app that the host is about to send.
#pragma once

#include <memory>
#include <optional>
#include <string>
#include <string_view>
#include <utility>
#include <vector>

#include "kit/fakes/CallsInLog.h"
#include "kit/fakes/SyncFileBuilder.h"
#include "tests/support/ClientFixture.h"

namespace appsync::test {

inline constexpr std::string_view kPlaceholderFolder = "/tmp/com.corvel.zeph.Apps/com.a.app";
inline constexpr std::string_view kPlaceholderIcon = "/tmp/com.corvel.zeph.Apps/com.a.app/Icon.png";
inline constexpr std::string_view kStagedInfo = "/var/mobile/Library/ApplicationSync/HarvoStuff/com.a/Info.plist";
inline constexpr std::string_view kStagedStore =
    "/var/mobile/Library/ApplicationSync/HarvoStuff/com.a/HarvoMetadata.plist";
inline constexpr std::string_view kStagedIcon = "/icons/com.a.png";
inline constexpr std::string_view kReceivedPackage = "/var/mobile/Media/PublicStaging/com.a.zip";

inline platform::ClientIdentity clientOf(std::uint64_t number) {
  return static_cast<platform::ClientIdentity>(number);
}

class CoordinationFixture : public ClientFixture {
 protected:
  static constexpr platform::ClientIdentity kSync = platform::ClientIdentity::CXClientSync;
  static constexpr platform::ClientIdentity kStore = platform::ClientIdentity::CXClientBazaarly;

  void SetUp() override {
    platform.coordination.enable();
    platform.files.put(kStagedIcon, "a picture");
    putPropertyList(platform.files, kStagedInfo, info);
    putPropertyList(platform.files, kStagedStore, store);
    asset.setIcon(platform::FileLocation::file(kStagedIcon));
    asset.setInfoPlist(std::string(kStagedInfo));
    asset.setStorePlist(std::string(kStagedStore));
    asset.setVariantOptions({{"Version", "3.1"}, {"AssetParts", 1}});
  }

  /// A client whose messages and calls are noted in one order from now on.
  AppsClient& makeTracedClient() {
    AppsClient& client = makeClient();
    platform.log.clear();
    logCalls(platform);
    return client;
  }

  /// A coordinator of the plug-in's own, as a preparation leaves it.
  [[nodiscard]] static FakeCoordinator prepared(
      std::string identifier = "com.a", platform::CoordinatorKind kind = platform::CoordinatorKind::initiating) {
    FakePromise promise;
    promise.name = identifier + "-Asset";
    FakePlaceholder placeholder;
    placeholder.identifier = identifier;
    return FakeCoordinator::of(std::move(identifier), kind)
        .withOptions({})
        .withoutODRAssets()
        .withAppAsset(std::move(promise))
        .withPlaceholder(std::move(placeholder));
  }

  [[nodiscard]] static FakePromise completeAsset() {
    FakePromise promise;
    promise.name = "com.a-Asset";
    promise.isComplete = true;
    return promise;
  }

  [[nodiscard]] bool said(std::string_view message) const { return platform.log.contains(logged(message)); }
  [[nodiscard]] bool complained(std::string_view message) const { return platform.log.contains(loggedError(message)); }

  /// The one coordinator that has ended, and why.
  [[nodiscard]] std::optional<FakeCancellation> cancellation() const {
    const auto ended = platform.coordination.endedCoordinators();
    return ended.size() == 1 ? ended.front().cancellation : std::nullopt;
  }

  const plist::Dictionary info{{"BundleIdentifier", "com.a"}, {"TSApplicationLaunchProhibited", true}};
  const plist::Dictionary store{{"itemId", 42}};
  platform::ZTAsset asset{"com.a", "Application", "An App"};
  const Error error{"CN", 4, "no", nullptr};
};

}  // namespace appsync::test
