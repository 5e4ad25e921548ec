// Messages from printf-like formats that are checked at compile time.
#pragma once

#include <cstddef>
#include <string>
#include <string_view>
#include <type_traits>

#include "base/Describe.h"
#include "base/MessageFormat.h"

namespace appsync {

/// Appends `format`, its conversions replaced by `args`, to `out`. The text does not depend on the locale. Whatever the
/// arguments hold, it is one line and commands no terminal: control characters, line separators, bidirectional controls
/// and bytes that are not UTF-8 are escaped, as `\n` or `\x1b`.
template <class... Args>
void appendMessage(std::string& out, MessageFormat<std::type_identity_t<Args>...> format, const Args&... args) {
  const std::size_t start = out.size();
  const char* text = format.text();
  (detail::appendArgument(out, detail::appendUpToConversion(out, text), args), ...);
  detail::appendUpToConversion(out, text);
  detail::escapeFrom(out, start);
}

/// Returns the message as a new string; see appendMessage.
template <class... Args>
[[nodiscard]] std::string formatMessage(MessageFormat<std::type_identity_t<Args>...> format, const Args&... args) {
  constexpr std::size_t kTypicalArgument = 24;
  std::string out;
  out.reserve(std::string_view(format.text()).size() + kTypicalArgument * sizeof...(Args));
  appendMessage<Args...>(out, format, args...);
  return out;
}

}  // namespace appsync
