#include <algorithm>

#include "cli/Commands.h"
#include "cli/DeviceCommand.h"
#include "cli/Json.h"
#include "cli/Printable.h"
#include "cli/StandardOutput.h"
#include "device/apps/AppTable.h"
#include "host/DeviceApps.h"

namespace appsync::cli {
namespace {

struct AppsOptions {
  std::string device;
  bool json = false;
};

constexpr const char* kExamples =
    R"(With --json: an array of {identifier, name, version, type, placeholder, installType, bytes}.

Examples:
  appsync apps phone
  appsync apps phone --json | jq -r '.[].identifier')";

Json toJson(const std::vector<host::DeviceApp>& apps) {
  Json list = Json::array();
  for (const host::DeviceApp& app : apps) {
    list.push_back({{"identifier", app.name.identifier},
                    {"name", app.name.name},
                    {"version", app.name.version.empty() ? Json(nullptr) : Json(app.name.version)},
                    {"type", app.type},
                    {"placeholder", app.isPlaceholder},
                    {"installType", static_cast<std::uint64_t>(app.installType)},
                    {"bytes", app.bytes}});
  }
  return list;
}

std::string_view stateOf(const host::DeviceApp& app) {
  if (!app.isPlaceholder) return "installed";
  if (app.isInstalled) return "being updated";
  return device::isDemotion(app.installType) ? "demoted" : "waiting for its package";
}

constexpr std::size_t kWidest = 40;

void writeTable(StandardOutput& output, const std::vector<host::DeviceApp>& apps) {
  std::size_t name = 4;
  std::size_t version = 7;
  std::size_t identifier = 10;
  const auto widen = [](std::size_t& column, const std::string& text) {
    column = std::max(column, std::min(kWidest, displayWidth(printable(text, kWidest))));
  };
  for (const host::DeviceApp& app : apps) {
    widen(name, app.name.name);
    widen(version, app.name.version);
    widen(identifier, app.name.identifier);
  }
  const auto writeRow = [&](std::string_view a, std::string_view b, std::string_view c, std::string_view d,
                            std::string_view e) {
    const std::string size = std::string(10 - std::min<std::size_t>(10, d.size()), ' ') + std::string(d);
    output.writeLine(fitted(a, name) + "  " + fitted(b, version) + "  " + fitted(c, identifier) + "  " + size + "  " +
                     std::string(e));
  };
  writeRow("NAME", "VERSION", "IDENTIFIER", "SIZE", "STATE");
  for (const host::DeviceApp& app : apps) {
    writeRow(app.name.name, app.name.version, app.name.identifier, byteCount(app.bytes), stateOf(app));
  }
}

ExitStatus run(const AppsOptions& options, device::Device& device) {
  const Result<std::vector<host::DeviceApp>> apps = host::appsOn(device);
  if (!apps) return reportUnusable(apps.error());
  StandardOutput output;
  if (options.json) {
    output.writeLine(indented(toJson(*apps)));
  } else if (apps->empty()) {
    output.writeLine("No apps.");
  } else {
    writeTable(output, *apps);
  }
  return output.finish(ExitStatus::done);
}

}  // namespace

void addAppsCommand(CLI::App& line, Invocation& invocation) {
  addListingCommand(line, invocation, {"apps", "List the apps on a device.", kExamples}, run);
}

}  // namespace appsync::cli
