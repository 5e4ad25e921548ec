// How a daemon gets its client out of a loadable module.
#pragma once

#include <cstdint>
#include <memory>

#include "platform/Platform.h"
#include "platform/ZTClient.h"

namespace appsync::platform {

/// Goes up with every change of base/ or platform/ after which both sides must be compiled anew: a virtual function, a
/// field, what an inline function does.
inline constexpr std::uint32_t kModuleInterfaceVersion = 1;

/// The only symbol of a module, for `dlsym`. Its type is `ModuleEntryPoint`.
inline constexpr const char* kModuleEntryPointName = "appsyncMakeClient";

/// What a module says to a daemon. It keeps this form for ever: each side reads it before it knows that the two agree
/// on anything else.
struct ModuleAnswer {
  std::uint32_t interfaceVersion = 0;  ///< the one that the module was built for, whatever the daemon's
  /// Why there is no client, in UTF-8 with a null behind; empty when there is one. A long text may be cut anywhere,
  /// also in the middle of a character.
  char refusal[252] = {};
};

extern "C" {

/// What a module defines: makes a new client at each call, or says why not in `answer`, which it always fills. Throws
/// nothing. Threads: any.
///
/// Versions: `interfaceVersion` is the daemon's. A module of another one looks at nothing but `answer`, and refuses; a
/// daemon uses no client of a module whose answer names another one. The two must be of one release and built with the
/// same C++ standard library and ABI, whose objects and memory pass between them.
///
/// Ownership: `*client`, empty before, becomes a share of the client. Queued work and callbacks have shares too, so the
/// client may outlive the daemon's, but never `platform`.
///
/// Loading: `dlopen` with RTLD_NOW | RTLD_LOCAL. `dlclose` may come at any time and frees nothing: threads and values
/// of a module may outlive its clients, so its code stays until the process ends.
[[gnu::visibility("default")]] void appsyncMakeClient(std::uint32_t interfaceVersion, Platform* platform,
                                                      std::shared_ptr<ZTClient>* client, ModuleAnswer* answer) noexcept;
}

using ModuleEntryPoint = decltype(&appsyncMakeClient);

}  // namespace appsync::platform
