#include "device/apps/AppTable.h"

#include "base/ReturnIfError.h"
#include "plist/Access.h"
#include "plist/PropertyList.h"

namespace appsync::device {

bool isDeviceBound(ByteView licence) {
  if (licence.empty()) return false;
  const auto document = plist::read(licence);
  return document && stringIn(document->find("DeviceIdentifier"));
}

namespace app_table {

namespace {

// One row for an app with both of its bundles; the columns are counted below.
constexpr std::string_view kSelect = R"(
select a.position, a.identifier, a.application_type, a.run_state, a.run_phase, a.run_total, a.run_completed,
       i.container, i.folder, i.name, i.version, i.install_type, i.bytes, i.installed_at,
       p.container, p.folder, p.name, p.version, p.install_type, p.bytes, p.installed_at, coalesce(i.licence, p.licence)
from apps a left join bundles i on i.app = a.position and i.role = 0
            left join bundles p on p.app = a.position and p.role = 1)";
constexpr int kProgressColumn = 3;
constexpr int kInstalledColumn = 7;
constexpr int kPlaceholderColumn = 14;
constexpr int kLicenceColumn = 21;

std::optional<StoredBundle> bundleAt(const Statement& query, int column) {
  if (query.isNull(column)) return std::nullopt;
  StoredBundle bundle;
  bundle.container = query.text(column);
  bundle.folder = query.text(column + 1);
  bundle.name = query.text(column + 2);
  bundle.version = query.optionalText(column + 3);
  bundle.installType = static_cast<platform::TSInstallType>(query.integer(column + 4));
  bundle.bytes = static_cast<std::uint64_t>(query.integer(column + 5));
  bundle.installedAt = query.real(column + 6);
  return bundle;
}

std::optional<ProgressValues> progressAt(const Statement& query, int column) {
  if (query.isNull(column)) return std::nullopt;
  return ProgressValues{static_cast<platform::TSInstallState>(query.integer(column)),
                        static_cast<platform::TSInstallPhase>(query.integer(column + 1)), query.integer(column + 2),
                        query.integer(column + 3)};
}

AppRow rowAt(const Statement& query) {
  AppRow row;
  row.position = query.integer(0);
  row.identifier = query.text(1);
  row.applicationType = query.text(2);
  row.progress = progressAt(query, kProgressColumn);
  row.installed = bundleAt(query, kInstalledColumn);
  row.placeholder = bundleAt(query, kPlaceholderColumn);
  row.hasDeviceBoundLicence = isDeviceBound(query.blob(kLicenceColumn));
  return row;
}

Result<std::vector<AppRow>> rowsOf(Statement query) {
  std::vector<AppRow> rows;
  while (query.next())
    rows.push_back(rowAt(query));
  if (!query.status()) return query.status().error();
  return rows;
}

template <class... Arguments>
Statement select(Database::Session& session, std::string_view condition, const Arguments&... arguments) {
  return session.prepare(std::string(kSelect).append(condition), arguments...);
}

}  // namespace

Result<std::optional<AppRow>> find(Database::Session& session, std::string_view identifier) {
  Statement query = select(session, " where a.identifier = ?", identifier);
  if (query.next()) return std::optional(rowAt(query));
  if (!query.status()) return query.status().error();
  return std::optional<AppRow>();
}

Result<std::vector<AppRow>> all(Database::Session& session) {
  return rowsOf(select(session, " order by a.position"));
}

Result<std::vector<AppRow>> withProgress(Database::Session& session) {
  return rowsOf(select(session, " where a.run_state is not null order by a.position"));
}

Result<std::vector<AppRow>> ofType(Database::Session& session, std::string_view applicationType) {
  return rowsOf(select(session, " where a.application_type = ? order by a.position", applicationType));
}

Status put(Database::Session& session, std::string_view identifier, std::string_view applicationType, BundleRole role,
           const StoredBundle& bundle, const std::optional<Bytes>& licence) {
  RETURN_IF_ERROR(session.run("insert into apps (identifier, application_type) values (?, ?) on conflict do nothing",
                              identifier, applicationType));
  return session.run(
      "insert or replace into bundles "
      "select position, ?, ?, ?, ?, ?, ?, ?, ?, coalesce(?, (select licence from bundles where app = position and licence "
      "is not null order by role desc limit 1)) from apps where identifier = ?",
      role, bundle.container, bundle.folder, bundle.name, bundle.version, bundle.installType,
      static_cast<std::int64_t>(bundle.bytes), bundle.installedAt, licence, identifier);
}

Status remove(Database::Session& session, const AppRow& app, BundleRole role) {
  if (!app.bundle(role)) return {};
  RETURN_IF_ERROR(session.run("delete from bundles where app = ? and role = ?", app.position, role));
  return session.run("delete from apps where position = ?1 and not exists (select 1 from bundles where app = ?1)",
                     app.position);
}

Result<std::optional<Bytes>> licenceOf(Database::Session& session, std::string_view identifier) {
  Statement query = session.prepare(
      "select licence from bundles where app = (select position from apps where identifier = ?) and licence is not null "
      "order by role",
      identifier);
  const bool found = query.next();
  if (!query.status()) return query.status().error();
  if (!found) return std::optional<Bytes>();
  const ByteView licence = query.blob(0);
  return std::optional(Bytes(licence.begin(), licence.end()));
}

Status storeProgress(Database::Session& session, std::string_view identifier,
                     const std::optional<ProgressValues>& progress) {
  constexpr std::string_view kUpdate =
      "update apps set run_state = ?, run_phase = ?, run_total = ?, run_completed = ? where identifier = ?";
  if (!progress) return session.run(kUpdate, nullptr, nullptr, nullptr, nullptr, identifier);
  return session.run(kUpdate, progress->state, progress->phase, progress->totalUnits, progress->completedUnits,
                     identifier);
}

}  // namespace app_table

}  // namespace appsync::device
