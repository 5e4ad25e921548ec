// The entry point of the plug-in as a loadable module.
#include "platform/Module.h"

#include <cstdio>
#include <exception>

#include "core/AppsClient.h"

namespace appsync::platform {

void appsyncMakeClient(std::uint32_t interfaceVersion, Platform* platform, std::shared_ptr<ZTClient>* client,
                       ModuleAnswer* answer) noexcept {
  const auto refuse = [answer](const char* reason) {
    std::snprintf(answer->refusal, sizeof answer->refusal, "no client can be made: %s", reason);
  };
  *answer = {kModuleInterfaceVersion, {}};
  if (interfaceVersion != kModuleInterfaceVersion) {
    std::snprintf(answer->refusal, sizeof answer->refusal, "its interface version is %lu and the daemon's %lu",
                  static_cast<unsigned long>(kModuleInterfaceVersion), static_cast<unsigned long>(interfaceVersion));
    return;
  }
  try {
    *client = AppsClient::create(*platform);
  } catch (const std::exception& failure) {
    refuse(failure.what());
  } catch (...) {
    refuse("the platform threw something unknown");
  }
}

}  // namespace appsync::platform
