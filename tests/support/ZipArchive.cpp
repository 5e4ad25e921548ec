#include "tests/support/ZipArchive.h"

#include "platform/Keys.h"
#include "plist/PropertyList.h"

namespace appsync::test {

namespace {

class LittleEndian {
 public:
  LittleEndian& two(std::uint32_t value) {
    for (int shift = 0; shift < 16; shift += 8)
      bytes_ += static_cast<char>((value >> shift) & 0xFF);
    return *this;
  }
  LittleEndian& four(std::uint32_t value) { return two(value & 0xFFFF).two(value >> 16); }
  LittleEndian& text(std::string_view value) {
    bytes_ += value;
    return *this;
  }
  [[nodiscard]] const std::string& bytes() const { return bytes_; }

 private:
  std::string bytes_;
};

std::uint32_t checksum(std::string_view content) {
  std::uint32_t sum = 0xFFFFFFFF;
  for (const char letter : content) {
    sum ^= static_cast<unsigned char>(letter);
    for (int bit = 0; bit < 8; ++bit)
      sum = (sum >> 1) ^ ((sum & 1) != 0 ? 0xEDB88320 : 0);
  }
  return ~sum;
}

/// What the local header and the central directory say alike.
void describe(LittleEndian& out, const ZipEntry& entry) {
  constexpr std::uint32_t kUTF8 = 1U << 11;
  const auto size = static_cast<std::uint32_t>(entry.content.size());
  out.two(20).two(kUTF8 | (entry.isEncrypted ? 1U : 0U)).two(0).four(0x21);
  out.four(checksum(entry.content) ^ (entry.hasWrongChecksum ? 1U : 0U)).four(size).four(size);
  out.two(static_cast<std::uint32_t>(entry.name.size())).two(0);
}

}  // namespace

std::string zipArchive(const std::vector<ZipEntry>& entries) {
  LittleEndian archive;
  LittleEndian directory;
  for (const ZipEntry& entry : entries) {
    const auto offset = static_cast<std::uint32_t>(archive.bytes().size());
    describe(archive.text("PK\3\4"), entry);
    archive.text(entry.name).text(entry.content);
    describe(directory.text("PK\1\2").two(3U << 8 | 20), entry);
    directory.two(0).two(0).two(0).four(entry.mode << 16).four(offset).text(entry.name);
  }
  const auto start = static_cast<std::uint32_t>(archive.bytes().size());
  const auto count = static_cast<std::uint32_t>(entries.size());
  archive.text(directory.bytes()).text("PK\5\6").two(0).two(0).two(count).two(count);
  archive.four(static_cast<std::uint32_t>(directory.bytes().size())).four(start).two(0);
  return archive.bytes();
}

std::string infoPlist(std::string_view identifier, std::string_view version) {
  const plist::Value info = plist::Dictionary{{platform::BundleIdentifierKey, identifier},
                                              {platform::kBundleVersionKey, version},
                                              {platform::kBundleDisplayNameKey, "Notes"},
                                              {platform::kBundleIconFileKey, "Icon.png"}};
  const Result<Bytes> document = plist::writeXML(info);
  return document ? std::string(textOf(*document)) : std::string();
}

std::string appPackage(std::string_view identifier, std::string_view version, const std::vector<ZipEntry>& more) {
  std::vector<ZipEntry> entries{{"Notes.app/", "", S_IFDIR | 0755},
                                {"Notes.app/Info.plist", infoPlist(identifier, version)},
                                {"Notes.app/Notes", "#!/bin/sh\n", S_IFREG | 0755},
                                {"Notes.app/Icon.png", "a picture"},
                                {"Notes.app/data/deep/file", std::string(5000, 'x')}};
  entries.insert(entries.end(), more.begin(), more.end());
  return zipArchive(entries);
}

}  // namespace appsync::test
