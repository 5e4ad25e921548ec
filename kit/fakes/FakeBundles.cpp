#include "kit/fakes/FakeBundles.h"

#include <utility>

namespace appsync::test {

namespace {

class FakeBundle final : public platform::Bundle {
 public:
  FakeBundle(platform::FileLocation location, plist::Value info)
      : location_(std::move(location)), info_(std::move(info)) {}

  [[nodiscard]] const platform::FileLocation& location() const override { return location_; }
  [[nodiscard]] const plist::Value* infoDictionaryValue(std::string_view key) const override { return info_.find(key); }

 private:
  platform::FileLocation location_;
  plist::Value info_;
};

}  // namespace

void FakeBundles::setMainBundleIdentifier(std::optional<std::string> identifier) {
  const std::scoped_lock lock(mutex_);
  mainIdentifier_ = std::move(identifier);
}

void FakeBundles::failOpening(std::string path) {
  const std::scoped_lock lock(mutex_);
  unreadable_.insert(std::move(path));
}

std::unique_ptr<platform::Bundle> FakeBundles::openBundle(const platform::FileLocation& location) {
  if (journal_.beforeCall("bundles.openBundle", location.path)) return nullptr;
  {
    const std::scoped_lock lock(mutex_);
    if (unreadable_.contains(location.path)) return nullptr;
  }
  if (!files_.hasFolder(location.path)) return nullptr;
  plist::Value info;
  if (const std::optional<Bytes> bytes = files_.contents(location.path + "/Info.plist")) {
    Result<plist::Value> read = plist::read(*bytes);
    if (read) info = std::move(read).value();
  }
  return std::make_unique<FakeBundle>(location, std::move(info));
}

std::optional<std::string> FakeBundles::mainBundleIdentifier() {
  if (journal_.beforeCall("bundles.mainBundleIdentifier")) return std::nullopt;
  const std::scoped_lock lock(mutex_);
  return mainIdentifier_;
}

}  // namespace appsync::test
