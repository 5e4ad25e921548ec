// Installed apps with store metadata.
#pragma once

#include <string>
#include <string_view>

#include "kit/fakes/CallsInLog.h"
#include "kit/fakes/SyncFileBuilder.h"
#include "tests/support/ClientFixture.h"

namespace appsync::test {

class StoreMetadataFixture : public ClientFixture {
 protected:
  [[nodiscard]] static std::string pathOf(std::string_view identifier) {
    return "/var/mobile/Containers/Bundle/" + std::string(identifier) + "/HarvoMetadata.plist";
  }

  /// Walks meet apps in the order of their identifiers.
  void addApp(std::string_view identifier) { platform.registry.add(FakeApp::installed(std::string(identifier))); }
  void addApp(std::string_view identifier, const plist::Value& metadata) {
    addApp(identifier);
    putPropertyList(platform.files, pathOf(identifier), metadata);
  }

  /// Store metadata with that dictionary about the account.
  [[nodiscard]] static plist::Dictionary metadataOf(const plist::Value& account) {
    return {{"com.corvel.HarvoStore.downloadInfo", plist::Dictionary{{"accountInfo", account}}}};
  }
  /// The same with the identifier in its older place, too.
  [[nodiscard]] static plist::Dictionary metadataOf(const plist::Value& older, const plist::Value& account) {
    plist::Dictionary metadata = metadataOf(account);
    metadata.set("corvelId", older);
    return metadata;
  }

  /// An account as the daemon is to hear of it.
  [[nodiscard]] static platform::ZTMutableAccountInfo account(std::string identifier,
                                                              std::optional<plist::Value> number = std::nullopt,
                                                              std::optional<std::string> alternative = std::nullopt) {
    platform::ZTMutableAccountInfo info;
    info.setCorvelID(std::move(identifier));
    info.setDSID(std::move(number));
    info.setAltDSID(std::move(alternative));
    return info;
  }

  [[nodiscard]] static LogLine unexpectedType(std::string_view label) {
    return {0, LogLevel::error, "unexpected type for " + std::string(label)};
  }
  [[nodiscard]] static LogLine unknownAccountOf(std::string_view identifier) {
    return logged("unknown CorvelID for " + std::string(identifier) + " (plist at " + pathOf(identifier) + ")");
  }
};

}  // namespace appsync::test
