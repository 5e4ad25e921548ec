#include "device/services/SyncFramework.h"

#include <algorithm>
#include <cerrno>
#include <chrono>

namespace appsync::device {

namespace {

struct RecoverableError {
  std::string_view domain;
  long code;
};

constexpr RecoverableError kRecoverableErrors[] = {
    // Interrupted or deferred.
    {domains::kPOSIX, EAGAIN},
    {domains::kPOSIX, EINTR},
    {domains::kPOSIX, EBUSY},
    {domains::kPOSIX, ETIMEDOUT},
    {domains::kPOSIX, ECANCELED},
    // Exhausted resources.
    {domains::kPOSIX, ENOSPC},
    {domains::kPOSIX, EDQUOT},
    {domains::kPOSIX, ENOMEM},
    {domains::kPOSIX, EMFILE},
    {domains::kPOSIX, ENFILE},
    // Lost connections.
    {domains::kPOSIX, EPIPE},
    {domains::kPOSIX, ECONNRESET},
    {domains::kPOSIX, ECONNABORTED},
    {domains::kPOSIX, ECONNREFUSED},
    {domains::kPOSIX, ENOTCONN},
    {domains::kPOSIX, ENETDOWN},
    {domains::kPOSIX, ENETUNREACH},
    {domains::kPOSIX, EHOSTUNREACH},
    // Interrupted transfers.
    {platform::kZTErrorDomain, static_cast<long>(TransferFailure::interrupted)},
    {platform::kZTErrorDomain, static_cast<long>(TransferFailure::hostLost)},
};

}  // namespace

SyncFramework::SyncFramework() {
  for (int number = 0; number < kCategories; ++number) {
    categories_[static_cast<std::size_t>(number)].bind(number, sink_);
  }
  categories_.back().bind(-1, sink_);
}

void SyncFramework::logTo(std::unique_ptr<LogSink> sink) {
  const std::lock_guard lock(mutex_);
  sink_ = sink.get();
  sinks_.push_back(std::move(sink));
}

LogCategory& SyncFramework::ZTGetLogCategory(int number) {
  const bool isKnown = number >= 0 && number < kCategories;
  return categories_[static_cast<std::size_t>(isKnown ? number : kCategories)];
}

bool SyncFramework::ZTIsRecoverableError(const Error& error) {
  return std::ranges::any_of(kRecoverableErrors, [&](const RecoverableError& recoverable) {
    return recoverable.code == error.code && recoverable.domain == error.domain;
  });
}

std::shared_ptr<platform::ZTAsset> SyncFramework::downloadAssetWithIdentifier(std::string_view identifier,
                                                                              std::string_view dataclass,
                                                                              std::optional<std::string> prettyName) {
  auto asset =
      std::make_shared<platform::ZTAsset>(std::string(identifier), std::string(dataclass), std::move(prettyName));
  asset->setIsDownload(true);
  return asset;
}

bool SyncFramework::Category::isEnabled(LogLevel) const noexcept {
  return sink_->load(std::memory_order_acquire) != nullptr;
}

void SyncFramework::Category::write(LogLevel level, std::string_view message) {
  if (LogSink* sink = sink_->load(std::memory_order_acquire)) {
    sink->write(std::chrono::system_clock::now(), number_, level, message);
  }
}

}  // namespace appsync::device
