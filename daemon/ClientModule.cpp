#include "daemon/ClientModule.h"

#include <cerrno>
#include <cstdlib>
#include <cstring>
#include <filesystem>
#include <string_view>

#include <dlfcn.h>

#include "platform/Module.h"

namespace appsync::daemon {
namespace {

constexpr const char* kModuleVariable = "APPSYNC_MODULE";
/// Relative to this program's directory, both in the build tree and where it is installed.
constexpr const char* kModuleFromProgram = APPSYNC_MODULE_FROM_PROGRAM;

using Client = std::shared_ptr<platform::ZTClient>;

Error refusal(const std::string& path, std::string_view reason) {
  return {std::string(domains::kPOSIX), ENOEXEC, "the plug-in " + path + " cannot be used: " + std::string(reason),
          nullptr};
}

/// Returns the error for a file that is not a usable plug-in.
Error wrongFile(const std::string& path, const std::string& reason) {
  return refusal(path,
                 reason + "; install the plug-in of this release there, or set " + kModuleVariable + " to its file");
}

/// Returns the dynamic loader's last error text without the path at its start.
std::string loaderError(const std::string& path) {
  const char* text = ::dlerror();
  std::string said = text == nullptr ? "unknown reason" : text;
  if (said.starts_with(path + ": ")) said.erase(0, path.size() + 2);
  return said;
}

Result<void*> entryPointOf(const std::string& path) {
  void* module = ::dlopen(path.c_str(), RTLD_NOW | RTLD_LOCAL);
  if (module == nullptr) return wrongFile(path, loaderError(path));
  void* entryPoint = ::dlsym(module, platform::kModuleEntryPointName);
  if (entryPoint != nullptr) return entryPoint;
  return wrongFile(path, std::string("it has no entry point ") + platform::kModuleEntryPointName);
}

}  // namespace

Result<std::string> modulePath() {
  const char* named = std::getenv(kModuleVariable);
  if (named != nullptr && *named != '\0') {
    std::error_code failure;
    const auto path = std::filesystem::absolute(named, failure);
    if (!failure) return path.string();
    return refusal(named,
                   "the current folder no longer exists; set " + std::string(kModuleVariable) + " to an absolute path");
  }
  std::error_code ignored;
  const auto program = std::filesystem::read_symlink("/proc/self/exe", ignored);
  return (program.parent_path() / kModuleFromProgram).lexically_normal().string();
}

Result<Client> makeClient(platform::Platform& platform) {
  const Result<std::string> path = modulePath();
  return path ? makeClient(platform, *path) : Result<Client>(path.error());
}

Result<Client> makeClient(platform::Platform& platform, const std::string& path) {
  const Result<void*> entryPoint = entryPointOf(path);
  if (!entryPoint) return entryPoint.error();
  const auto makeClientOf = reinterpret_cast<platform::ModuleEntryPoint>(*entryPoint);
  Client client;
  platform::ModuleAnswer answer;
  makeClientOf(platform::kModuleInterfaceVersion, &platform, &client, &answer);
  if (answer.interfaceVersion != platform::kModuleInterfaceVersion) {
    return wrongFile(path, "its interface version is " + std::to_string(answer.interfaceVersion) +
                               " and this program's " + std::to_string(platform::kModuleInterfaceVersion));
  }
  const std::string_view reason(answer.refusal, ::strnlen(answer.refusal, sizeof answer.refusal));
  if (client == nullptr)
    return refusal(path, reason.empty() ? "it refused to create a client without a reason" : reason);
  return client;
}

}  // namespace appsync::daemon
