// Text from outside made safe and fit for a terminal.
#pragma once

#include <cstddef>
#include <string>
#include <string_view>

namespace appsync::cli {

/// Columns after which names, identifiers and reasons are cut in messages.
inline constexpr std::size_t kLongestText = 200;

/// `text` as UTF-8 that only prints: bytes that are no UTF-8, control characters and characters that change the
/// direction of writing appear as "\x1b" or "\u{202e}". What goes beyond `columns` is cut and ends with "...".
[[nodiscard]] std::string printable(std::string_view text, std::size_t columns = kLongestText);

/// Of which kind a document is.
enum class Notation { json, xml };

/// A document, in UTF-8, that says the same and leaves a terminal alone: control characters above ASCII's first ones,
/// and such as change the direction of writing, stand in it by their numbers. They may be in its strings only.
[[nodiscard]] std::string withReferences(std::string document, Notation notation);

/// The columns that printable text takes on a terminal.
[[nodiscard]] std::size_t displayWidth(std::string_view text);

/// Printable text cut or filled with blanks to exactly that many columns.
[[nodiscard]] std::string fitted(std::string_view text, std::size_t columns);

/// 1234567 as "1.2 MB".
[[nodiscard]] std::string byteCount(unsigned long long bytes);

/// Whether all of `text` is UTF-8.
[[nodiscard]] bool isUTF8(std::string_view text);

}  // namespace appsync::cli
