// How a daemon gets its client out of a loadable module.
#pragma once

#include <cstdint>
#include <memory>

#include "platform/Platform.h"
#include "platform/ZTClient.h"

namespace appsync::platform {

/// Goes up with every change to base/ or platform/ after which daemon and module only fit when both are compiled anew:
/// a virtual function, a field, what an inline function does.
inline constexpr std::uint32_t kModuleInterfaceVersion = 1;

/// The only symbol of a module, for `dlsym`. Its type is `ModuleEntryPoint`.
inline constexpr const char* kModuleEntryPointName = "appsyncMakeClient";

/// What a module says to a daemon. It keeps this form for ever: each side reads it before it knows that the two agree
/// on anything else.
struct ModuleAnswer {
  std::uint32_t interfaceVersion = 0;  ///< the one that the module was built for, whatever the daemon's
  char refusal[252] = {};              ///< why there is no client, in UTF-8 with a null behind; empty when there is one
};

extern "C" {

/// What a module defines. `interfaceVersion` is the daemon's `kModuleInterfaceVersion`. With another than its own the
/// module looks at nothing but `answer` and refuses; a daemon, for its part, uses no client of a module whose answer
/// names another version than its own. Either way the two must be of one release.
///
/// Ownership: `*client`, empty before, becomes one share of a new client, or stays empty. Queued work and callbacks
/// keep shares of their own, so the client may outlive the daemon's. `platform` outlives all of them. `answer` is the
/// caller's.
///
/// Threads: any, and each call makes a client of its own. Errors: it throws nothing and fills `answer` in every case.
///
/// Loading: `dlopen` with RTLD_NOW | RTLD_LOCAL; a module needs no symbol of the daemon. Objects of standard types, and
/// memory, cross the border, so both must be built with the same C++ standard library and its same ABI.
///
/// Unloading: `dlclose` may be called at any time and frees nothing: a module's code stays until the process ends,
/// because threads, and values that it made, may outlive every client.
[[gnu::visibility("default")]] void appsyncMakeClient(std::uint32_t interfaceVersion, Platform* platform,
                                                      std::shared_ptr<ZTClient>* client, ModuleAnswer* answer) noexcept;
}

using ModuleEntryPoint = decltype(&appsyncMakeClient);

}  // namespace appsync::platform
