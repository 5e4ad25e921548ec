#include "tests/integration/DeviceSync.h"

#include <algorithm>
#include <chrono>
#include <filesystem>

#include "kit/fakes/SyncFileBuilder.h"
#include "kit/fakes/Threads.h"
#include "platform/SyncFiles.h"

namespace appsync::test {

namespace {

using platform::ZTAsset;

std::string packageOf(const HostApp& app) {
  std::string package = appPackage(app.identifier, app.version);
  if (app.package == HostApp::Package::damaged) package.resize(package.size() / 2);
  return package;
}

}  // namespace

std::vector<std::string> DeviceSync::run(const std::vector<HostApp>& apps, const std::vector<std::string>& toRemove,
                                         std::size_t threads) {
  stage(apps, toRemove);
  const auto client = AppsClient::create(device_.services());
  client->prepareForSyncWithHostAnchor(client->currentSyncAnchor(), {}, nullptr);
  static_cast<void>(client->installedAssets());
  std::optional<Error> error;
  EXPECT_TRUE(client->reconcileSync({}, "anchor", {}, &error)) << (error ? error->text : "");
  const platform::Assets assets = client->outstandingAssetTransfers();
  runOnThreads(threads, [&](std::size_t index) {
    for (std::size_t next = index; next < assets.size(); next += threads) {
      const auto app = std::ranges::find(apps, assets[next]->identifier(), &HostApp::identifier);
      if (app != apps.end()) transfer(*client, assets[next], *app);
    }
  });
  beforeTransfersEnd();
  const bool isWhole =
      std::ranges::none_of(apps, [](const HostApp& app) { return app.package == HostApp::Package::stalled; });
  client->assetTransferEndedWithSuccess(isWhole);
  EXPECT_TRUE(device_.services().installCoordination().waitUntilIdle(std::chrono::minutes(2)));
  client->syncEndedWithSuccess(isWhole);
  EXPECT_EQ(client.use_count(), 1) << "the client outlives the sync";

  std::vector<std::string> asked;
  for (const auto& asset : assets)
    asked.push_back(asset->identifier());
  return asked;
}

void DeviceSync::stage(const std::vector<HostApp>& apps, const std::vector<std::string>& toRemove) {
  plist::Array todoList;
  for (const HostApp& app : apps)
    todoList.emplace_back(installEntry(app.identifier, app.version, "Name of " + app.identifier));
  for (const std::string& identifier : toRemove)
    todoList.emplace_back(removeEntry(identifier));
  std::filesystem::create_directories(device_.host(kStagingFolder));
  writeHostFile(device_.host(kStagedTodoListPath), textOf(binaryForm(std::move(todoList))));
}

void DeviceSync::transfer(AppsClient& client, const std::shared_ptr<ZTAsset>& asset, const HostApp& app) {
  for (const double fraction : {0.25, 0.75}) {
    client.assetTransferUpdatedProgress(asset, fraction);
  }
  if (app.package == HostApp::Package::stalled) return;
  if (app.package == HostApp::Package::lost) {
    client.assetTransferSucceeded(asset, false, Error{"ZTError", 7, "the host has lost the package", nullptr});
    return;
  }
  device_.stage(app.identifier + ".zip", packageOf(app));
  client.assetTransferUpdatedProgress(asset, 1.0);
  asset->setPath(app.identifier + ".zip");
  asset->setCompletedAssetParts(platform::kZTAssetPartApplication);
  client.assetTransferSucceeded(asset, true, std::nullopt);
}

std::map<std::string, std::string> DeviceSync::todoOperations() {
  std::map<std::string, std::string> words;
  const std::string document = readHostFile(device_.host(kTodoListPath));
  const Result<plist::Value> list = plist::read(bytesOf(document));
  if (!list || list->array() == nullptr) return words;
  for (const plist::Value& entry : *list->array()) {
    const plist::Value* identifier = entry.find("identifier");
    const plist::Value* word = entry.find("operation");
    if (identifier == nullptr || word == nullptr) continue;
    words.emplace(identifier->string().value_or(""), word->string().value_or(""));
  }
  return words;
}

}  // namespace appsync::test
