// A client on a device that a host has restored, and the files that the host and the backup service left.
#pragma once

#include <cstdint>
#include <optional>
#include <string>
#include <string_view>
#include <utility>
#include <vector>

#include "kit/fakes/CallsInLog.h"
#include "kit/fakes/SyncFileBuilder.h"
#include "tests/support/ClientFixture.h"

namespace appsync::test {

inline constexpr std::string_view kRestoreInfo = "/var/mobile/Media/HarvoRestore/RestoreApplications.plist";
inline constexpr std::string_view kLogFolder = "/var/mobile/Library/Logs/MediaServices";
inline constexpr std::string_view kFiledRestoreInfo =
    "/var/mobile/Library/Logs/MediaServices/RestoreApplications.plist";
inline constexpr std::string_view kDemotedApps =
    "/var/mobile/Library/Preferences/com.corvel.Vaultory.DemotedApps.plist";
inline constexpr std::string_view kAppFolder = "/tmp/com.corvel.zeph.Apps/com.a.app";
inline constexpr std::string_view kAppIcon = "/tmp/com.corvel.zeph.Apps/com.a.app/Icon.png";
inline constexpr std::string_view kAppInfo = "/tmp/com.corvel.zeph.Apps/com.a.app/Info.plist";

inline constexpr std::int32_t kHostRestore = 2;

inline plist::Value dataOf(std::string_view text) {
  return plist::Value::data(bytesOf(text));
}

inline plist::Dictionary storeMetadata() {
  return {{"title", "An App"}, {"bundleVersion", "2.0"}, {"itemId", 42}};
}

/// What a backup held of an app.
inline plist::Dictionary restoredApp(const plist::Dictionary& metadata = storeMetadata()) {
  return {{"HarvoMetadata", plist::Value(xmlForm(metadata))},
          {"ApplicationSINF", dataOf("a licence")},
          {"PlaceholderIcon", dataOf("a picture")}};
}

inline plist::Dictionary without(plist::Dictionary dictionary, std::string_view key) {
  dictionary.erase(key);
  return dictionary;
}

inline plist::Dictionary with(plist::Dictionary dictionary, std::string_view key, plist::Value value) {
  dictionary.set(key, std::move(value));
  return dictionary;
}

class RestoreFixture : public ClientFixture {
 protected:
  static constexpr platform::ClientIdentity kSync = platform::ClientIdentity::CXClientSync;
  static constexpr platform::ClientIdentity kStore = platform::ClientIdentity::CXClientBazaarly;

  void SetUp() override {
    platform.files.putFolder(kLogFolder);
    platform.files.putFolder("/var/mobile/Media/HarvoRestore");
  }

  /// A client whose messages and calls are noted in one order from now on.
  AppsClient& makeTracedClient() {
    AppsClient& client = makeClient();
    platform.log.clear();
    logCalls(platform);
    return client;
  }

  void putRestoreInfo(const plist::Dictionary& apps) { platform.files.put(kRestoreInfo, binaryForm(apps)); }
  void putDemotedApps(const plist::Array& automatic, const plist::Array& intentional) {
    putPropertyList(platform.files, kDemotedApps,
                    plist::Dictionary{{"AutomaticDowngrades", automatic}, {"IntentionalDowngrades", intentional}});
  }

  [[nodiscard]] bool said(std::string_view message) const { return platform.log.contains(logged(message)); }
  [[nodiscard]] bool complained(std::string_view message) const { return platform.log.contains(loggedError(message)); }

  /// The host's file is where it is filed, and nowhere else.
  void expectFiledAway() {
    EXPECT_FALSE(platform.files.has(kRestoreInfo));
    EXPECT_TRUE(platform.files.has(kFiledRestoreInfo));
    EXPECT_EQ(platform.journal.count("fileSystem.moveItem "), 1U);
  }

  const Error error{"CN", 4, "no", nullptr};
};

/// The same where installs are coordinated.
class CoordinatedRestoreFixture : public RestoreFixture {
 protected:
  void SetUp() override {
    RestoreFixture::SetUp();
    platform.coordination.enable();
  }

  /// Restores com.a.
  bool prepare(DemotionStatus status = DemotionStatus::notDemoted) { return prepare(makeTracedClient(), status); }
  bool prepare(AppsClient& client, DemotionStatus status = DemotionStatus::notDemoted) {
    return client.prepareAppForRestoreUsingCoordination("com.a", metadata, sinf, icon, status);
  }

  /// The one coordinator that has ended, and why.
  [[nodiscard]] std::optional<FakeCancellation> cancellation() const {
    const auto ended = platform.coordination.endedCoordinators();
    return ended.size() == 1 ? ended.front().cancellation : std::nullopt;
  }

  const FakeCancellation givenUp{{"ZTError", 29, {}, nullptr}, kSync};
  Bytes metadata = xmlForm(storeMetadata());
  std::optional<ByteView> sinf = bytesOf("a licence");
  std::optional<ByteView> icon = bytesOf("a picture");
};

}  // namespace appsync::test
