#include "daemon/DataMigrator.h"

#include <cerrno>

#include "base/ReturnIfError.h"
#include "daemon/ClientModule.h"
#include "device/apps/BackupManager.h"
#include "host/Ticker.h"

namespace appsync::daemon {
namespace {

std::shared_ptr<const platform::AppRecord> recordOf(device::Device& device, const host::BackedUpApp& app) {
  return device.platform().defaultRegistry().recordForIdentifier(app.name.identifier, platform::PlaceholderLookup::on);
}

}  // namespace

Result<DataMigrator> DataMigrator::make(device::Device& device) {
  device.services().bundles().actAs(std::string(device::Bundles::kDataMigratorIdentifier));
  auto client = makeClient(device.platform());
  if (!client) return client.error();
  return DataMigrator(device, std::move(client).value());
}

void DataMigrator::createPlaceholders(const host::Backup& backup, const std::vector<const host::BackedUpApp*>& apps,
                                      host::SyncProgress& progress) {
  reconcileRestore(apps, progress);
  for (const host::BackedUpApp* app : apps) {
    const Status finished = finishApp(*app);
    progress.finish(finished ? host::AppOutcome{host::AppEvent::restored, app->name, {}}
                             : host::AppOutcome{host::AppEvent::failed, app->name, finished.error().text});
  }
  applyIconOrder(backup.iconOrder);
}

void DataMigrator::reconcileRestore(const std::vector<const host::BackedUpApp*>& apps, host::SyncProgress& progress) {
  const host::Ticker ticker(host::kTimeBetweenLooks, [&] {
    for (const host::BackedUpApp* app : apps) {
      if (recordOf(device_, *app) != nullptr) progress.installing(app->name.identifier, 1);
    }
  });
  client_->reconcileRestoreOfType(platform::kRestoreTypeHost, nullptr);
}

Status DataMigrator::finishApp(const host::BackedUpApp& app) {
  const auto record = recordOf(device_, app);
  if (record == nullptr) {
    return Error{std::string(domains::kPOSIX), ENOENT,
                 "the device created no placeholder for it; restore to a new device with --log FILE and read the log",
                 nullptr};
  }
  return app.isDemoted() ? demote(app, *record) : Status();
}

/// Without coordination the sync client creates all placeholders alike. A demoted app gets no package that would set
/// its own name in place of the store's, or upon which its data would be given back, so both are done here.
Status DataMigrator::demote(const host::BackedUpApp& app, const platform::AppRecord& record) {
  const std::string& identifier = app.name.identifier;
  if (record.isPlaceholder() && !record.isInstalled()) {
    device::AppRegistry& registry = device_.services().defaultRegistry();
    if (record.installType() != app.demotion) RETURN_IF_ERROR(registry.setPlaceholderType(identifier, app.demotion));
    if (!app.name.name.empty()) RETURN_IF_ERROR(registry.renamePlaceholder(identifier, app.name.name));
  }
  device::BackupManager manager(device_.services().database(), device_.services().fileSystem());
  return manager.restoreDataNow(identifier);
}

void DataMigrator::applyIconOrder(const std::vector<std::string>& order) {
  const Result<Bytes> layout = plist::writeBinary(plist::Array(order.begin(), order.end()));
  auto& homeScreen = device_.services().homeScreen();
  if (layout && !order.empty()) homeScreen.setIconState(homeScreen.blockableServerPort(), *layout);
}

}  // namespace appsync::daemon
