#include "host/HostState.h"

#include <cerrno>
#include <filesystem>
#include <utility>

#include "device/storage/HostFile.h"
#include "plist/PropertyList.h"

namespace appsync::host {
namespace {

constexpr std::string_view kDeclined = "Declined";
constexpr std::string_view kOffered = "Offered";

std::string pathIn(const std::string& devicePath) {
  return devicePath + "/host-state.plist";
}

/// Returns an error that says what is wrong with the file (`text`) and what to do.
Error unusable(long code, const std::string& text) {
  return {std::string(domains::kPOSIX), code,
          text + "; replace it with a good copy, or remove it: apps that were deleted are then sent again", nullptr};
}

Error damaged(const std::string& path, const std::string& why) {
  return unusable(EINVAL, path + " is damaged (" + why + ")");
}

/// Returns false if `value` is not an array of strings. Null is an empty array.
bool readIdentifiers(const plist::Value* value, IdentifierSet& identifiers) {
  if (value == nullptr) return true;
  if (value->array() == nullptr) return false;
  for (const plist::Value& element : *value->array()) {
    const auto text = element.string();
    if (!text) return false;
    identifiers.emplace(*text);
  }
  return true;
}

plist::Array arrayOf(const IdentifierSet& identifiers) {
  return {identifiers.begin(), identifiers.end()};
}

}  // namespace

void HostState::addDeleted(const IdentifierSet& deleted) {
  for (const std::string& identifier : deleted) {
    if (!offered.contains(identifier)) declined.insert(identifier);
  }
}

Result<HostState> loadHostState(const std::string& devicePath) {
  const std::string path = pathIn(devicePath);
  const Result<Bytes> bytes = device::readHostFile(path);
  if (!bytes && bytes.error().code == ENOENT) return HostState{};
  if (!bytes) return unusable(bytes.error().code, bytes.error().text);
  const Result<plist::Value> root = plist::read(*bytes);
  if (!root) return damaged(path, root.error().text);
  HostState state;
  const bool isWhole = root->dictionary() != nullptr && readIdentifiers(root->find(kDeclined), state.declined) &&
                       readIdentifiers(root->find(kOffered), state.offered);
  return isWhole ? Result<HostState>(std::move(state))
                 : damaged(path, "it is not a dictionary of arrays of identifiers");
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

}  // namespace appsync::host
