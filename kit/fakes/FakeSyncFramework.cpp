#include "kit/fakes/FakeSyncFramework.h"

#include <algorithm>

namespace appsync::test {

bool ReclassifiedAsset::isRestore() const {
  const std::scoped_lock lock(mutex_);
  return answers_.at(std::min(asked_++, answers_.size() - 1));
}

void FakeSyncFramework::judgeErrorsBy(Judge isRecoverable) {
  const std::scoped_lock lock(mutex_);
  isRecoverable_ = std::move(isRecoverable);
}

std::vector<FakeSyncFramework::Download> FakeSyncFramework::downloads() const {
  const std::scoped_lock lock(mutex_);
  return downloads_;
}

bool FakeSyncFramework::ZTIsRecoverableError(const Error& error) {
  if (journal_.beforeCall("syncFramework.ZTIsRecoverableError")) return false;
  const std::scoped_lock lock(mutex_);
  return isRecoverable_ && isRecoverable_(error);
}

std::shared_ptr<platform::ZTAsset> FakeSyncFramework::downloadAssetWithIdentifier(
    std::string_view identifier, std::string_view dataclass, std::optional<std::string> prettyName) {
  static_cast<void>(journal_.beforeCall("syncFramework.downloadAssetWithIdentifier", identifier));
  {
    const std::scoped_lock lock(mutex_);
    downloads_.push_back({std::string(identifier), std::string(dataclass), prettyName});
  }
  auto asset =
      std::make_shared<platform::ZTAsset>(std::string(identifier), std::string(dataclass), std::move(prettyName));
  asset->setIsDownload(true);
  return asset;
}

}  // namespace appsync::test
