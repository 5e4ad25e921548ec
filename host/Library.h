// The host's library: a folder of packages.
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
  AppName app;
  std::uint64_t bytes = 0;  ///< of the package file
};

struct BrokenPackage {
  std::string fileName;
  std::string reason;
};

/// What a library holds: of each app the newest package, and what cannot be used.
struct Library {
  /// By identifier.
  std::map<std::string, LibraryPackage, std::less<>> packages;
  std::vector<BrokenPackage> broken;
};

/// Reads the folder at `path`. A package is a file that is named "….zip" or begins like a zip archive; subfolders,
/// hidden files and everything else are passed over. Of two versions of one app the newer counts, of two files of one
/// version the first by name. Only the folder itself can make it fail.
[[nodiscard]] Result<Library> readLibrary(const std::string& path);

}  // namespace appsync::host
