// The plug-in, out of its loadable module.
#pragma once

#include <memory>
#include <stdexcept>
#include <string>

#include "platform/Platform.h"
#include "platform/ZTClient.h"

namespace port {

/// Loads the module at `path` and has it make a client that reaches the world through `platform`, which must outlive
/// the client. Never null. Throws std::runtime_error, with words for people, when there is no such module, when it is
/// none of ours, or when it is of another interface version than the headers that this daemon was compiled with.
[[nodiscard]] std::shared_ptr<appsync::platform::ZTClient> loadPlugin(const std::string& path,
                                                                      appsync::platform::Platform& platform);

}  // namespace port
