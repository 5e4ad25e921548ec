#include "tests/module/LoadedModule.h"

#include <stdexcept>

#include <dlfcn.h>

#include "generated/BuildPaths.h"

namespace appsync::test {

platform::ModuleEntryPoint loadModule() {
  void* module = ::dlopen(kModule, RTLD_NOW | RTLD_LOCAL);
  if (module == nullptr) throw std::runtime_error(::dlerror());
  void* entryPoint = ::dlsym(module, platform::kModuleEntryPointName);
  if (entryPoint == nullptr) throw std::runtime_error(::dlerror());
  return reinterpret_cast<platform::ModuleEntryPoint>(entryPoint);
}

std::shared_ptr<platform::ZTClient> makeModuleClient(platform::Platform& platform) {
  std::shared_ptr<platform::ZTClient> client;
  platform::ModuleAnswer answer;
  loadModule()(platform::kModuleInterfaceVersion, &platform, &client, &answer);
  if (client == nullptr) throw std::runtime_error(answer.refusal);
  return client;
}

}  // namespace appsync::test
