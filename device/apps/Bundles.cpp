#include "device/apps/Bundles.h"

#include <utility>

#include "device/packages/BundleInfo.h"
#include "platform/SyncFiles.h"
#include "plist/PropertyList.h"

namespace appsync::device {

namespace {

class FolderBundle final : public platform::Bundle {
 public:
  FolderBundle(platform::FileLocation location, plist::Value info)
      : location_(std::move(location)), info_(std::move(info)) {}

  [[nodiscard]] const platform::FileLocation& location() const override { return location_; }
  [[nodiscard]] const plist::Value* infoDictionaryValue(std::string_view key) const override { return info_.find(key); }

 private:
  const platform::FileLocation location_;
  const plist::Value info_;
};

/// Returns a null value if the file is missing or unusable.
plist::Value readInfo(platform::FileSystem& fileSystem, const std::string& path) {
  const auto attributes = fileSystem.attributesOfItem(path);
  if (!attributes || attributes->size > kMaximumMetadataBytes) return {};
  const auto bytes = fileSystem.readFile(path);
  if (!bytes) return {};
  auto info = plist::read(*bytes);
  return info ? std::move(info).value() : plist::Value();
}

}  // namespace

std::unique_ptr<platform::Bundle> Bundles::openBundle(const platform::FileLocation& location) {
  const auto attributes = fileSystem_.attributesOfItem(location.path);
  if (!attributes || !attributes->isDirectory) return nullptr;
  return std::make_unique<FolderBundle>(location,
                                        readInfo(fileSystem_, location.path + "/" + std::string(kInfoPlistName)));
}

}  // namespace appsync::device
