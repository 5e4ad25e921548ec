// A sync daemon, and the host that it would talk to.
#pragma once

#include <string>
#include <vector>

#include "kit/fakes/FakePlatform.h"
#include "platform/ZTClient.h"

namespace port {

/// What the host wants on the device.
struct WantedApp {
  std::string identifier;
  std::string version;
  std::string name;
};

/// Drives the plug-in through one sync, with the sequence of calls that platform/ZTClient.h prescribes, and says on
/// standard output what happens. False when the plug-in refused the sync.
[[nodiscard]] bool sync(appsync::test::FakePlatform& device, appsync::platform::ZTClient& client,
                        const std::vector<WantedApp>& library);

}  // namespace port
