#include "daemon/control/Protocol.h"

#include <algorithm>
#include <array>

#include "device/packages/BundleIdentifier.h"

namespace appsync::daemon {
namespace {

// Indexed by the enumerators' values.
constexpr std::array<std::string_view, 2> kVerbs = {"prioritize", "cancel"};
constexpr std::array<std::string_view, 3> kResults = {"done", "refused", "error"};

template <std::size_t kCount>
std::optional<std::size_t> indexOf(std::string_view word, const std::array<std::string_view, kCount>& words) {
  const auto found = std::ranges::find(words, word);
  if (found == words.end()) return std::nullopt;
  return static_cast<std::size_t>(found - words.begin());
}

/// Removes the first word and one space from `line` and returns the word.
std::string_view takeWord(std::string_view& line) {
  const std::size_t end = std::min(line.find(' '), line.size());
  const std::string_view word = line.substr(0, end);
  line.remove_prefix(std::min(end + 1, line.size()));
  return word;
}

std::string finished(std::string line) {
  std::ranges::replace(line, '\n', ' ');
  line.resize(std::min(line.size(), kLongestControlLine - 1));
  return line + "\n";
}

}  // namespace

std::string lineOf(const ControlRequest& request) {
  return finished(std::string(kVerbs[static_cast<std::size_t>(request.verb)]) + " " + request.identifier);
}

std::string lineOf(const ControlAnswer& answer) {
  const std::string word(kResults[static_cast<std::size_t>(answer.result)]);
  return finished(answer.why.empty() ? word : word + " " + answer.why);
}

std::optional<ControlRequest> readRequest(std::string_view line) {
  const auto verb = indexOf(takeWord(line), kVerbs);
  if (!verb || !device::isBundleIdentifier(line)) return std::nullopt;
  return ControlRequest{static_cast<ControlVerb>(*verb), std::string(line)};
}

std::optional<ControlAnswer> readAnswer(std::string_view line) {
  const auto result = indexOf(takeWord(line), kResults);
  if (!result) return std::nullopt;
  return ControlAnswer{static_cast<ControlResult>(*result), std::string(line)};
}

}  // namespace appsync::daemon
