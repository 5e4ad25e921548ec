// Reads the input as a package. Whatever its reader lets through has plain names inside one app, each once, and stays
// within the limits.
#include <cstddef>
#include <cstdint>
#include <cstdlib>
#include <set>
#include <span>
#include <string>

#include <fcntl.h>
#include <sys/mman.h>
#include <unistd.h>

#include "device/packages/Package.h"
#include "platform/SyncFiles.h"

namespace {

using namespace appsync;

constexpr device::PackageLimits kLimits{.entries = 1000, .unpackedBytes = 1 << 22, .ratio = 100, .freeBytes = 1 << 16};

void require(bool condition) {
  if (!condition) std::abort();
}

bool isPlain(const std::string& path) {
  const std::string framed = '/' + path + '/';
  return path.find('\\') == path.npos && framed.find("//") == framed.npos && framed.find("/./") == framed.npos &&
         framed.find("/../") == framed.npos;
}

void checkEntries(device::FileDescriptor file) {
  auto package = device::PackageReader::open(std::move(file), kLimits);
  if (!package) return require(!package.error().text.empty());
  std::set<std::string> names;
  device::PackageReader::Entry entry;
  for (;;) {
    const Result<bool> more = package->next(entry);
    if (!more) return require(!more.error().text.empty());
    if (!*more) return;
    require(isPlain(entry.path) && names.insert(entry.path).second && names.size() <= kLimits.entries);
    const bool isExtra = entry.path == kStoreMetadataName || entry.path == kArtworkName;
    require(isExtra || (entry.path + '/').starts_with(package->appFolder() + '/'));
    if (entry.kind == device::PackageReader::Kind::folder) continue;
    const Result<Bytes> bytes = package->readAll(kLimits.unpackedBytes);
    if (!bytes) return require(!bytes.error().text.empty());
    require(package->unpackedBytes() <= kLimits.unpackedBytes);
  }
}

}  // namespace

extern "C" int LLVMFuzzerTestOneInput(const std::uint8_t* data, std::size_t size) {
  device::FileDescriptor file(memfd_create("package", MFD_CLOEXEC));
  require(file.valid() && write(file.get(), data, size) == static_cast<ssize_t>(size));
  const std::string path = "/proc/self/fd/" + std::to_string(file.get());
  const auto info = device::readPackageInfo(path, kLimits);
  require(info ? !info->identifier.empty() : !info.error().text.empty());
  require(lseek(file.get(), 0, SEEK_SET) == 0);
  checkEntries(std::move(file));
  return 0;
}
