// Named notifications across all processes of the device, each with a 64-bit state.
#pragma once

#include <cstdint>
#include <string_view>

namespace appsync::platform {

/// What happens to notifications while the observing process is suspended.
enum class SuspensionBehavior { drop };

/// Threads: every operation may be called from any thread at any time. Callbacks come on threads of the service's
/// own; those to one observer never overlap.
class SystemNotify {
 public:
  using Callback = void (*)(void* context, std::string_view name, const void* object);

  /// A registration's number, good for `setState`.
  using Token = int;

  struct Registration {
    std::uint32_t status = 0;  ///< 0 when the registration succeeded
    Token token = 0;           ///< meaningless unless it did
  };

  virtual ~SystemNotify() = default;

  /// From now on calls `callback` with `observer` as its context when `name` is posted. `object` filters by sender;
  /// null means every sender.
  virtual void addObserver(void* observer, Callback callback, std::string_view name, const void* object,
                           SuspensionBehavior suspension) = 0;

  /// Ends it. When this returns no callback for `observer` and `name` runs on another thread and none will begin.
  virtual void removeObserver(void* observer, std::string_view name) = 0;

  /// A token for a name's state. No registration is ever taken back, and clients make one for each post: the same name
  /// may well get the same token again.
  [[nodiscard]] virtual Registration registerCheck(std::string_view name) = 0;

  /// Sets the state of the token's name; seen by everyone before the next `post` of the name reaches them.
  virtual void setState(Token token, std::uint64_t state) = 0;

  /// Tells every observer of `name`, in every process.
  virtual void post(std::string_view name) = 0;
};

}  // namespace appsync::platform
