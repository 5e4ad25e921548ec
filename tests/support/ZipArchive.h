// Zip archives with arbitrary defects.
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

/// Returns an archive of these entries without compression.
[[nodiscard]] std::string zipArchive(const std::vector<ZipEntry>& entries);

/// Returns an "Info.plist".
[[nodiscard]] std::string infoPlist(std::string_view identifier, std::string_view version = "1.0");

/// Returns a valid package of one app, "Notes.app", with a few files and `more`.
[[nodiscard]] std::string appPackage(std::string_view identifier, std::string_view version = "1.0",
                                     const std::vector<ZipEntry>& more = {});

}  // namespace appsync::test
