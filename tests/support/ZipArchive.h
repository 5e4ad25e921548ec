// Zip archives made by hand, so that they can be wrong in every way.
#pragma once

#include <cstdint>
#include <string>
#include <vector>

#include <sys/stat.h>

namespace appsync::test {

struct ZipEntry {
  std::string name;
  std::string content;
  std::uint32_t mode = S_IFREG | 0644;
  bool isEncrypted = false;
  bool hasWrongChecksum = false;
};

/// An archive of these entries, stored as they are.
[[nodiscard]] std::string zipArchive(const std::vector<ZipEntry>& entries);

/// An "Info.plist".
[[nodiscard]] std::string infoPlist(std::string_view identifier, std::string_view version = "1.0");

/// A good package of one app, "Notes.app", with a few files, and `more`.
[[nodiscard]] std::string appPackage(std::string_view identifier, std::string_view version = "1.0",
                                     const std::vector<ZipEntry>& more = {});

}  // namespace appsync::test
