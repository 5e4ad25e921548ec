// Loads the plug-in as a daemon does.
#pragma once

#include <memory>

#include "platform/Module.h"

namespace appsync::test {

/// Loads the module. Throws if it cannot be loaded.
[[nodiscard]] platform::ModuleEntryPoint loadModule();

/// Creates a client of the module. Throws if the module refuses.
[[nodiscard]] std::shared_ptr<platform::ZTClient> makeModuleClient(platform::Platform& platform);

}  // namespace appsync::test
