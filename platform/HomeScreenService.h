// The home screen: the order of icons, and assertions that keep an app from being terminated.
#pragma once

#include <cstdint>
#include <memory>
#include <optional>
#include <string_view>

#include "base/Bytes.h"

namespace appsync::platform {

/// The result of a request for a termination assertion. Any other number is an unknown failure.
enum class TerminationAssertionOutcome : std::uint8_t {
  granted = 0,
  denied = 1,    ///< temporary; a later request may succeed
  notFound = 2,  ///< the app is not on the home screen
};

/// Keeps an app from being launched or terminated while its package is replaced. The destructor releases the assertion.
class TerminationAssertion {
 public:
  virtual ~TerminationAssertion() = default;
};

/// Thread-safe.
class HomeScreenService {
 public:
  using Port = std::uint32_t;

  virtual ~HomeScreenService() = default;

  /// Returns the port for calls that may block. Valid for the lifetime of the process.
  [[nodiscard]] virtual Port blockableServerPort() = 0;

  /// Applies an icon layout: a property list in the host's format. `layout` is untrusted input and is read only during
  /// the call. An invalid layout is ignored.
  virtual void setIconState(Port port, ByteView layout) = 0;

  /// Returns the bundle identifiers of the icons in on-screen order, as a property list whose root is an array of
  /// strings. `format` is always 1. Returns nullopt if the order is not available.
  [[nodiscard]] virtual std::optional<Bytes> getFlattenedIconState(Port port, std::uint32_t format) = 0;

  /// Requests an assertion on an app. `reason` is always 0. Always sets `outcome`. Returns null if no assertion was
  /// created, which is possible even if `outcome` is `granted`.
  [[nodiscard]] virtual std::unique_ptr<TerminationAssertion> terminationAssertionCreate(
      std::string_view bundleIdentifier, std::uint32_t reason, TerminationAssertionOutcome& outcome) = 0;
};

}  // namespace appsync::platform
