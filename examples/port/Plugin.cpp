#include "Plugin.h"

#include <dlfcn.h>

#include "platform/Module.h"

namespace port {

namespace {

/// Never closes the module: its threads may run until the process exits.
appsync::platform::ModuleEntryPoint entryPointOf(const std::string& path) {
  void* module = dlopen(path.c_str(), RTLD_NOW | RTLD_LOCAL);
  if (module == nullptr) throw std::runtime_error(dlerror());
  void* entryPoint = dlsym(module, appsync::platform::kModuleEntryPointName);
  if (entryPoint == nullptr) throw std::runtime_error(path + " is not a sync plug-in: " + dlerror());
  return reinterpret_cast<appsync::platform::ModuleEntryPoint>(entryPoint);
}

}  // namespace

std::shared_ptr<appsync::platform::ZTClient> loadPlugin(const std::string& path,
                                                        appsync::platform::Platform& platform) {
  using appsync::platform::kModuleInterfaceVersion;
  std::shared_ptr<appsync::platform::ZTClient> client;
  appsync::platform::ModuleAnswer answer;
  entryPointOf(path)(kModuleInterfaceVersion, &platform, &client, &answer);
  if (answer.interfaceVersion != kModuleInterfaceVersion) {
    throw std::runtime_error(path + " has interface version " + std::to_string(answer.interfaceVersion) +
                             "; this daemon requires " + std::to_string(kModuleInterfaceVersion));
  }
  if (client == nullptr) throw std::runtime_error(path + ": " + answer.refusal);
  return client;
}

}  // namespace port
