// Handlers for the signals with which a user interrupts a process.
#pragma once

namespace appsync::host {

/// While an object exists, the first SIGINT, SIGTERM or SIGHUP only sets `requested`; the second ends the process.
/// Ignored signals stay ignored. At most one object may exist at a time.
class InterruptSignals {
 public:
  InterruptSignals();
  ~InterruptSignals();
  InterruptSignals(const InterruptSignals&) = delete;
  InterruptSignals& operator=(const InterruptSignals&) = delete;

  /// Returns whether a signal was received. Thread-safe.
  [[nodiscard]] bool requested() const;
};

}  // namespace appsync::host
