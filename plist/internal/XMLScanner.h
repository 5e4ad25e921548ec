// Tags and text of an XML document, as far as property lists need them.
#pragma once

#include <cstdint>
#include <optional>
#include <string>
#include <string_view>

#include "base/Error.h"
#include "plist/PropertyList.h"

namespace appsync::plist {

enum class Element : std::uint8_t {
  unknown,
  plist,
  dict,
  array,
  key,
  string,
  data,
  date,
  integer,
  real,
  trueElement,
  falseElement
};

struct Tag {
  enum class Kind : std::uint8_t { open, close, empty };

  Element element = Element::unknown;
  Kind kind = Kind::open;
  std::string_view name;
};

/// Scans a document of well-formed UTF-8. After a failure all further steps fail, and the first error is kept.
class XMLScanner {
 public:
  explicit XMLScanner(std::string_view text) noexcept : begin_(text.data()), at_(begin_), end_(begin_ + text.size()) {}

  [[nodiscard]] bool failed() const noexcept { return failure_.has_value(); }
  [[nodiscard]] Error takeFailure() { return *std::move(failure_); }
  /// Records an error at the current byte.
  void fail(Failure kind, std::string_view what);

  /// Skips the declaration, comments and any document type declaration without entities.
  void readProlog();
  /// Reads the next tag. Fails if anything other than white space, comments and processing instructions precedes it.
  Tag readTag();
  /// Reads the text in the element that `tag` opened, and its closing tag. Valid until the next call.
  std::string_view readCharacters(const Tag& tag);
  /// Returns the text up to the closing tag without advancing, or nullopt if it contains other markup.
  [[nodiscard]] std::optional<std::string_view> rawCharacters(const Tag& tag) const noexcept;
  /// Skips `raw`, a result of rawCharacters, and the closing tag.
  void skipRawCharacters(const Tag& tag, std::string_view raw) noexcept;
  /// Fails if anything other than comments follows.
  void expectEnd();

 private:
  void skipMiscellany();
  void skipPast(std::string_view terminator, std::string_view what);
  void skipDocumentType();
  void skipAttributes(Tag& tag);
  bool skipQuoted();
  bool takeClose(std::string_view name);
  bool appendMarkup();
  void appendReference();
  void appendCharacterReference(std::string_view digits);
  void appendSection();
  void appendPlain(std::string_view text);
  [[nodiscard]] const char* endOfPlain(const char* from) const noexcept;
  [[nodiscard]] std::string_view rest() const noexcept { return {at_, static_cast<std::size_t>(end_ - at_)}; }

  const char* begin_;
  const char* at_;
  const char* end_;
  /// Buffer for text that is not contiguous in the document.
  std::string text_;
  std::optional<Error> failure_;
};

}  // namespace appsync::plist
