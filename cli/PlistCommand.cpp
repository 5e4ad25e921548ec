#include <memory>
#include <string>

#include <CLI/CLI.hpp>

#include "cli/Commands.h"
#include "cli/Printable.h"
#include "cli/PropertyListJson.h"
#include "cli/StandardOutput.h"
#include "device/storage/HostFile.h"
#include "plist/PropertyList.h"

namespace appsync::cli {
namespace {

struct PlistOptions {
  std::string file;
  std::string form = "xml";
  std::string output = device::kStandardStream;
};

constexpr const char* kExamples =
    R"(Reads the binary, the XML and the old text form, told apart by their content. In JSON data is base64 text,
a date ISO 8601 text, and a uid {"CF$UID": number}.

Examples:
  appsync plist Info.plist
  appsync plist Info.plist --to binary -o Info.binary.plist
  appsync plist ApplicationsSync.plist --to json | jq '.[].identifier')";

Bytes bytesIn(const std::string& text) {
  const ByteView bytes = bytesOf(text);
  return {bytes.begin(), bytes.end()};
}

/// JSON repeats shared content. Fails where the XML form does.
Result<Bytes> json(const plist::Value& value) {
  if (plist::expandedSize(value) > plist::kMaximumExpandedSize) {
    return Error{std::string(domains::kPropertyList), static_cast<long>(plist::Failure::tooLarge),
                 "Too many values for one document", nullptr};
  }
  return bytesIn(indented(toJson(value)) + "\n");
}

Result<Bytes> converted(const plist::Value& value, const std::string& form) {
  if (form == "binary") return plist::writeBinary(value);
  if (form == "json") return json(value);
  const Result<Bytes> xml = plist::writeXML(value);
  return xml ? bytesIn(withReferences(std::string(textOf(*xml)), Notation::xml)) : xml;
}

ExitStatus run(const PlistOptions& options) {
  if (options.form == "binary" && isForTerminal(options.output, "the binary form")) return ExitStatus::wrongUsage;
  const Result<Bytes> document = device::readHostStream(options.file);
  if (!document) return reportUnusable(document.error());
  const Result<plist::Value> value = plist::read(*document);
  if (!value) return reportUnusable(value.error().in(options.file + " is not a property list that can be read"));
  const Result<Bytes> output = converted(*value, options.form);
  if (!output) return reportUnusable(output.error().in(options.file + " has no " + options.form + " form"));
  const Status written = device::writeHostFile(options.output, *output);
  return written ? ExitStatus::done : reportUnusable(written.error());
}

}  // namespace

void addPlistCommand(CLI::App& line, Invocation& invocation) {
  const auto options = std::make_shared<PlistOptions>();
  CLI::App* command = line.add_subcommand("plist", "Convert a property list, or look into it.");
  command->add_option("FILE", options->file, "the property list; - is standard input")->required();
  command->add_option("--to", options->form, "the form to write: xml (when not said), binary or json")
      ->check(CLI::IsMember({"xml", "binary", "json"}));
  command->add_option("-o,--output", options->output, "write to this file instead of standard output");
  command->footer(kExamples);
  command->callback([options, &invocation] { invocation = [options] { return run(*options); }; });
}

}  // namespace appsync::cli
