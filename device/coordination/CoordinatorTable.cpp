#include "device/coordination/CoordinatorTable.h"

#include <map>
#include <utility>

#include "base/ReturnIfError.h"
#include "plist/PropertyList.h"

namespace appsync::device::coordinator_table {

using platform::ClientIdentity;

namespace {

using Coordinators = std::vector<std::shared_ptr<CoordinatorState>>;
using ByNumber = std::map<std::int64_t, std::shared_ptr<CoordinatorState>>;

ClientIdentity clientAt(const Statement& row, int column) {
  return static_cast<ClientIdentity>(row.integer(column));
}

std::optional<Bytes> blobAt(const Statement& row, int column) {
  if (row.isNull(column)) return std::nullopt;
  const ByteView bytes = row.blob(column);
  return Bytes(bytes.begin(), bytes.end());
}

plist::Dictionary dictionaryOf(ByteView document) {
  const Result<plist::Value> root = plist::readBinary(document);
  const plist::Dictionary* dictionary = root ? root->dictionary() : nullptr;
  return dictionary == nullptr ? plist::Dictionary() : *dictionary;
}

Status readCoordinators(Database::Session& session, Coordinators& coordinators, ByNumber& byNumber) {
  Statement row = session.prepare(
      "select number, identifier, kind, creator, responsible_client, has_odr_assets, install_type, install_target, "
      "store_metadata from coordinators order by number");
  while (row.next()) {
    const auto state = std::make_shared<CoordinatorState>();
    state->number = row.integer(0);
    state->identifier = row.text(1);
    state->kind = static_cast<platform::CoordinatorKind>(row.integer(2));
    state->creator = clientAt(row, 3);
    if (!row.isNull(4)) state->responsibleClient = clientAt(row, 4);
    state->hasInitialODRAssets = row.integer(5) != 0;
    if (!row.isNull(6)) {
      state->options = CoordinatorOptions{static_cast<platform::TSInstallType>(row.integer(6)),
                                          static_cast<std::uint64_t>(row.integer(7)), blobAt(row, 8)};
    }
    coordinators.push_back(state);
    byNumber.emplace(state->number, state);
  }
  return row.status();
}

Status readPlaceholders(Database::Session& session, const ByNumber& coordinators) {
  Statement row = session.prepare(
      "select coordinator, name, client, install_type, info, version, is_launch_prohibited, store_metadata, licence, "
      "is_configured from coordinator_placeholders");
  while (row.next()) {
    const auto owner = coordinators.find(row.integer(0));
    if (owner == coordinators.end()) continue;
    const auto& coordinator = owner->second;
    const auto state = std::make_shared<PlaceholderState>();
    state->bundleName = row.text(1);
    state->identifier = coordinator->identifier;
    state->client = clientAt(row, 2);
    state->installType = static_cast<platform::TSInstallType>(row.integer(3));
    state->infoDocument = *blobAt(row, 4);
    state->attributes = platform::PlaceholderAttributes::initWithInfoPlistDictionary(dictionaryOf(state->infoDocument));
    state->attributes.setBundleVersion(row.optionalText(5));
    state->attributes.setLaunchProhibited(row.integer(6) != 0);
    state->storeMetadata = blobAt(row, 7);
    state->licence = blobAt(row, 8);
    state->isConfigured = row.integer(9) != 0;
    state->isAttached = true;
    state->coordinator = coordinator;
    coordinator->placeholder = state;
  }
  return row.status();
}

Status readPromises(Database::Session& session, const ByNumber& coordinators) {
  Statement row = session.prepare(
      "select coordinator, role, name, client, disk_space, path, is_folder, fraction, is_complete, is_cancelled "
      "from coordinator_promises");
  while (row.next()) {
    const auto owner = coordinators.find(row.integer(0));
    if (owner == coordinators.end()) continue;
    const auto& coordinator = owner->second;
    const auto state = std::make_shared<PromiseState>();
    state->role = static_cast<PromiseRole>(row.integer(1));
    state->name = row.text(2);
    state->client = clientAt(row, 3);
    state->diskSpaceNeeded = static_cast<std::uint64_t>(row.integer(4));
    if (!row.isNull(5)) state->transferPath = platform::FileLocation{std::string(row.text(5)), row.integer(6) != 0};
    state->fraction = row.real(7);
    state->isComplete = row.integer(8) != 0;
    if (row.integer(9) != 0) state->stage = PromiseStage::withdrawn;
    state->coordinator = coordinator;
    if (state->role == PromiseRole::appAsset) coordinator->appAsset = state;
    if (state->role == PromiseRole::userData) coordinator->userData = state;
    if (state->role == PromiseRole::icon && coordinator->placeholder) coordinator->placeholder->icon = state;
  }
  return row.status();
}

bool hasTables(Database::Session& session) {
  return session.prepare("select 1 from sqlite_schema where name = 'coordinators'").next();
}

}  // namespace

Result<Coordinators> all(Database::Session& session) {
  Coordinators coordinators;
  ByNumber byNumber;
  if (!hasTables(session)) return coordinators;
  RETURN_IF_ERROR(readCoordinators(session, coordinators, byNumber));
  RETURN_IF_ERROR(readPlaceholders(session, byNumber));
  RETURN_IF_ERROR(readPromises(session, byNumber));
  return coordinators;
}

Status insert(Database::Session& session, CoordinatorState& state) {
  RETURN_IF_ERROR(session.run("insert or replace into coordinators (identifier, kind, creator) values (?, ?, ?)",
                              state.identifier, state.kind, state.creator));
  Statement number = session.prepare("select last_insert_rowid()");
  if (number.next()) state.number = number.integer(0);
  return number.status();
}

Status storeChoices(Database::Session& session, std::int64_t coordinator, const CoordinatorChoices& choices) {
  std::optional<platform::TSInstallType> type;
  std::optional<std::uint64_t> target;
  std::optional<ByteView> metadata;
  if (choices.options) {
    type = choices.options->installType;
    target = choices.options->installTargetType;
    if (choices.options->storeMetadata) metadata = *choices.options->storeMetadata;
  }
  return session.run(
      "update coordinators set responsible_client = ?, has_odr_assets = ?, install_type = ?, install_target = ?, "
      "store_metadata = ? where number = ?",
      choices.responsibleClient, choices.hasInitialODRAssets, type, target, metadata, coordinator);
}

Status storePromise(Database::Session& session, std::int64_t coordinator, PromiseRole role,
                    const PromiseState& promise) {
  std::optional<std::string_view> path;
  std::optional<bool> isFolder;
  if (promise.transferPath) {
    path = promise.transferPath->path;
    isFolder = promise.transferPath->isDirectory;
  }
  return session.run("insert or replace into coordinator_promises values (?, ?, ?, ?, ?, ?, ?, ?, ?, ?)", coordinator,
                     role, promise.name, promise.client, promise.diskSpaceNeeded, path, isFolder, promise.fraction,
                     promise.isComplete, promise.stage == PromiseStage::withdrawn);
}

Status storePlaceholder(Database::Session& session, std::int64_t coordinator, const PlaceholderState& placeholder) {
  Status stored =
      session.run("insert or replace into coordinator_placeholders values (?, ?, ?, ?, ?, ?, ?, ?, ?, ?)", coordinator,
                  placeholder.bundleName, placeholder.client, placeholder.installType, placeholder.infoDocument,
                  placeholder.attributes.bundleVersion(), placeholder.attributes.launchProhibited(),
                  placeholder.storeMetadata, placeholder.licence, placeholder.isConfigured);
  if (!stored || !placeholder.icon) return stored;
  return storePromise(session, coordinator, PromiseRole::icon, *placeholder.icon);
}

Status remove(Database::Session& session, const CoordinatorState& state) {
  if (const auto package = state.ownPackage()) {
    RETURN_IF_ERROR(session.run("insert or ignore into spent_packages values (?)", *package));
  }
  return session.run("delete from coordinators where number = ?", state.number);
}

Result<std::vector<std::string>> spentPackages(Database::Session& session) {
  std::vector<std::string> paths;
  Statement row = session.prepare("select path from spent_packages");
  while (row.next())
    paths.emplace_back(row.text(0));
  if (!row.status()) return row.status().error();
  return paths;
}

Status forgetSpentPackage(Database::Session& session, std::string_view path) {
  return session.run("delete from spent_packages where path = ?", path);
}

}  // namespace appsync::device::coordinator_table
