// The device's sync framework.
#pragma once

#include <array>
#include <atomic>
#include <memory>
#include <mutex>
#include <optional>
#include <string>
#include <string_view>
#include <vector>

#include "base/Error.h"
#include "device/services/LogSink.h"
#include "platform/SyncFramework.h"

namespace appsync::device {

/// Codes of `platform::kZTErrorDomain` for transfers that this device's daemon could not complete. All except
/// `cancelled` are recoverable.
enum class TransferFailure : long {
  interrupted = 100,  ///< the sync ended before the package was complete
  hostLost = 101,     ///< the connection was lost, or the host could not read its package
  cancelled = 102,    ///< the user cancelled the app on the device
};

/// Thread-safe.
class SyncFramework final : public platform::SyncFramework {
 public:
  SyncFramework();

  /// Sends the messages of all categories and levels to `sink` instead of the previous sink. Every category is disabled
  /// until the first call. The framework keeps all sinks until it is destroyed.
  void logTo(std::unique_ptr<LogSink> sink);

  /// Numbers outside 0 to 31 share one category, which logs as -1.
  [[nodiscard]] LogCategory& ZTGetLogCategory(int number) override;

  /// Returns true for temporary failures: POSIX errors of interrupted calls, lost connections, time-outs and exhausted
  /// resources, and interrupted transfers (`TransferFailure`). docs/files.md has the list.
  [[nodiscard]] bool ZTIsRecoverableError(const Error& error) override;

  /// Creates an asset that is a download.
  [[nodiscard]] std::shared_ptr<platform::ZTAsset> downloadAssetWithIdentifier(
      std::string_view identifier, std::string_view dataclass, std::optional<std::string> prettyName) override;

 private:
  class Category final : public LogCategory {
   public:
    void bind(int number, const std::atomic<LogSink*>& sink) {
      number_ = number;
      sink_ = &sink;
    }
    [[nodiscard]] bool isEnabled(LogLevel level) const noexcept override;
    void write(LogLevel level, std::string_view message) override;

   private:
    int number_ = 0;
    const std::atomic<LogSink*>* sink_ = nullptr;
  };

  static constexpr int kCategories = 32;

  std::atomic<LogSink*> sink_ = nullptr;
  std::mutex mutex_;
  /// Every sink of `logTo`: another thread may still write to a replaced one.
  std::vector<std::unique_ptr<LogSink>> sinks_;
  std::array<Category, kCategories + 1> categories_;
};

}  // namespace appsync::device
