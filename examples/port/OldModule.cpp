// A module of another interface version; tests that the daemon refuses it.
#include "platform/Module.h"

void appsync::platform::appsyncMakeClient(std::uint32_t, Platform*, std::shared_ptr<ZTClient>*,
                                          ModuleAnswer* answer) noexcept {
  *answer = {kModuleInterfaceVersion + 1, "of another release"};
}
