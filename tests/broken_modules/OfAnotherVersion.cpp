// A module of a release that is still to come, which fits older daemons, or so it says.
#include "platform/Module.h"

namespace appsync::platform {

void appsyncMakeClient(std::uint32_t, Platform*, std::shared_ptr<ZTClient>*, ModuleAnswer* answer) noexcept {
  *answer = {kModuleInterfaceVersion + 1, {}};
}

}  // namespace appsync::platform
