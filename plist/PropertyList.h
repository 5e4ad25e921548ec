// Property lists: reading and writing their three file formats.
#pragma once

#include <optional>
#include <string>
#include <string_view>

#include "base/Bytes.h"
#include "base/Error.h"
#include "plist/Value.h"

namespace appsync::domains {
inline constexpr std::string_view kPropertyList = "PropertyList";
}

namespace appsync::plist {

/// The codes of errors in the domain kPropertyList.
enum class Failure : long {
  truncated = 1,     ///< the document ends too early
  malformed,         ///< it violates the syntax of its format
  outOfRange,        ///< a number, date, offset or length is outside the allowed range
  badText,           ///< bytes that are not text in their encoding, or text that the format cannot represent
  tooDeep,           ///< containers nested deeper than kMaximumDepth
  tooLarge,          ///< a document or value whose shared content expands to too many values or too much text
  unsupported,       ///< a format or element that is known but refused
  notRepresentable,  ///< a value that the format cannot represent; null in any format
};

/// Readers and writers refuse documents with deeper nesting: their recursion needs stack for each level.
inline constexpr int kMaximumDepth = 512;

/// In bytes. Values that share content can expand to far more than memory holds: a document that would exceed this size
/// with shared content repeated, as in XML, is refused.
inline constexpr std::size_t kMaximumExpandedSize = std::size_t{1} << 30;

// Reading. Parsers of untrusted input: time and memory are proportional to the size of the document, and errors name
// the byte offset. Of equal keys in one dictionary the last one wins. Repeated references to text or data in a binary
// document share its storage. Every document that the writers return can be read.

/// Detects the format by the content.
[[nodiscard]] Result<Value> read(ByteView document);
/// Detects the format by the content. Long data in the binary format is not copied: it keeps the whole document alive.
[[nodiscard]] Result<Value> read(Bytes&& document);
/// The binary format, "bplist00". Refuses sets.
[[nodiscard]] Result<Value> readBinary(ByteView document);
/// The XML format, in UTF-8 or UTF-16. Refuses entity declarations; skips other document type declarations.
[[nodiscard]] Result<Value> readXML(ByteView document);
/// The ASCII format: `{ key = value; }`, `( a, b )`, `<0f a0>`, "quoted" and bare words, comments; also the
/// `key = value;` lines of a strings file. Every scalar in it is a string or data.
[[nodiscard]] Result<Value> readText(ByteView document);
/// Reads the binary or the XML format. For files that are never in the ASCII format, which accepts almost any text.
[[nodiscard]] Result<Value> readBinaryOrXML(ByteView document);

/// Returns the error for a document whose root should be a dictionary and is not.
[[nodiscard]] Error rootIsNoDictionary();

// Writing. Deterministic: equal values give equal bytes. A null anywhere in `root` is an error.

/// Writes the binary format, "bplist00". Equal scalars are stored once. Fails if text, counted at each occurrence,
/// takes far more than kMaximumExpandedSize, because readers refuse that.
[[nodiscard]] Result<Bytes> writeBinary(const Value& root);
/// Writes the XML format in UTF-8, without a document type declaration. Fails on a uid and on text with characters that
/// XML forbids. Dates lose their fractions of a second.
[[nodiscard]] Result<Bytes> writeXML(const Value& root);

/// Estimates the size in bytes of a format that repeats shared content. Stops counting at kMaximumExpandedSize.
[[nodiscard]] std::size_t expandedSize(const Value& value);

/// Converts booleans, numbers (true if not zero) and strings (true if they start with Y, y, T, t or a number that is
/// not zero). Returns nullopt for all other types.
[[nodiscard]] std::optional<bool> truth(const Value& value) noexcept;

/// Appends `value` in the style of the ASCII format, for logs, which escape control characters. Long data is truncated
/// and followed by its length; deep nesting and text after a megabyte are replaced by "…".
void appendDescription(std::string& out, const Value& value);
void appendDescription(std::string& out, const Array& array);
inline void appendDescription(std::string& out, const Dictionary& dictionary) {
  appendDescription(out, Value(dictionary));
}

}  // namespace appsync::plist
