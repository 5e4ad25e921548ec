#include "plist/internal/XMLScanner.h"

#include <algorithm>
#include <array>
#include <charconv>
#include <cstring>

#include "base/UTF8.h"
#include "plist/internal/Encoding.h"
#include "plist/internal/Failure.h"

namespace appsync::plist {

namespace {

constexpr bool isSpace(char c) noexcept {
  return c == ' ' || c == '\n' || c == '\t' || c == '\r';
}

constexpr bool isNameEnd(char c) noexcept {
  return isSpace(c) || c == '>' || c == '/' || c == '<';
}

/// Bytes of plain text: everything except markup, line ends to be normalised, and characters that XML forbids. 0xEF may
/// begin U+FFFE or U+FFFF, which XML forbids too.
constexpr auto kIsPlain = [] {
  std::array<bool, 256> plain{};
  for (std::size_t i = 0x20; i < plain.size(); ++i)
    plain[i] = true;
  plain['\t'] = plain['\n'] = true;
  plain['<'] = plain['&'] = plain[0xEF] = false;
  return plain;
}();

struct Name {
  std::string_view text;
  Element element;
};
constexpr std::array<Name, 11> kNames = {{{"key", Element::key},
                                          {"string", Element::string},
                                          {"dict", Element::dict},
                                          {"integer", Element::integer},
                                          {"data", Element::data},
                                          {"array", Element::array},
                                          {"true", Element::trueElement},
                                          {"false", Element::falseElement},
                                          {"date", Element::date},
                                          {"real", Element::real},
                                          {"plist", Element::plist}}};

Element elementNamed(std::string_view name) noexcept {
  for (const Name& known : kNames) {
    if (known.text == name) return known.element;
  }
  return Element::unknown;
}

struct Entity {
  std::string_view name;
  char character;
};
constexpr std::array<Entity, 5> kEntities = {{{"lt", '<'}, {"gt", '>'}, {"amp", '&'}, {"quot", '"'}, {"apos", '\''}}};

/// The maximum length of a reference, which also limits leading zeros.
constexpr std::size_t kLongestReference = 32;

/// The encodings that the decoded text can be declared in, in capital letters.
constexpr std::array<std::string_view, 5> kEncodings = {"UTF-8", "UTF8", "US-ASCII", "ASCII", "UTF-16"};

char capital(char c) noexcept {
  return c >= 'a' && c <= 'z' ? static_cast<char>(c - 'a' + 'A') : c;
}

/// Whether an XML declaration names an unsupported encoding.
bool namesForeignEncoding(std::string_view declaration) noexcept {
  const std::size_t start = declaration.find("encoding");
  if (start == std::string_view::npos) return false;
  const std::size_t open = declaration.find_first_of("\"'", start);
  if (open == std::string_view::npos) return true;
  const std::size_t close = declaration.find(declaration[open], open + 1);
  if (close == std::string_view::npos) return true;
  const std::string_view name = declaration.substr(open + 1, close - open - 1);
  return std::none_of(kEncodings.begin(), kEncodings.end(), [&](std::string_view known) {
    return std::equal(known.begin(), known.end(), name.begin(), name.end(),
                      [](char one, char other) { return one == capital(other); });
  });
}

}  // namespace

void XMLScanner::fail(Failure kind, std::string_view what) {
  if (!failure_) failure_ = failureAt(kind, what, static_cast<std::size_t>(at_ - begin_));
  at_ = end_;
}

void XMLScanner::skipPast(std::string_view terminator, std::string_view what) {
  const std::size_t found = rest().find(terminator);
  if (found == std::string_view::npos) return fail(Failure::truncated, what);
  at_ += found + terminator.size();
}

void XMLScanner::skipMiscellany() {
  for (;;) {
    while (at_ != end_ && isSpace(*at_))
      ++at_;
    if (rest().starts_with("<!--")) {
      at_ += 4;
      skipPast("-->", "A comment without an end");
    } else if (rest().starts_with("<?")) {
      skipPast("?>", "A processing instruction without an end");
    } else {
      return;
    }
  }
}

void XMLScanner::readProlog() {
  if (rest().starts_with("<?xml") && namesForeignEncoding(rest().substr(0, rest().find("?>")))) {
    return fail(Failure::unsupported, "An encoding that is not supported");
  }
  skipMiscellany();
  if (!rest().starts_with("<!DOCTYPE")) return;
  skipDocumentType();
  skipMiscellany();
}

bool XMLScanner::skipQuoted() {
  const char quote = *at_++;
  const std::size_t found = rest().find(quote);
  if (found == std::string_view::npos) {
    fail(Failure::truncated, "A quoted text without an end");
    return false;
  }
  at_ += found + 1;
  return true;
}

void XMLScanner::skipDocumentType() {
  bool isInSubset = false;
  at_ += std::string_view("<!DOCTYPE").size();
  while (at_ != end_ && !failed()) {
    if (rest().starts_with("<!ENTITY")) return fail(Failure::unsupported, "An entity declaration, which is refused,");
    if (rest().starts_with("<!--") || rest().starts_with("<?")) {
      skipMiscellany();
    } else if (*at_ == '"' || *at_ == '\'') {
      skipQuoted();
    } else {
      const char c = *at_++;
      if (c == '>' && !isInSubset) return;
      if (c == '[') isInSubset = true;
      if (c == ']') isInSubset = false;
    }
  }
  fail(Failure::truncated, "A document type declaration without an end");
}

Tag XMLScanner::readTag() {
  skipMiscellany();
  Tag tag;
  if (at_ == end_) {
    fail(Failure::truncated, "The document ends too early");
    return tag;
  }
  if (*at_ != '<') {
    fail(Failure::malformed, "Text where a tag should be");
    return tag;
  }
  ++at_;
  if (at_ != end_ && *at_ == '/') {
    tag.kind = Tag::Kind::close;
    ++at_;
  }
  const char* start = at_;
  while (at_ != end_ && !isNameEnd(*at_))
    ++at_;
  tag.name = {start, static_cast<std::size_t>(at_ - start)};
  tag.element = elementNamed(tag.name);
  if (at_ != end_ && *at_ == '>') {
    ++at_;
  } else {
    skipAttributes(tag);
  }
  return tag;
}

void XMLScanner::skipAttributes(Tag& tag) {
  while (at_ != end_) {
    const char c = *at_;
    if (c == '"' || c == '\'') {
      if (!skipQuoted()) return;
      continue;
    }
    if (c == '<') return fail(Failure::malformed, "A tag within a tag");
    ++at_;
    if (c == '>') return;
    if (c == '/' && at_ != end_ && *at_ == '>') {
      ++at_;
      if (tag.kind == Tag::Kind::close) return fail(Failure::malformed, "A tag that both closes and is empty before");
      tag.kind = Tag::Kind::empty;
      return;
    }
  }
  fail(Failure::truncated, "A tag without an end");
}

const char* XMLScanner::endOfPlain(const char* from) const noexcept {
  while (from != end_ && kIsPlain[static_cast<unsigned char>(*from)])
    ++from;
  return from;
}

/// Skips the closing tag of `name` if it is next, else returns false.
bool XMLScanner::takeClose(std::string_view name) {
  std::string_view left = rest();
  if (!left.starts_with("</") || !left.substr(2).starts_with(name)) return false;
  left.remove_prefix(2 + name.size());
  while (!left.empty() && isSpace(left.front()))
    left.remove_prefix(1);
  if (!left.starts_with('>')) return false;
  at_ = left.data() + 1;
  return true;
}

std::string_view XMLScanner::readCharacters(const Tag& tag) {
  if (tag.kind == Tag::Kind::empty || failed()) return {};
  const char* start = at_;
  at_ = endOfPlain(start);
  const std::string_view plain(start, static_cast<std::size_t>(at_ - start));
  if (takeClose(tag.name)) return plain;
  text_ = plain;
  while (!failed() && !takeClose(tag.name)) {
    if (at_ == end_) {
      fail(Failure::truncated, "An element without an end");
    } else if (!appendMarkup()) {
      fail(Failure::malformed, "An element within text");
    } else {
      start = at_;
      at_ = endOfPlain(start);
      text_.append(start, at_);
    }
  }
  return text_;
}

/// Appends the text of a reference, section or special character. Returns false if a tag is next.
bool XMLScanner::appendMarkup() {
  const std::string_view left = rest();
  if (left.front() == '&') {
    appendReference();
  } else if (left.starts_with("<![CDATA[")) {
    appendSection();
  } else if (left.starts_with("<!--") || left.starts_with("<?")) {
    const bool isComment = left[1] == '!';
    at_ += isComment ? 4 : 2;
    skipPast(isComment ? "-->" : "?>", "A comment without an end");
  } else if (left.front() == '<') {
    return false;
  } else {
    const std::size_t length = left.front() == '\r' ? 1 : sequenceLength(left);
    appendPlain(left.substr(0, length));
    if (!failed()) at_ += length;
  }
  return true;
}

void XMLScanner::appendReference() {
  const std::string_view left = rest().substr(0, kLongestReference);
  const std::size_t semicolon = left.find(';');
  if (semicolon == std::string_view::npos) return fail(Failure::malformed, "A reference without an end");
  const std::string_view name = left.substr(1, semicolon - 1);
  if (name.starts_with('#')) {
    appendCharacterReference(name.substr(1));
  } else {
    const auto known =
        std::find_if(kEntities.begin(), kEntities.end(), [&](const Entity& entity) { return entity.name == name; });
    if (known == kEntities.end()) return fail(Failure::malformed, "An entity that is not predefined");
    text_ += known->character;
  }
  if (!failed()) at_ += semicolon + 1;
}

void XMLScanner::appendCharacterReference(std::string_view digits) {
  const bool isHexadecimal = digits.starts_with('x');
  if (isHexadecimal) digits.remove_prefix(1);
  std::uint32_t number = 0;
  const char* end = digits.data() + digits.size();
  const auto [stop, error] = std::from_chars(digits.data(), end, number, isHexadecimal ? 16 : 10);
  if (error == std::errc::invalid_argument || stop != end)
    return fail(Failure::malformed, "A character reference without a number");
  if (error != std::errc{} || !isXMLCharacter(number)) return fail(Failure::badText, "A character that XML forbids");
  appendCharacter(text_, number);
}

void XMLScanner::appendSection() {
  constexpr std::string_view kOpen = "<![CDATA[";
  constexpr std::string_view kClose = "]]>";
  const std::size_t close = rest().find(kClose);
  if (close == std::string_view::npos) return fail(Failure::truncated, "A CDATA section without an end");
  appendPlain(rest().substr(kOpen.size(), close - kOpen.size()));
  if (!failed()) at_ += close + kClose.size();
}

/// Appends text without markup, with normalised line ends.
void XMLScanner::appendPlain(std::string_view text) {
  for (std::size_t at = 0; at < text.size();) {
    const std::size_t length = sequenceLength(text.substr(at));
    if (!isXMLCharacter(decodeSequence(text.data() + at, length))) {
      return fail(Failure::badText, "A character that XML forbids");
    }
    if (text[at] != '\r') {
      text_.append(text, at, length);
    } else if (const char* next = text.data() + at + 1; next == end_ || *next != '\n') {
      text_ += '\n';
    }
    at += length;
  }
}

std::optional<std::string_view> XMLScanner::rawCharacters(const Tag& tag) const noexcept {
  if (tag.kind == Tag::Kind::empty || at_ == end_) return std::nullopt;
  const auto* stop = static_cast<const char*>(std::memchr(at_, '<', rest().size()));
  if (stop == nullptr) return std::nullopt;
  const std::string_view close(stop, static_cast<std::size_t>(end_ - stop));
  if (!close.starts_with("</") || !close.substr(2).starts_with(tag.name) ||
      !close.substr(2 + tag.name.size()).starts_with('>')) {
    return std::nullopt;
  }
  return std::string_view(at_, static_cast<std::size_t>(stop - at_));
}

void XMLScanner::skipRawCharacters(const Tag& tag, std::string_view raw) noexcept {
  at_ = raw.data() + raw.size() + tag.name.size() + 3;
}

void XMLScanner::expectEnd() {
  skipMiscellany();
  if (!failed() && at_ != end_) fail(Failure::malformed, "Something after the document's end");
}

}  // namespace appsync::plist
