// Numbers, dates, uids and long strings of the binary format.
#include <bit>

#include "base/UTF8.h"
#include "plist/internal/BinaryReader.h"
#include "plist/internal/Date.h"
#include "plist/internal/Encoding.h"

namespace appsync::plist {

Value BinaryReader::readInteger(std::size_t at, unsigned exponent) {
  const unsigned size = 1U << exponent;
  if (size > 16) return fail(Failure::outOfRange, "An integer longer than 16 bytes", at);
  if (!fits(at, {at + 1, size}, 1)) return {};
  if (size < 8) return loadBigEndian(begin_ + at + 1, size);
  if (size == 8) return static_cast<std::int64_t>(loadBigEndian(begin_ + at + 1, 8));
  const std::uint64_t high = loadBigEndian(begin_ + at + 1, 8);
  const std::uint64_t low = loadBigEndian(begin_ + at + 9, 8);
  if (high == 0) return low;
  if (high == ~std::uint64_t{0} && low >> 63 == 1) return static_cast<std::int64_t>(low);
  return fail(Failure::outOfRange, "An integer that does not fit in 64 bits", at);
}

Value BinaryReader::readReal(std::size_t at, unsigned exponent) {
  if (exponent != 2 && exponent != 3) return fail(Failure::malformed, "A real of neither 4 nor 8 bytes", at);
  const unsigned size = 1U << exponent;
  if (!fits(at, {at + 1, size}, 1)) return {};
  const std::uint64_t number = loadBigEndian(begin_ + at + 1, size);
  if (size == 4) return std::bit_cast<float>(static_cast<std::uint32_t>(number));
  return std::bit_cast<double>(number);
}

Value BinaryReader::readDate(std::size_t at, unsigned low) {
  if (low != 3) return fail(Failure::malformed, "A date of other than 8 bytes", at);
  if (!fits(at, {at + 1, 8}, 1)) return {};
  const Date date{std::bit_cast<double>(loadBigEndian(begin_ + at + 1, 8))};
  if (!isInCalendar(date)) return fail(Failure::outOfRange, "A date outside the calendar", at);
  return date;
}

Value BinaryReader::readUid(std::size_t at, unsigned size) {
  if (size > 8) return fail(Failure::outOfRange, "A uid longer than 8 bytes", at);
  if (!fits(at, {at + 1, size}, 1)) return {};
  return Uid{loadBigEndian(begin_ + at + 1, size)};
}

Value BinaryReader::readData(ByteView bytes) const {
  // Shorter data is copied: it must not keep a whole document alive.
  constexpr std::size_t kShort = 256;
  return document_ == nullptr || bytes.size() < kShort ? Value::data(bytes) : Internals::dataIn(document_, bytes);
}

Value BinaryReader::readASCII(std::size_t at, Extent extent) {
  const std::string_view text = textOf({begin_ + extent.start, static_cast<std::size_t>(extent.count)});
  if (!isASCII(text)) return fail(Failure::badText, "An ASCII string with bytes that are not ASCII", at);
  return text;
}

Value BinaryReader::readUTF16(Extent extent) {
  const ByteView units{begin_ + extent.start, static_cast<std::size_t>(extent.count) * 2};
  text_.clear();
  if (const auto bad = appendUTF16(text_, units, ByteOrder::big)) {
    return fail(Failure::badText, "A lone surrogate", extent.start + *bad);
  }
  return std::string_view(text_);
}

}  // namespace appsync::plist
