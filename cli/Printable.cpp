#include "cli/Printable.h"

#include <array>
#include <cstdio>
#include <cwchar>

#include "base/UTF8.h"

namespace appsync::cli {
namespace {

/// Returns the character's number of columns, or a negative number if it is unsafe for a terminal.
int columnsOf(const Character& character) {
  if (!character.valid || isUnsafeForDisplay(character.code)) return -1;
  if (character.code < 0x7F) return 1;
  return wcwidth(static_cast<wchar_t>(character.code));
}

std::string escaped(const Character& character) {
  char text[16];
  const bool isByte = !character.valid || character.code < 0x80;
  const int length =
      std::snprintf(text, sizeof text, isByte ? "\\x%02x" : "\\u{%x}", static_cast<unsigned>(character.code));
  return {text, static_cast<std::size_t>(length)};
}

/// Returns the numeric reference of a character: in JSON its UTF-16 units, in XML its code point.
std::string reference(char32_t code, Notation notation) {
  const auto number = static_cast<unsigned>(code);
  char text[16];
  int length = 0;
  if (notation == Notation::xml) {
    length = std::snprintf(text, sizeof text, "&#x%x;", number);
  } else if (code < 0x10000) {
    length = std::snprintf(text, sizeof text, "\\u%04x", number);
  } else {
    length = std::snprintf(text, sizeof text, "\\u%04x\\u%04x", 0xD7C0U + (number >> 10U), 0xDC00U + (number & 0x3FFU));
  }
  return {text, static_cast<std::size_t>(length)};
}

}  // namespace

std::string withReferences(std::string document, Notation notation) {
  std::string out;
  std::size_t kept = 0;  // bytes of the document that were copied to `out`
  for (std::size_t place = 0; place < document.size();) {
    const Character character = firstCharacter(std::string_view(document).substr(place));
    if (character.valid && character.code >= 0x7F && isUnsafeForDisplay(character.code)) {
      out.append(document, kept, place - kept).append(reference(character.code, notation));
      kept = place + character.length;
    }
    place += character.length;
  }
  if (kept == 0) return document;
  return out.append(document, kept);
}

std::string printable(std::string_view text, std::size_t columns) {
  constexpr std::string_view kCut = "...";
  std::string out;
  std::size_t width = 0;
  std::size_t beforeCut = 0;  // bytes of `out` that leave space for kCut
  while (!text.empty()) {
    const Character character = firstCharacter(text);
    const int own = columnsOf(character);
    const std::string piece = own < 0 ? escaped(character) : std::string(text.substr(0, character.length));
    const std::size_t taken = own < 0 ? piece.size() : static_cast<std::size_t>(own);
    if (width + taken > columns) {
      out.resize(beforeCut);
      return out.append(kCut.substr(0, columns));
    }
    out += piece;
    width += taken;
    if (width + kCut.size() <= columns) beforeCut = out.size();
    text.remove_prefix(character.length);
  }
  return out;
}

std::size_t displayWidth(std::string_view text) {
  std::size_t width = 0;
  while (!text.empty()) {
    const Character character = firstCharacter(text);
    const int own = columnsOf(character);
    width += own < 0 ? escaped(character).size() : static_cast<std::size_t>(own);
    text.remove_prefix(character.length);
  }
  return width;
}

std::string fitted(std::string_view text, std::size_t columns) {
  std::string out = printable(text, columns);
  const std::size_t width = displayWidth(out);
  return out.append(columns - std::min(columns, width), ' ');
}

std::string byteCount(unsigned long long bytes) {
  constexpr std::array<const char*, 5> kUnits = {"kB", "MB", "GB", "TB", "PB"};
  if (bytes < 1000) return std::to_string(bytes) + " bytes";
  double amount = static_cast<double>(bytes) / 1000;
  std::size_t unit = 0;
  for (; amount >= 999.95 && unit + 1 < kUnits.size(); ++unit)
    amount /= 1000;
  char text[32];
  const int length = std::snprintf(text, sizeof text, "%.1f %s", amount, kUnits[unit]);
  return {text, static_cast<std::size_t>(length)};
}

bool isUTF8(std::string_view text) {
  while (!text.empty()) {
    const Character character = firstCharacter(text);
    if (!character.valid) return false;
    text.remove_prefix(character.length);
  }
  return true;
}

}  // namespace appsync::cli
