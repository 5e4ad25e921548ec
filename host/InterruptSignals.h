// Ctrl-C, and the other polite ways of asking a process to end.
#pragma once

namespace appsync::host {

/// While one exists, the first SIGINT, SIGTERM or SIGHUP only asks for an end; the second ends the process at once. One
/// at a time.
class Interruption {
 public:
  Interruption();
  ~Interruption();
  Interruption(const Interruption&) = delete;
  Interruption& operator=(const Interruption&) = delete;

  /// Any thread.
  [[nodiscard]] bool requested() const;
};

}  // namespace appsync::host
