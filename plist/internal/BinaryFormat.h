// The binary format: its layout, and the limits that its reader and writer keep.
#pragma once

#include <cstddef>
#include <cstdint>
#include <string_view>

namespace appsync::plist {

// A document. All numbers are big-endian; references are the objects' numbers, which index the offset table.
//
//     offset    size
//          0       8   "bplist00"
//          8       -   objects, in any order
//          t   n * o   offset table: the offset of each object
//     end-32       6   unused
//     end-26       1   o, the size of an entry of the table, 1 to 8
//     end-25       1   r, the size of a reference, 1 to 8
//     end-24       8   n, the number of objects
//     end-16       8   the number of the root object
//      end-8       8   t, the offset of the table
//
// An object begins with a byte whose high four bits are its Marker. The low four bits, `low`, are
//
//     boolean             8 false, 9 true (0 is null and 15 a filler: both are refused)
//     integer             log2 of the size: unsigned up to 4 bytes, signed with 8 and 16
//     real                2 or 3, log2 of the size
//     date                3: a real of 8 bytes
//     uid                 the size minus 1
//     data, ascii         the number of bytes that follow
//     utf16               the number of units of two bytes that follow
//     array               the number of references that follow
//     dictionary          the number of references to keys that follow, and then of references to values
//
// If a number of elements does not fit, `low` is 15 and an integer object with the number precedes the elements.

inline constexpr std::string_view kMagic = "bplist00";
/// The magic without the version.
inline constexpr std::string_view kMagicOfAnyVersion = kMagic.substr(0, 6);
/// At least as long as any fixed read ahead: all before the trailer can be read in whole words.
inline constexpr std::size_t kTrailerSize = 32;

enum class Marker : std::uint8_t {
  boolean = 0x0,
  integer = 0x1,
  real = 0x2,
  date = 0x3,
  data = 0x4,
  ascii = 0x5,
  utf16 = 0x6,
  uid = 0x8,
  array = 0xA,
  orderedSet = 0xB,  ///< Refused.
  set = 0xC,         ///< Refused.
  dictionary = 0xD,
};

inline constexpr unsigned kFalse = 8;
inline constexpr unsigned kTrue = 9;
/// `low` of an object whose number of elements is in an integer object.
inline constexpr unsigned kLongCount = 15;

/// The first byte of an object.
constexpr unsigned markerByte(Marker marker, unsigned low = 0) noexcept {
  return static_cast<unsigned>(marker) << 4 | low;
}
constexpr Marker markerOf(unsigned byte) noexcept {
  return static_cast<Marker>(byte >> 4);
}
constexpr unsigned lowOf(unsigned byte) noexcept {
  return byte & 0xFU;
}

/// The expansion limit: a document of n bytes may expand to kExpansionPerByte * n + kExpansionAllowance values. Values
/// count at each reference, because a caller may visit each of them; a document that stores each container once stays
/// below, because every reference takes at least a byte. The allowance is for small documents.
inline constexpr std::uint64_t kExpansionPerByte = 32;
inline constexpr std::uint64_t kExpansionAllowance = 262144;

/// The writer refuses more values than this: values that share content can expand to far more than memory holds.
inline constexpr std::size_t kMaximumValues = std::size_t{1} << 26;
/// The writer refuses more bytes than this: its offsets take four bytes.
inline constexpr std::size_t kMaximumDocumentSize = std::size_t{1} << 32;

}  // namespace appsync::plist
