// Installs on fakes: one app whose package has been received.
#pragma once

#include <cerrno>
#include <chrono>
#include <cstdint>
#include <future>
#include <memory>
#include <optional>
#include <string>
#include <string_view>
#include <utility>
#include <vector>

#include <gtest/gtest.h>

#include "core/AppsClient.h"
#include "kit/fakes/FakePackages.h"
#include "kit/fakes/SyncFileBuilder.h"
#include "tests/support/ClientFixture.h"
#include "tests/support/NoMoreThreads.h"

namespace appsync::test {

using namespace std::chrono_literals;
using platform::ZTAsset;
using Strings = std::vector<std::string>;

inline constexpr std::string_view kRestoreStatePath = "/var/mobile/Library/ApplicationSync/RestoreState.plist";

inline const Error kNoThread{"POSIX", EAGAIN, "Resource temporarily unavailable", nullptr};

/// Answers a request for an assertion with nothing.
class ForgetfulHomeScreen final : public platform::HomeScreenService {
 public:
  Port blockableServerPort() override { return 0; }
  void setIconState(Port, ByteView) override {}
  std::optional<Bytes> getFlattenedIconState(Port, std::uint32_t) override { return std::nullopt; }
  std::unique_ptr<platform::TerminationAssertion> terminationAssertionCreate(
      std::string_view, std::uint32_t, platform::TerminationAssertionOutcome&) override {
    return nullptr;
  }
};

class InstallQueue : public ClientFixture {
 protected:
  void SetUp() override { platform.files.putFolder("/var/mobile/Library/ApplicationSync/HarvoStuff"); }

  static std::string pathOf(std::string_view identifier) {
    return "/var/mobile/Media/PublicStaging/" + std::string(identifier);
  }

  template <class Asset = ZTAsset, class... Arguments>
  std::shared_ptr<ZTAsset> receive(const std::string& identifier, Arguments... arguments) {
    platform.files.put(pathOf(identifier), packageOf(identifier, "2.0"));
    std::shared_ptr<ZTAsset> asset;
    if constexpr (sizeof...(Arguments) == 0) {
      asset = std::make_shared<ZTAsset>(identifier, "Application", identifier);
    } else {
      asset = std::make_shared<Asset>(identifier, arguments...);
    }
    asset->setIsDownload(true);
    asset->setPath(pathOf(identifier));
    return asset;
  }

  std::shared_ptr<ZTAsset> receiveRestored(const std::string& identifier) {
    auto asset = receive(identifier);
    asset->setIsRestore(true);
    return asset;
  }

  void writeTodoList(const Strings& identifiers) {
    plist::Array entries;
    for (const std::string& identifier : identifiers)
      entries.emplace_back(entry(identifier, "DOWNLOADED"));
    platform.files.put(kTodoListPath, binaryForm(std::move(entries)));
  }

  void writeRestoreState(std::string_view identifier) {
    putPropertyList(platform.files, kRestoreStatePath,
                    plist::Dictionary{{identifier, plist::Dictionary{{"1", plist::Dictionary{{"path", "/p"}}}}}});
  }

  [[nodiscard]] Strings transactionsOf(std::string_view identifier) const {
    Strings lines;
    for (const ScenarioEntry& each : platform.transactions.scenarios()) {
      if (each.bundleIdentifier != identifier) continue;
      EXPECT_EQ(each.step, 0U);
      lines.push_back(each.scenario + ": " + each.description + (each.success == Success::yes ? " y" : " n"));
    }
    return lines;
  }

  /// Runs one install to its end on the calling thread.
  AppsClient& performInstall(const std::shared_ptr<ZTAsset>& asset) {
    AppsClient& client = makeClient();
    platform.log.clear();
    client._performAssetInstall(asset);
    return client;
  }
};

}  // namespace appsync::test
