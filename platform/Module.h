// The entry point through which a daemon creates the client of a loadable module.
#pragma once

#include <cstdint>
#include <memory>

#include "platform/Platform.h"
#include "platform/ZTClient.h"

namespace appsync::platform {

/// Incremented with every change to base/, plist/ or platform/ that requires both sides to be recompiled: to a virtual
/// function, a data member, or the behaviour of an inline function.
inline constexpr std::uint32_t kModuleInterfaceVersion = 1;

/// The only symbol that a module exports, of type `ModuleEntryPoint`.
inline constexpr const char* kModuleEntryPointName = "appsyncMakeClient";

/// The module's answer to a daemon. This layout never changes: both sides read it before they have compared versions.
struct ModuleAnswer {
  std::uint32_t interfaceVersion = 0;  ///< the module's `kModuleInterfaceVersion`
  /// The reason why there is no client: null-terminated UTF-8, empty if there is one. A long text is truncated,
  /// possibly within a character.
  char refusal[252] = {};
};

extern "C" {

/// Defined by the module. Creates a new client with each call. Always fills in `*answer`; on failure `*client` stays
/// null and `answer->refusal` gives the reason. Throws nothing. Thread-safe.
///
/// Versions: `interfaceVersion` is the daemon's. If it differs from its own, the module accesses only `answer` and
/// refuses; a daemon must not use a client if `answer->interfaceVersion` differs from its own version. Both must be
/// built from the same release, with the same C++ standard library and ABI, because objects and memory pass between
/// them.
///
/// Ownership: the daemon shares ownership of `*client`, which must be null before. Queued operations and callbacks hold
/// shares too, so the client may outlive the daemon's share. `platform` must outlive the client.
///
/// Loading: `dlopen` with RTLD_NOW | RTLD_LOCAL. `dlclose` is allowed at any time and unloads nothing: the module's
/// code stays until the process exits, because its threads and values may outlive its clients.
[[gnu::visibility("default")]] void appsyncMakeClient(std::uint32_t interfaceVersion, Platform* platform,
                                                      std::shared_ptr<ZTClient>* client, ModuleAnswer* answer) noexcept;
}

using ModuleEntryPoint = decltype(&appsyncMakeClient);

}  // namespace appsync::platform
