// The daemon's sync framework.
#pragma once

#include <cstddef>
#include <functional>
#include <memory>
#include <mutex>
#include <optional>
#include <string>
#include <string_view>
#include <utility>
#include <vector>

#include "kit/fakes/CallJournal.h"
#include "kit/fakes/RecordingLog.h"
#include "platform/SyncFramework.h"

namespace appsync::test {

/// An asset whose restore flag changes: returns the given values in order, then the last one.
class ReclassifiedAsset final : public platform::ZTAsset {
 public:
  ReclassifiedAsset(std::string identifier, std::vector<bool> answers)
      : ZTAsset(std::move(identifier), "Application", std::nullopt), answers_(std::move(answers)) {}

  [[nodiscard]] bool isRestore() const override;

 private:
  mutable std::mutex mutex_;
  mutable std::size_t asked_ = 0;
  std::vector<bool> answers_;
};

/// By default no error is recoverable. Journal lines: "syncFramework.ZTIsRecoverableError",
/// "syncFramework.downloadAssetWithIdentifier com.a". Look-ups of log categories are not journaled.
class FakeSyncFramework final : public platform::SyncFramework {
 public:
  struct Download {
    std::string identifier;
    std::string dataclass;
    std::optional<std::string> prettyName;
    bool operator==(const Download&) const = default;
  };

  FakeSyncFramework(CallJournal& journal, RecordingLog& log) : journal_(journal), log_(log) {}

  using Judge = std::function<bool(const Error& error)>;
  void judgeErrorsBy(Judge isRecoverable);

  /// The assets created so far.
  [[nodiscard]] std::vector<Download> downloads() const;

  [[nodiscard]] LogCategory& ZTGetLogCategory(int number) override { return log_.category(number); }
  [[nodiscard]] bool ZTIsRecoverableError(const Error& error) override;
  [[nodiscard]] std::shared_ptr<platform::ZTAsset> downloadAssetWithIdentifier(
      std::string_view identifier, std::string_view dataclass, std::optional<std::string> prettyName) override;

 private:
  CallJournal& journal_;
  RecordingLog& log_;
  mutable std::mutex mutex_;
  Judge isRecoverable_;
  std::vector<Download> downloads_;
};

}  // namespace appsync::test
