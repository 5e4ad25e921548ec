#include "Daemon.h"

#include <iostream>
#include <optional>

#include "kit/fakes/FakePackages.h"
#include "kit/fakes/SyncFileBuilder.h"

namespace port {

namespace {

using appsync::platform::ZTAsset;
using appsync::platform::ZTClient;
using appsync::test::FakePlatform;
namespace plist = appsync::plist;

/// Base of relative paths of received packages.
const std::string kPublicStaging = "/var/mobile/Media/PublicStaging";

/// Writes the host's files: the todo list, and each app's info dictionary and icon.
void stage(FakePlatform& device, const std::vector<WantedApp>& library) {
  plist::Array todoList;
  for (const WantedApp& app : library) {
    todoList.emplace_back(appsync::test::installEntry(app.identifier, app.version, app.name));
    appsync::test::putAppFolder(device.files, kPublicStaging + "/ApplicationSync/" + app.identifier, app.identifier,
                                app.name);
  }
  device.files.put(appsync::test::kStagedTodoListPath, appsync::test::binaryForm(std::move(todoList)));
}

/// Prints the apps that the user removed on the device, which the host must not send again.
void printRemovedApps(const plist::Dictionary& report) {
  const plist::Value* deleted = report.find("_Deleted");
  if (deleted == nullptr || deleted->array() == nullptr) return;
  for (const plist::Value& app : *deleted->array()) {
    const plist::Value* identifier = app.find(appsync::platform::BundleIdentifierKey);
    if (identifier != nullptr) std::cout << "removed on the device: " << identifier->string().value_or("") << "\n";
  }
}

/// Transfers one package. This example creates it; a daemon receives it from the host and reports progress meanwhile.
void transfer(FakePlatform& device, ZTClient& client, const std::shared_ptr<ZTAsset>& asset) {
  const plist::Value* version = asset->version();
  const std::string wanted(version == nullptr ? "" : version->string().value_or(""));
  std::cout << "sending: " << asset->identifier() << " " << wanted << "\n";
  client.assetTransferUpdatedProgress(asset, 0.5);
  device.files.put(kPublicStaging + "/" + asset->identifier() + ".zip",
                   appsync::test::packageOf(asset->identifier(), wanted));
  client.assetTransferUpdatedProgress(asset, 1.0);
  asset->setPath(asset->identifier() + ".zip");
  asset->setCompletedAssetParts(appsync::platform::kZTAssetPartApplication);
  client.assetTransferSucceeded(asset, true, std::nullopt);
}

/// Ends a sync that the plug-in refused. Returns false.
bool endRefused(ZTClient& client, const std::optional<appsync::Error>& error) {
  std::cout << "the plug-in refused the sync: " << (error ? error->text : "no reason given") << "\n";
  client.assetTransferEndedWithSuccess(false);
  client.syncEndedWithSuccess(false);
  return false;
}

}  // namespace

bool sync(FakePlatform& device, ZTClient& client, const std::vector<WantedApp>& library) {
  stage(device, library);
  std::optional<appsync::Error> error;
  if (!client.prepareForSyncWithHostAnchor(client.currentSyncAnchor(), {}, &error)) return endRefused(client, error);
  printRemovedApps(client.installedAssets());
  if (!client.reconcileSync({}, client.currentSyncAnchor(), {}, &error)) return endRefused(client, error);
  for (const auto& asset : client.outstandingAssetTransfers())
    transfer(device, client, asset);
  client.assetTransferEndedWithSuccess(true);  // Blocks until every install has ended.
  client.syncEndedWithSuccess(true);
  return true;
}

}  // namespace port
