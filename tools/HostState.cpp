#include "tools/HostState.h"

#include <filesystem>

#include "base/PropertyList.h"
#include "device/HostFile.h"
#include "tools/HostFile.h"

namespace appsync::tools {
namespace {

constexpr std::string_view kDeclined = "Declined";
constexpr std::string_view kOffered = "Offered";

std::string pathIn(const std::string& devicePath) {
  return devicePath + "/host-state.plist";
}

IdentifierSet identifiersIn(const plist::Value* value) {
  IdentifierSet identifiers;
  if (value == nullptr || value->array() == nullptr) return identifiers;
  for (const plist::Value& element : *value->array()) {
    if (const auto text = element.string()) identifiers.emplace(*text);
  }
  return identifiers;
}

plist::Array arrayOf(const IdentifierSet& identifiers) {
  return {identifiers.begin(), identifiers.end()};
}

}  // namespace

void HostState::learnDeleted(const IdentifierSet& deleted) {
  for (const std::string& identifier : deleted) {
    if (!offered.contains(identifier)) declined.insert(identifier);
  }
}

HostState loadHostState(const std::string& devicePath) {
  const Result<Bytes> bytes = readHostFile(pathIn(devicePath));
  if (!bytes) return {};
  const Result<plist::Value> root = plist::read(*bytes);
  if (!root) return {};
  return {identifiersIn(root->find(kDeclined)), identifiersIn(root->find(kOffered))};
}

Status saveHostState(const std::string& devicePath, const HostState& state) {
  const plist::Dictionary root = {{kDeclined, arrayOf(state.declined)}, {kOffered, arrayOf(state.offered)}};
  const Result<Bytes> bytes = plist::writeXML(root);
  if (!bytes) return bytes.error();
  return device::replaceHostFile(pathIn(devicePath), *bytes);
}

Status removeHostState(const std::string& devicePath) {
  std::error_code failure;
  std::filesystem::remove(pathIn(devicePath), failure);
  if (failure) return Error::fromErrno(failure.value(), pathIn(devicePath) + " cannot be removed");
  return {};
}

}  // namespace appsync::tools
