// Raw bytes: the owned buffer and the view.
#pragma once

#include <cstddef>
#include <memory>
#include <span>
#include <string_view>
#include <type_traits>
#include <utility>
#include <vector>

namespace appsync {

/// Leaves elements that a container adds without a value uninitialised: a buffer that is about to be read into
/// need not be cleared first.
template <class T>
struct UninitializedAllocator : std::allocator<T> {
  // NOLINTBEGIN(readability-identifier-naming): the standard library looks for these names.
  template <class U>
  struct rebind {
    using other = UninitializedAllocator<U>;
  };
  // NOLINTEND(readability-identifier-naming)
  template <class U>
  void construct(U* place) noexcept(std::is_nothrow_default_constructible_v<U>) {
    ::new (static_cast<void*>(place)) U;
  }
  template <class U, class... Args>
  void construct(U* place, Args&&... args) {
    std::construct_at(place, std::forward<Args>(args)...);
  }
};

/// An owned buffer. `resize` leaves new bytes unset.
using Bytes = std::vector<std::byte, UninitializedAllocator<std::byte>>;

/// Bytes owned by another object, which must outlive the view.
using ByteView = std::span<const std::byte>;

inline ByteView bytesOf(std::string_view text) noexcept {
  return std::as_bytes(std::span(text));
}

inline std::string_view textOf(ByteView bytes) noexcept {
  return {reinterpret_cast<const char*>(bytes.data()), bytes.size()};
}

}  // namespace appsync
