#include <algorithm>
#include <cerrno>
#include <filesystem>
#include <memory>
#include <vector>

#include <CLI/CLI.hpp>

#include "cli/Commands.h"
#include "cli/Printable.h"
#include "cli/StandardOutput.h"
#include "device/packages/BundleInfo.h"
#include "device/packages/PackageReader.h"
#include "device/packages/PackageWriter.h"
#include "device/storage/HostFile.h"
#include "platform/Keys.h"
#include "platform/SyncFiles.h"
#include "plist/Access.h"

namespace appsync::cli {
namespace {

namespace fs = std::filesystem;

struct PackOptions {
  std::string folder;
  std::string output;
};

constexpr const char* kExamples =
    R"(APP-FOLDER is the app itself, Name.app with an Info.plist in it, or a folder with one Name.app and, optionally,
HarvoMetadata.plist and HarvoArtwork; other files next to the app are ignored. Info.plist is a dictionary with
BundleIdentifier, BundleVersion, BundleDisplayName and, optionally, BundleExecutable and BundleIconFile, which name
files of the app. The same app always results in the same bytes.

Without -o the package is Name-VERSION.zip in the current folder.

Examples:
  appsync pack Tides.app
  appsync pack samples/Tides -o lib/tides.zip)";

Error wrong(const fs::path& path, const std::string& reason) {
  return {std::string(domains::kPOSIX), EINVAL, path.string() + " " + reason, nullptr};
}

struct AppFolder {
  fs::path app;
  /// Paths of the app and of the files next to it that belong into the package.
  std::vector<std::string> items;
};

Result<std::vector<fs::path>> appsIn(const fs::path& folder) {
  std::error_code failure;
  std::vector<fs::path> apps;
  for (fs::directory_iterator entry(folder, failure); !failure && entry != fs::directory_iterator();
       entry.increment(failure)) {
    std::error_code unknown;
    if (entry->path().extension() == ".app" && entry->is_directory(unknown)) apps.push_back(entry->path());
  }
  if (failure) return Error::fromErrno(failure.value(), folder.string() + " cannot be read");
  return apps;
}

Result<AppFolder> findApp(const std::string& given) {
  std::error_code failure;
  const fs::path folder = fs::canonical(given, failure);
  if (failure) return Error::fromErrno(failure.value(), given + " cannot be read");
  if (folder.extension() == ".app") return AppFolder{folder, {folder.string()}};
  const Result<std::vector<fs::path>> apps = appsIn(folder);
  if (!apps) return apps.error();
  if (apps->empty())
    return wrong(given, "is not an app and has none in it; name a folder Name.app, or a folder that contains it");
  if (apps->size() > 1) return wrong(given, "contains several apps; name one of them");
  AppFolder found = {apps->front(), {apps->front().string()}};
  for (const std::string_view name : {kStoreMetadataName, kArtworkName}) {
    if (fs::exists(folder / name, failure)) found.items.push_back((folder / name).string());
  }
  return found;
}

/// Fails unless the info dictionary has a non-empty string under `key`.
Status requireText(const plist::Dictionary& info, std::string_view key, const fs::path& path) {
  const auto text = stringIn(info.find(key));
  if (text && !text->empty()) return {};
  return wrong(path, "has no text under " + std::string(key) + "; add it");
}

/// Fails if the info dictionary names a file under `key` that the app does not have.
Status requireFile(const plist::Dictionary& info, std::string_view key, const fs::path& app) {
  const plist::Value* value = info.find(key);
  if (value == nullptr) return {};
  const auto file = device::namedFileIn(app.string(), value);
  std::error_code failure;
  if (file && fs::is_regular_file(*file, failure)) return {};
  return wrong(app / kInfoPlistName, "names under " + std::string(key) +
                                         " a file that the app does not have; add the file or remove the key");
}

Result<device::BundleInfo> checkedInfo(const fs::path& app) {
  const fs::path path = app / kInfoPlistName;
  const Result<Bytes> bytes = device::readHostFile(path.string());
  if (!bytes) return bytes.error();
  Result<device::BundleInfo> info = device::readBundleInfo(*bytes);
  if (!info) return info.error().in(path.string());
  Status good;
  for (const std::string_view key : {platform::kBundleVersionKey, platform::kBundleDisplayNameKey}) {
    if (good) good = requireText(info->dictionary, key, path);
  }
  for (const std::string_view key : {platform::kBundleExecutableKey, platform::kBundleIconFileKey}) {
    if (good) good = requireFile(info->dictionary, key, app);
  }
  if (!good) return good.error();
  return info;
}

std::string defaultName(const fs::path& app, const device::BundleInfo& info) {
  std::string name = app.stem().string() + "-" + info.version.value_or("") + ".zip";
  std::ranges::replace(name, '/', '-');
  return name;
}

ExitStatus run(const PackOptions& options) {
  if (isForTerminal(options.output, "a package")) return ExitStatus::wrongUsage;
  const Result<AppFolder> folder = findApp(options.folder);
  if (!folder) return reportUnusable(folder.error());
  const Result<device::BundleInfo> info = checkedInfo(folder->app);
  if (!info) return reportUnusable(info.error());
  const std::string output = options.output.empty() ? defaultName(folder->app, *info) : options.output;
  if (Status packed = device::writePackage(folder->items, output); !packed) return reportUnusable(packed.error());
  if (output == device::kStandardStream) return ExitStatus::done;
  StandardOutput standardOutput;
  standardOutput.writeLine("Packed " + printable(info->displayName.value_or("")) + " " +
                           printable(info->version.value_or("")) + " as " + printable(output) + ".");
  return standardOutput.finish(ExitStatus::done);
}

}  // namespace

void addPackCommand(CLI::App& line, Invocation& invocation) {
  const auto options = std::make_shared<PackOptions>();
  CLI::App* command = line.add_subcommand("pack", "Create a package from an app's folder.");
  command->add_option("APP-FOLDER", options->folder, "the app")->required();
  command->add_option("-o,--output", options->output, "the package to write; - is standard output");
  command->footer(kExamples);
  command->callback([options, &invocation] { invocation = [options] { return run(*options); }; });
}

}  // namespace appsync::cli
