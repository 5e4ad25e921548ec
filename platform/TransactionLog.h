// The device's log of installs, removals and restores with their results.
#pragma once

#include <cstdint>
#include <memory>
#include <string_view>

namespace appsync::platform {

/// An opaque handle to the system log, created by `SystemLog`.
class SystemLogHandle {
 public:
  virtual ~SystemLogHandle() = default;
};

/// The system log. Thread-safe.
class SystemLog {
 public:
  virtual ~SystemLog() = default;

  /// Returns a handle that labels log lines with `subsystem` and `category`. Never null.
  [[nodiscard]] virtual std::shared_ptr<SystemLogHandle> createHandle(std::string_view subsystem,
                                                                      std::string_view category) = 0;
};

/// The subject of a step.
enum class TransactionStep : std::uint32_t {
  installApp = 1,
  restoreApp = 2,
  createCoordinator = 3,
  createPlaceholder = 4,
  copyIcon = 5,
  uninstallApp = 7,
};

enum class TransactionParty : std::uint32_t { syncClient = 1 };

enum class TransactionPhase : std::uint32_t { begin = 1, end = 2 };

/// Thread-safe; entries of one thread keep their order. No operation fails: an entry that cannot be written is lost.
/// Texts are needed only during the call.
class TransactionLog {
 public:
  virtual ~TransactionLog() = default;

  /// Must be called before the first entry. The log keeps the handle; a later call replaces it.
  virtual void initializeWithLog(std::shared_ptr<SystemLogHandle> log) = 0;

  /// Records the begin or end of a transaction's step.
  virtual void logStep(TransactionStep step, TransactionParty party, TransactionPhase phase, bool success,
                       std::string_view bundleIdentifier, std::string_view description) = 0;

  /// Records an event of a named scenario. The plug-in passes 0 as `step`.
  virtual void logScenario(std::string_view scenario, std::uint32_t step, bool success,
                           std::string_view bundleIdentifier, std::string_view description) = 0;
};

}  // namespace appsync::platform
