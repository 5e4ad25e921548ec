#include "RemovedApps.h"

#include <cerrno>
#include <fstream>

#include "FileReplacement.h"

namespace port {

std::optional<appsync::plist::Dictionary> RemovedApps::lookupUninstalled() {
  const std::scoped_lock lock(mutex_);
  const std::optional<Identifiers> identifiers = read();
  if (!identifiers) return std::nullopt;  // The list is not available, which differs from an empty list.
  appsync::plist::Dictionary answer;
  for (const std::string& identifier : *identifiers)
    answer.set(identifier, true);  // The plug-in reads only the keys.
  return answer;
}

int RemovedApps::clearUninstalled(const std::vector<std::string>& bundleIdentifiers) {
  const std::scoped_lock lock(mutex_);
  std::optional<Identifiers> identifiers = read();
  if (!identifiers) return EIO;
  for (const std::string& identifier : bundleIdentifiers)
    identifiers->erase(identifier);
  return replace(*identifiers);
}

int RemovedApps::add(std::string_view bundleIdentifier) {
  const std::scoped_lock lock(mutex_);
  std::optional<Identifiers> identifiers = read();
  if (!identifiers) return EIO;
  identifiers->emplace(bundleIdentifier);
  return replace(*identifiers);
}

int RemovedApps::remove(std::string_view bundleIdentifier) {
  return clearUninstalled({std::string(bundleIdentifier)});
}

std::optional<RemovedApps::Identifiers> RemovedApps::read() const {
  errno = 0;
  std::ifstream file(path_);
  if (!file) return errno == ENOENT ? std::optional(Identifiers()) : std::nullopt;
  Identifiers identifiers;
  for (std::string line; std::getline(file, line);) {
    if (!line.empty()) identifiers.insert(line);
  }
  return file.bad() ? std::nullopt : std::optional(identifiers);
}

int RemovedApps::replace(const Identifiers& identifiers) const {
  std::string text;
  for (const std::string& identifier : identifiers)
    text += identifier + "\n";
  return replaceFile(path_, text);
}

}  // namespace port
