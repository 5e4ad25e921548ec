// Untrusted text, escaped and cut for terminals.
#pragma once

#include <cstddef>
#include <string>
#include <string_view>

namespace appsync::cli {

/// Maximum columns of names, identifiers and reasons in messages.
inline constexpr std::size_t kLongestText = 200;

/// Returns `text` as UTF-8 that is safe for a terminal: invalid bytes, control characters and characters that change
/// the writing direction are escaped as "\x1b" or "\u{202e}". Text longer than `columns` is cut and ends with "...".
[[nodiscard]] std::string printable(std::string_view text, std::size_t columns = kLongestText);

/// The format of a document.
enum class Notation { json, xml };

/// Returns an equivalent UTF-8 document that is safe for a terminal: control characters from U+007F on and characters
/// that change the writing direction become numeric references. They may occur only in the document's strings.
[[nodiscard]] std::string withReferences(std::string document, Notation notation);

/// Returns the number of columns of printable text on a terminal.
[[nodiscard]] std::size_t displayWidth(std::string_view text);

/// Returns printable text, cut or padded with spaces to exactly `columns`.
[[nodiscard]] std::string fitted(std::string_view text, std::size_t columns);

/// Formats a size: 1234567 as "1.2 MB".
[[nodiscard]] std::string byteCount(unsigned long long bytes);

/// Returns whether `text` is valid UTF-8.
[[nodiscard]] bool isUTF8(std::string_view text);

}  // namespace appsync::cli
