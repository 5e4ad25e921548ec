// Named notifications between all processes of the device, each with a 64-bit state.
#pragma once

#include <cstdint>
#include <string_view>

namespace appsync::platform {

/// The treatment of notifications while the observing process is suspended.
enum class SuspensionBehavior { drop };

/// Thread-safe. Callbacks run on threads of the service; those to one observer never overlap.
class SystemNotify {
 public:
  using Callback = void (*)(void* context, std::string_view name, const void* object);

  /// Identifies a registration for `setState`.
  using Token = int;

  struct Registration {
    std::uint32_t status = 0;  ///< 0 if the registration succeeded
    Token token = 0;           ///< valid only if `status` is 0
  };

  virtual ~SystemNotify() = default;

  /// Registers `callback`, to be called with `observer` as `context` whenever `name` is posted. `object` selects the
  /// sender; null means every sender.
  virtual void addObserver(void* observer, Callback callback, std::string_view name, const void* object,
                           SuspensionBehavior suspension) = 0;

  /// Ends the registration of `observer` for `name`: blocks until its running callback has returned, unless called from
  /// that callback; no further callback begins.
  virtual void removeObserver(void* observer, std::string_view name) = 0;

  /// Returns a token for the state of `name`. Clients register before each post and never unregister, so a service may
  /// return the same token for the same name.
  [[nodiscard]] virtual Registration registerCheck(std::string_view name) = 0;

  /// Sets the state of the token's name, in every process, before the next `post` of that name is delivered.
  virtual void setState(Token token, std::uint64_t state) = 0;

  /// Notifies every observer of `name`, in every process.
  virtual void post(std::string_view name) = 0;
};

}  // namespace appsync::platform
