// Property lists: the value, and its three file forms.
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
  malformed,         ///< it breaks its form's rules
  outOfRange,        ///< a number, date, offset or length lies outside what is allowed
  badText,           ///< bytes that are not text in their encoding, or text its form cannot hold
  tooDeep,           ///< containers nested deeper than kMaximumDepth
  tooLarge,          ///< a document or value whose shared content expands to too many values or too much text
  unsupported,       ///< a form or element that is understood but refused
  notRepresentable,  ///< a value that the form to be written cannot hold; every null is one
};

/// Documents nested deeper than this are neither read nor written.
inline constexpr int kMaximumDepth = 512;

/// Bytes. Values that share their content can stand for far more than memory holds: forms that repeat shared content,
/// such as XML, are refused beyond this size.
inline constexpr std::size_t kMaximumExpandedSize = std::size_t{1} << 30;

// Reading. Input may be hostile: nothing in it is trusted, time and memory stay in proportion to its size, and a
// failure names the byte at which it was found. Of equal keys in one dictionary the last one counts. Repeated
// references to text or data in a binary document share its storage. Every document that the writers return can be
// read.

/// Reads whichever of the three forms the bytes are in, told by their content.
[[nodiscard]] Result<Value> read(ByteView document);
/// The same of a document that is given away: long data in the binary form is not copied, and keeps all of it alive.
[[nodiscard]] Result<Value> read(Bytes&& document);
/// "bplist00". Sets are refused.
[[nodiscard]] Result<Value> readBinary(ByteView document);
/// UTF-8 or, with a byte-order mark, UTF-16. Entity declarations are refused, other document types skipped.
[[nodiscard]] Result<Value> readXML(ByteView document);
/// The old text form: `{ key = value; }`, `( a, b )`, `<0f a0>`, "quoted" and bare words, comments; also the
/// `key = value;` lines of a strings file. Every scalar in it is a string or data.
[[nodiscard]] Result<Value> readText(ByteView document);
/// Binary if the document begins like one, else XML: for files that programs wrote. Almost any text would pass for the
/// ASCII format.
[[nodiscard]] Result<Value> readBinaryOrXML(ByteView document);

/// Returns the error for a document whose root should be a dictionary and is not.
[[nodiscard]] Error rootIsNoDictionary();

// Writing. Equal values give equal bytes. A null anywhere makes both fail.

/// "bplist00", with equal scalars stored once and shared by the value that is read back. Fails on far more than
/// kMaximumExpandedSize of text, counted as often as it occurs: readers refuse it too.
[[nodiscard]] Result<Bytes> writeBinary(const Value& root);
/// UTF-8, without a document type declaration. Fails on a uid and on text with characters that XML cannot hold;
/// dates lose their fractions of a second.
[[nodiscard]] Result<Bytes> writeXML(const Value& root);

/// Estimates the size in bytes of a form that repeats shared content. Beyond kMaximumExpandedSize it only tells that it
/// is larger.
[[nodiscard]] std::size_t expandedSize(const Value& value);

/// What gives a boolean: booleans, numbers (not zero) and strings: true for those that start with Y, y, T, t or a
/// number that is not zero, false for all others. Nothing else does.
[[nodiscard]] std::optional<bool> truth(const Value& value) noexcept;

/// Appends `value` in the style of the ASCII format, for logs, which escape control characters. Dictionaries keep their
/// order, long data is cut short and followed by its length, deep nesting and text after a megabyte are cut to "…".
void appendDescription(std::string& out, const Value& value);
void appendDescription(std::string& out, const Array& array);
inline void appendDescription(std::string& out, const Dictionary& dictionary) {
  appendDescription(out, Value(dictionary));
}

}  // namespace appsync::plist
