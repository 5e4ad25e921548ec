// Requests of other processes to a running sync, and its answers: one line each.
#pragma once

#include <cstddef>
#include <cstdint>
#include <optional>
#include <string>
#include <string_view>

namespace appsync::daemon {

/// Maximum length of a line in bytes, including its end.
inline constexpr std::size_t kLongestControlLine = 1024;

enum class ControlVerb : std::uint8_t {
  prioritize,  ///< "prioritize ID": send this app before the others
  cancel,      ///< "cancel ID": do not send this app
};

struct ControlRequest {
  ControlVerb verb = ControlVerb::prioritize;
  std::string identifier;
  bool operator==(const ControlRequest&) const = default;
};

enum class ControlResult : std::uint8_t {
  done,     ///< "done"
  refused,  ///< "refused WHY": a valid request that cannot be carried out
  error,    ///< "error WHY": an invalid request, or one by another user
};

struct ControlAnswer {
  ControlResult result = ControlResult::error;
  std::string why;  ///< a sentence for the user; empty if done
  bool operator==(const ControlAnswer&) const = default;
};

/// Returns the line to send, including its end. Longer texts are truncated.
[[nodiscard]] std::string lineOf(const ControlRequest& request);
[[nodiscard]] std::string lineOf(const ControlAnswer& answer);

/// Parses a line without its end, which is untrusted input. Returns nullopt if it is not a request for a valid bundle
/// identifier.
[[nodiscard]] std::optional<ControlRequest> readRequest(std::string_view line);
/// Parses a line without its end. Returns nullopt if it is not an answer.
[[nodiscard]] std::optional<ControlAnswer> readAnswer(std::string_view line);

}  // namespace appsync::daemon
