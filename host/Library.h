// The host's library: a directory of packages.
#pragma once

#include <cstdint>
#include <map>
#include <string>
#include <vector>

#include "base/Error.h"
#include "host/AppOutcome.h"

namespace appsync::host {

struct LibraryPackage {
  std::string path;
  AppName name;
  std::uint64_t bytes = 0;  ///< of the package file
};

struct BrokenPackage {
  std::string fileName;
  std::string reason;
};

/// The newest package of each app, and the files that cannot be used.
struct Library {
  /// By identifier.
  std::map<std::string, LibraryPackage, std::less<>> packages;
  std::vector<BrokenPackage> broken;
};

/// Reads the directory at `path`. A package is a file that is named "….zip" or begins like a zip archive;
/// subdirectories, hidden files and all other files are ignored. Of two versions of one app the newer is used, of two
/// files of one version the first by name. Fails only if the directory cannot be read.
[[nodiscard]] Result<Library> readLibrary(const std::string& path);

}  // namespace appsync::host
