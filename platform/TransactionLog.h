// The device's record of what was installed, removed and restored, and how that went.
#pragma once

#include <cstdint>
#include <memory>
#include <string_view>

namespace appsync::platform {

/// A handle of the system's log, made by `SystemLog`; opaque to its holders.
class SystemLogHandle {
 public:
  virtual ~SystemLogHandle() = default;
};

/// The system's log. Threads: any.
class SystemLog {
 public:
  virtual ~SystemLog() = default;

  /// A handle whose lines are marked with this subsystem and category. Never null.
  [[nodiscard]] virtual std::shared_ptr<SystemLogHandle> createHandle(std::string_view subsystem,
                                                                      std::string_view category) = 0;
};

/// What a step is about.
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

/// Threads: any; entries of one thread keep their order. Nothing fails towards the caller: an entry that cannot be kept
/// is lost.
class TransactionLog {
 public:
  virtual ~TransactionLog() = default;

  /// Must come before the first entry. The log keeps the handle; a later call replaces it.
  virtual void initializeWithLog(std::shared_ptr<SystemLogHandle> log) = 0;

  /// Records one step of a transaction.
  virtual void logStep(TransactionStep step, TransactionParty party, TransactionPhase phase, bool success,
                       std::string_view bundleIdentifier, std::string_view description) = 0;

  /// Records one event of a named scenario. `step` is 0 for the plug-in's own.
  virtual void logScenario(std::string_view scenario, std::uint32_t step, bool success,
                           std::string_view bundleIdentifier, std::string_view description) = 0;
};

}  // namespace appsync::platform
