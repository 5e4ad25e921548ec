// The home screen: where icons stand, and which apps may not be ended just now.
#pragma once

#include <cstdint>
#include <memory>
#include <optional>
#include <string_view>

#include "base/Bytes.h"

namespace appsync::platform {

/// What came of asking for a termination assertion. Services answer other numbers too: unknown failures.
enum class TerminationAssertionOutcome : std::uint8_t {
  granted = 0,
  denied = 1,    ///< not now; asking again later may succeed
  notFound = 2,  ///< the home screen does not know the app
};

/// Holds an app against being launched and ended while its package is replaced, for as long as the object lives.
class TerminationAssertion {
 public:
  virtual ~TerminationAssertion() = default;
};

/// Threads: every operation may be called from any thread at any time.
class HomeScreenService {
 public:
  using Port = std::uint32_t;

  virtual ~HomeScreenService() = default;

  /// The port for calls that may block. Valid for the life of the process.
  [[nodiscard]] virtual Port blockableServerPort() = 0;

  /// Takes over an icon layout, a property list as the host wrote it. The bytes are needed only during the call; a
  /// layout that the home screen cannot use is ignored.
  virtual void setIconState(Port port, ByteView layout) = 0;

  /// The icons' bundle identifiers in on-screen order, as a property list whose root is an array of strings. `format` 1
  /// is the only one. Nothing when the home screen has no answer. The caller owns the bytes.
  [[nodiscard]] virtual std::optional<Bytes> getFlattenedIconState(Port port, std::uint32_t format) = 0;

  /// Asks for an assertion on an app. `reason` is always 0. `outcome` is always set; the result is null unless an
  /// assertion was made, and may be null even when the outcome lets the caller go ahead.
  [[nodiscard]] virtual std::unique_ptr<TerminationAssertion> terminationAssertionCreate(
      std::string_view bundleIdentifier, std::uint32_t reason, TerminationAssertionOutcome& outcome) = 0;
};

}  // namespace appsync::platform
