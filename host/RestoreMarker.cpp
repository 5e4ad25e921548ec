#include "host/RestoreMarker.h"

#include <cerrno>

#include <fcntl.h>

#include "device/storage/HostFile.h"
#include "device/storage/SystemCalls.h"
#include "plist/Access.h"
#include "plist/PropertyList.h"

namespace appsync::host {
namespace {

constexpr std::string_view kBackup = "Backup";

std::string pathIn(const std::string& devicePath) {
  return devicePath + "/restore.plist";
}

}  // namespace

std::optional<std::string> restoreUnderWay(const std::string& devicePath) {
  const Result<Bytes> bytes = device::readHostFile(pathIn(devicePath));
  if (!bytes) return std::nullopt;
  const Result<plist::Value> root = plist::read(*bytes);
  return root ? ownedStringIn(root->find(kBackup)) : std::nullopt;
}

Status beginRestore(const std::string& devicePath, const std::string& backupIdentifier) {
  const Result<Bytes> bytes = plist::writeXML(plist::Dictionary{{kBackup, backupIdentifier}});
  return bytes ? device::replaceHostFile(pathIn(devicePath), *bytes) : Status(bytes.error());
}

Status endRestore(const std::string& devicePath) {
  const int number = device::sys::removeFile(AT_FDCWD, pathIn(devicePath).c_str());
  return number == 0 || number == ENOENT ? Status() : Status(Error::fromErrno(number, pathIn(devicePath)));
}

}  // namespace appsync::host
