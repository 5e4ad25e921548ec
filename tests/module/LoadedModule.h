// The plug-in as a daemon loads it, without the tool.
#pragma once

#include <memory>

#include "platform/Module.h"

namespace appsync::test {

/// Throws when the module cannot be loaded.
[[nodiscard]] platform::ModuleEntryPoint loadModule();

/// A client of the module; throws when it makes none.
[[nodiscard]] std::shared_ptr<platform::ZTClient> makeModuleClient(platform::Platform& platform);

}  // namespace appsync::test
