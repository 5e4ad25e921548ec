#include "common/PropertyListFile.h"

#include <utility>

#include "plist/DictionaryStream.h"

namespace appsync {

Result<plist::Dictionary> dictionaryOf(Result<plist::Value> read) {
  if (!read) return std::move(read).error();
  plist::Dictionary* dictionary = read->dictionary();
  if (dictionary != nullptr) return std::move(*dictionary);
  return plist::rootIsNoDictionary();
}

plist::Value readDictionary(platform::FileSystem& files, const std::optional<std::string>& path) {
  if (!path) return {};
  auto bytes = files.readFile(*path);
  if (!bytes) return {};
  auto dictionary = dictionaryOf(plist::read(std::move(bytes).value()));
  return dictionary ? std::move(dictionary).value() : plist::Value();
}

Status writePropertyList(platform::FileSystem& files, std::string_view path, const plist::Value& root) {
  const auto bytes = plist::writeXML(root);
  return bytes ? files.writeFileAtomically(path, *bytes) : Status(bytes.error());
}

}  // namespace appsync
