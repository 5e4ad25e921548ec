// Names of install types, states and phases in messages.
#pragma once

#include <string>

#include "platform/InstallTypes.h"

namespace appsync {

/// Returns the name of the number, or a text that contains the number if it has no name.
[[nodiscard]] std::string installTypeName(platform::TSInstallType type);
[[nodiscard]] std::string installStateName(platform::TSInstallState state);
[[nodiscard]] std::string installPhaseName(platform::TSInstallPhase phase);

}  // namespace appsync

namespace appsync::platform {

inline void appendDescription(std::string& out, TSInstallType type) {
  out += installTypeName(type);
}
inline void appendDescription(std::string& out, TSInstallState state) {
  out += installStateName(state);
}
inline void appendDescription(std::string& out, TSInstallPhase phase) {
  out += installPhaseName(phase);
}

}  // namespace appsync::platform
