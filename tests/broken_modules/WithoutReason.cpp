// A module that gives neither a client nor a reason.
#include "platform/Module.h"

namespace appsync::platform {

void appsyncMakeClient(std::uint32_t, Platform*, std::shared_ptr<ZTClient>*, ModuleAnswer* answer) noexcept {
  *answer = {kModuleInterfaceVersion, {}};
}

}  // namespace appsync::platform
