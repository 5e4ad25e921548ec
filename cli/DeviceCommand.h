// Commands that open a device.
#pragma once

#include <functional>
#include <memory>
#include <string>

#include <CLI/CLI.hpp>

#include "cli/Commands.h"
#include "cli/ExitStatus.h"
#include "device/Device.h"

namespace appsync::cli {

/// Adds the positional DEVICE to a command.
void addDevice(CLI::App& command, std::string& path);

/// Opens the device and calls `work`. Reports a device that cannot be opened.
[[nodiscard]] ExitStatus withDevice(const std::string& path, device::Access access,
                                    const std::function<ExitStatus(device::Device&)>& work);

/// A command's name, its one-line purpose, and the text below the options in its help.
struct CommandText {
  const char* name;
  const char* purpose;
  const char* examples;
};

/// An added command, to which the caller adds its further options.
template <class Options>
struct AddedCommand {
  CLI::App& command;
  std::shared_ptr<Options> options;
};

/// Adds a command that opens a device and calls `run`. The options exist as long as the command line; their member
/// `device` is bound to DEVICE.
template <class Options>
AddedCommand<Options> addDeviceCommand(CLI::App& line, Invocation& invocation, const CommandText& text,
                                       device::Access access, ExitStatus (*run)(const Options&, device::Device&)) {
  const auto options = std::make_shared<Options>();
  CLI::App* command = line.add_subcommand(text.name, text.purpose);
  addDevice(*command, options->device);
  command->footer(text.examples);
  command->callback([options, access, run, &invocation] {
    invocation = [options, access, run] {
      return withDevice(options->device, access, [&](device::Device& device) { return run(*options, device); });
    };
  });
  return {*command, options};
}

/// As `addDeviceCommand`, for a command that only reads a device, with the flag --json bound to the member `json`.
template <class Options>
void addListingCommand(CLI::App& line, Invocation& invocation, const CommandText& text,
                       ExitStatus (*run)(const Options&, device::Device&)) {
  const auto added = addDeviceCommand(line, invocation, text, device::Access::readOnly, run);
  added.command.add_flag("--json", added.options->json, "write JSON");
}

}  // namespace appsync::cli
