#include "tools/Printable.h"

#include <array>
#include <cstdint>
#include <cstdio>
#include <cwchar>

namespace appsync::tools {
namespace {

/// One character of a text, or one byte that belongs to none.
struct Character {
  char32_t code = 0;
  std::size_t length = 1;
  bool valid = false;
};

/// The character at the start of `text`, which is not empty.
Character decode(std::string_view text) {
  const auto byte = [&](std::size_t index) { return static_cast<std::uint8_t>(text[index]); };
  const std::uint8_t lead = byte(0);
  if (lead < 0x80) return {lead, 1, true};
  const std::size_t length = lead >= 0xF0 ? 4 : lead >= 0xE0 ? 3 : 2;
  if (lead < 0xC2 || lead > 0xF4 || text.size() < length) return {lead};
  char32_t code = lead & (0x7FU >> length);
  for (std::size_t index = 1; index < length; ++index) {
    if ((byte(index) & 0xC0U) != 0x80) return {lead};
    code = (code << 6U) | (byte(index) & 0x3FU);
  }
  constexpr std::array<char32_t, 5> kSmallest = {0, 0, 0x80, 0x800, 0x10000};
  if (code < kSmallest[length] || code > 0x10FFFF || (code >= 0xD800 && code <= 0xDFFF)) return {lead};
  return {code, length, true};
}

/// Invisible characters with which text can pretend to be other text.
bool misleads(char32_t code) {
  return code == 0xAD || code == 0x61C || (code >= 0x200B && code <= 0x200F && code != 0x200D) ||
         (code >= 0x2028 && code <= 0x202E) || (code >= 0x2060 && code <= 0x206F) || code == 0xFEFF ||
         (code >= 0xFFF0 && code <= 0xFFFB) || (code >= 0xE0000 && code <= 0xE0FFF);
}

/// Columns that a character takes, or a negative number when it must not reach a terminal.
int columnsOf(const Character& character) {
  if (!character.valid || misleads(character.code)) return -1;
  if (character.code < 0x20) return -1;
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

}  // namespace

std::string printable(std::string_view text, std::size_t columns) {
  constexpr std::string_view kCut = "...";
  std::string out;
  std::size_t width = 0;
  std::size_t beforeCut = 0;  // bytes of `out` that leave room for the mark of a cut
  while (!text.empty()) {
    const Character character = decode(text);
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
    const Character character = decode(text);
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
    const Character character = decode(text);
    if (!character.valid) return false;
    text.remove_prefix(character.length);
  }
  return true;
}

}  // namespace appsync::tools
