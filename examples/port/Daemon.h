// A minimal sync daemon that also plays the part of the host.
#pragma once

#include <string>
#include <vector>

#include "kit/fakes/FakePlatform.h"
#include "platform/ZTClient.h"

namespace port {

/// An app that the host wants on the device.
struct WantedApp {
  std::string identifier;
  std::string version;
  std::string name;
};

/// Runs one sync with the sequence of calls in platform/ZTClient.h and prints its events on standard output. Returns
/// false if the plug-in refused the sync.
[[nodiscard]] bool sync(appsync::test::FakePlatform& device, appsync::platform::ZTClient& client,
                        const std::vector<WantedApp>& library);

}  // namespace port
