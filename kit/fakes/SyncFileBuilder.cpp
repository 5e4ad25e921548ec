#include "kit/fakes/SyncFileBuilder.h"

#include "platform/Keys.h"
#include "plist/Access.h"

namespace appsync::test {

plist::Dictionary installEntry(std::string_view identifier, std::string_view version, std::string_view name) {
  plist::Dictionary made = entry(identifier, "install");
  made.set("version", version);
  made.set("name", name);
  return made;
}

plist::Dictionary removeEntry(std::string_view identifier) {
  return entry(identifier, "remove");
}

plist::Dictionary entry(std::string_view identifier, std::string_view operation) {
  return {{"identifier", identifier}, {"operation", operation}};
}

Bytes binaryForm(const plist::Value& value) {
  return plist::writeBinary(value).value();
}

Bytes xmlForm(const plist::Value& value) {
  return plist::writeXML(value).value();
}

void putPropertyList(FakeFileSystem& files, std::string_view path, const plist::Value& value) {
  files.put(path, xmlForm(value));
}

std::optional<plist::Value> propertyListAt(FakeFileSystem& files, std::string_view path) {
  const std::optional<Bytes> bytes = files.contents(path);
  if (!bytes) return std::nullopt;
  Result<plist::Value> value = plist::read(*bytes);
  if (!value) return std::nullopt;
  return std::move(value).value();
}

std::optional<std::string> operationWord(FakeFileSystem& files, std::string_view identifier) {
  const std::optional<plist::Value> list = propertyListAt(files, kTodoListPath);
  const plist::Array* entries = list ? list->array() : nullptr;
  if (entries == nullptr) return std::nullopt;
  for (const plist::Value& candidate : *entries) {
    if (stringIn(candidate.find("identifier")) == identifier) return ownedStringIn(candidate.find("operation"));
  }
  return std::nullopt;
}

void putAppFolder(FakeFileSystem& files, std::string_view folder, std::string_view identifier,
                  std::string_view displayName) {
  const std::string path(folder);
  putPropertyList(files, path + "/Info.plist",
                  plist::Dictionary{{platform::BundleIdentifierKey, identifier},
                                    {platform::kBundleVersionKey, "1.0"},
                                    {platform::kBundleDisplayNameKey, displayName},
                                    {platform::kBundleExecutableKey, displayName},
                                    {platform::kBundleIconFileKey, "Icon.png"}});
  files.put(path + "/Icon.png", "icon of " + std::string(identifier));
}

}  // namespace appsync::test
