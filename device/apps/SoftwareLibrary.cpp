#include "device/apps/SoftwareLibrary.h"

#include "device/storage/Database.h"

namespace appsync::device {

namespace {

std::vector<Receipt> receiptsDue(platform::AppRegistry& registry) {
  std::vector<Receipt> due;
  registry.enumerateBundlesOfType(platform::BundleKind::user, [&](const platform::BundleRecord& bundle, bool&) {
    const platform::AppRecord* app = bundle.asAppRecord();
    if (app != nullptr && app->isInstalled()) due.push_back({app->applicationIdentifier(), app->bundleVersion()});
  });
  return due;
}

}  // namespace

void SoftwareLibrary::refreshReceipts(std::function<void(const std::optional<Error>& error)> completion) {
  completion(replaceReceipts().failure());
}

Status SoftwareLibrary::replaceReceipts() {
  const std::vector<Receipt> due = receiptsDue(registry_);
  Database::Transaction transaction(database_);
  transaction.run("delete from receipts").ignore();
  for (const Receipt& receipt : due) {
    transaction.run("insert or replace into receipts values (?, ?)", receipt.bundleIdentifier, receipt.version)
        .ignore();
  }
  return transaction.commit();
}

Result<std::vector<Receipt>> SoftwareLibrary::receipts() {
  std::vector<Receipt> found;
  Database::Session session(database_);
  Statement rows = session.prepare("select identifier, version from receipts order by identifier");
  while (rows.next())
    found.push_back({std::string(rows.text(0)), rows.optionalText(1)});
  if (!rows.status()) return rows.status().error();
  return found;
}

}  // namespace appsync::device
