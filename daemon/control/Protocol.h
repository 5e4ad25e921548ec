// What a running sync is asked by other processes, and what it answers: one line each way.
#pragma once

#include <cstddef>
#include <cstdint>
#include <optional>
#include <string>
#include <string_view>

namespace appsync::daemon {

/// The longest line of either side, its end included.
inline constexpr std::size_t kLongestControlLine = 1024;

enum class ControlVerb : std::uint8_t {
  prioritize,  ///< "prioritize ID": this app before the others
  cancel,      ///< "cancel ID": this app not at all
};

struct ControlRequest {
  ControlVerb verb = ControlVerb::prioritize;
  std::string identifier;
  bool operator==(const ControlRequest&) const = default;
};

enum class ControlResult : std::uint8_t {
  done,     ///< "done"
  refused,  ///< "refused WHY": asked well, but not to be had
  error,    ///< "error WHY": not understood, or not this caller's to ask
};

struct ControlAnswer {
  ControlResult result = ControlResult::error;
  std::string why;  ///< a sentence for people; empty when it was done
  bool operator==(const ControlAnswer&) const = default;
};

/// Lines as they are sent, with their end. What would not fit into one is cut.
[[nodiscard]] std::string lineOf(const ControlRequest& request);
[[nodiscard]] std::string lineOf(const ControlAnswer& answer);

/// A line without its end, from anyone; none when it is no request. An identifier is one that an app can have.
[[nodiscard]] std::optional<ControlRequest> readRequest(std::string_view line);
/// The same for an answer.
[[nodiscard]] std::optional<ControlAnswer> readAnswer(std::string_view line);

}  // namespace appsync::daemon
