// Names of install types, states and phases in messages.
#pragma once

#include <string>

#include "platform/InstallTypes.h"

namespace appsync::platform {

/// Appends the name of the number, or a text that contains the number if it has no name.
void appendDescription(std::string& out, TSInstallType type);
void appendDescription(std::string& out, TSInstallState state);
void appendDescription(std::string& out, TSInstallPhase phase);

}  // namespace appsync::platform
