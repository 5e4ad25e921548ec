// Readable names of install types, states and phases, for logs.
#pragma once

#include <string>

#include "platform/InstallTypes.h"

namespace appsync {

/// The names of the registry's numbers; one without a name yields a text that says so and holds the number.
[[nodiscard]] std::string installTypeName(platform::TSInstallType type);
[[nodiscard]] std::string installStateName(platform::TSInstallState state);
[[nodiscard]] std::string installPhaseName(platform::TSInstallPhase phase);

/// One of these numbers as an argument of a message, which names it only when it is written.
template <class Enumeration>
struct Named {
  Enumeration value;
};
template <class Enumeration>
Named(Enumeration) -> Named<Enumeration>;

inline void appendDescription(std::string& out, Named<platform::TSInstallType> type) {
  out += installTypeName(type.value);
}
inline void appendDescription(std::string& out, Named<platform::TSInstallState> state) {
  out += installStateName(state.value);
}
inline void appendDescription(std::string& out, Named<platform::TSInstallPhase> phase) {
  out += installPhaseName(phase.value);
}

}  // namespace appsync
