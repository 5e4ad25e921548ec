#include "Plugin.h"

#include <dlfcn.h>

#include "platform/Module.h"

namespace port {

namespace {

/// The module is never closed: its code must be there as long as any thread may still be in it.
appsync::platform::ModuleEntryPoint entryPointOf(const std::string& path) {
  void* module = dlopen(path.c_str(), RTLD_NOW | RTLD_LOCAL);
  if (module == nullptr) throw std::runtime_error(dlerror());
  void* entryPoint = dlsym(module, appsync::platform::kModuleEntryPointName);
  if (entryPoint == nullptr) throw std::runtime_error(path + " is no sync plug-in: " + dlerror());
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
    throw std::runtime_error(path + " is of interface version " + std::to_string(answer.interfaceVersion) +
                             ", this daemon of " + std::to_string(kModuleInterfaceVersion));
  }
  if (client == nullptr) throw std::runtime_error(path + ": " + answer.refusal);
  return client;
}

}  // namespace port
