// What the sync framework of this device offers to its clients.
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

/// Codes of `platform::kZTErrorDomain` that this device's daemon gives a transfer that came to nothing. All but the
/// last are recoverable.
enum class TransferFailure : long {
  interrupted = 100,  ///< the sync was ended before the package was whole
  hostLost = 101,     ///< the host went away, or could not read its package
  cancelled = 102,    ///< somebody on the device does not want the app
};

/// Threads: any.
class SyncFramework final : public platform::SyncFramework {
 public:
  SyncFramework();

  /// From now on messages of all categories and levels go to `sink`, and to no earlier one. Until the first call every
  /// category is disabled. The framework keeps the sink until it is destroyed.
  void logTo(std::unique_ptr<LogSink> sink);

  /// Numbers that are not from 0 to 31 share one category, which logs as -1.
  [[nodiscard]] LogCategory& ZTGetLogCategory(int number) override;

  /// What passes by itself or once somebody made room: POSIX errors of interrupted calls, lost connections, time-outs
  /// and exhausted resources, and transfers that were cut off (`TransferFailure`). See docs/files.md for the list.
  [[nodiscard]] bool ZTIsRecoverableError(const Error& error) override;

  /// A download: its package comes to the device.
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
  /// Every sink ever given: a writer may still be in one that was replaced.
  std::vector<std::unique_ptr<LogSink>> sinks_;
  std::array<Category, kCategories + 1> categories_;
};

}  // namespace appsync::device
