#include "host/Library.h"

#include <algorithm>
#include <filesystem>

#include <fcntl.h>
#include <unistd.h>

#include "device/packages/Package.h"
#include "device/storage/FileDescriptor.h"
#include "host/Parallel.h"
#include "host/VersionOrder.h"

namespace appsync::host {
namespace {

namespace fs = std::filesystem;

constexpr std::string_view kSuffix = ".zip";

bool endsLikePackage(std::string_view name) {
  if (name.size() < kSuffix.size()) return false;
  return std::ranges::equal(name.substr(name.size() - kSuffix.size()), kSuffix, [](char left, char right) {
    return (left >= 'A' && left <= 'Z' ? left - 'A' + 'a' : left) == right;
  });
}

bool beginsLikePackage(const std::string& path) {
  const device::FileDescriptor file(::open(path.c_str(), O_RDONLY | O_CLOEXEC | O_NONBLOCK));
  char start[4] = {};
  return file.valid() && ::read(file.get(), start, sizeof start) == sizeof start &&
         std::string_view(start, sizeof start) == "PK\x03\x04";
}

/// Returns the sorted names of the files that are packages by name or by content.
Result<std::vector<std::string>> packageNames(const std::string& folder) {
  std::error_code failure;
  fs::directory_iterator entry(folder, failure);
  std::vector<std::string> names;
  for (; !failure && entry != fs::directory_iterator(); entry.increment(failure)) {
    std::string name = entry->path().filename().string();
    std::error_code unknown;
    if (name.starts_with('.') || entry->is_directory(unknown)) continue;
    const bool isPackage =
        endsLikePackage(name) || (entry->is_regular_file(unknown) && beginsLikePackage(entry->path().string()));
    if (isPackage) names.push_back(std::move(name));
  }
  if (failure) return Error::fromErrno(failure.value(), folder + " cannot be read as a library");
  std::ranges::sort(names);
  return names;
}

/// Reads a package, but keeps neither its images nor its property lists: a library may have many packages.
Result<LibraryPackage> summarise(const std::string& path) {
  const Result<device::PackageInfo> info = device::readPackageInfo(path);
  if (!info) return info.error();
  return LibraryPackage{path, {info->identifier, info->name, info->version.value_or("")}, info->packageBytes};
}

void addPackage(Library& library, const LibraryPackage& package) {
  const auto [place, isFirst] = library.packages.try_emplace(package.name.identifier, package);
  if (!isFirst && std::is_gt(compareVersions(package.name.version, place->second.name.version)))
    place->second = package;
}

/// Returns the error's text without the path at its start, which the report contains already.
std::string reasonOf(const Error& error, const std::string& path) {
  const std::string prefix = path + ": ";
  return error.text.starts_with(prefix) ? error.text.substr(prefix.size()) : error.text;
}

}  // namespace

Result<Library> readLibrary(const std::string& path) {
  const Result<std::vector<std::string>> names = packageNames(path);
  if (!names) return names.error();
  const auto pathOf = [&](std::size_t number) { return (fs::path(path) / (*names)[number]).string(); };
  std::vector<std::optional<Result<LibraryPackage>>> summaries(names->size());
  inParallel(names->size(), [&](std::size_t number) { summaries[number] = summarise(pathOf(number)); });
  Library library;
  for (std::size_t number = 0; number < names->size(); ++number) {
    if (const Result<LibraryPackage>& summary = *summaries[number]; summary.ok()) {
      addPackage(library, *summary);
    } else {
      library.broken.push_back({(*names)[number], reasonOf(summary.error(), pathOf(number))});
    }
  }
  return library;
}

}  // namespace appsync::host
