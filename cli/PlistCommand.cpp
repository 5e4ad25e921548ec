#include <memory>
#include <string>

#include <CLI/CLI.hpp>

#include "cli/Commands.h"
#include "cli/Json.h"
#include "cli/Printable.h"
#include "cli/StandardOutput.h"
#include "device/storage/HostFile.h"
#include "plist/PropertyList.h"

namespace appsync::cli {
namespace {

struct PlistOptions {
  std::string file;
  std::string format = "xml";
  std::string output = device::kStandardStream;
};

constexpr const char* kExamples =
    R"(Reads the binary, XML and ASCII formats, which it detects by their content. In JSON data is base64 text, a date
ISO 8601 text, and a uid {"CF$UID": number}.

Examples:
  appsync plist Info.plist
  appsync plist Info.plist --to binary -o Info.binary.plist
  appsync plist ApplicationsSync.plist --to json | jq '.[].identifier')";

Bytes bytesIn(const std::string& text) {
  const ByteView bytes = bytesOf(text);
  return {bytes.begin(), bytes.end()};
}

/// Converts to JSON, which repeats shared content. Fails if the result is too large, as the XML writer does.
Result<Bytes> json(const plist::Value& value) {
  if (plist::expandedSize(value) > plist::kMaximumExpandedSize) {
    return Error{std::string(domains::kPropertyList), static_cast<long>(plist::Failure::tooLarge),
                 "Too many values for one document", nullptr};
  }
  return bytesIn(indented(toJson(value)) + "\n");
}

Result<Bytes> converted(const plist::Value& value, const std::string& format) {
  if (format == "binary") return plist::writeBinary(value);
  if (format == "json") return json(value);
  const Result<Bytes> xml = plist::writeXML(value);
  return xml ? bytesIn(withReferences(std::string(textOf(*xml)), Notation::xml)) : xml;
}

ExitStatus run(const PlistOptions& options) {
  if (options.format == "binary" && isForTerminal(options.output, "the binary format")) return ExitStatus::wrongUsage;
  const Result<Bytes> document = device::readHostStream(options.file);
  if (!document) return reportUnusable(document.error());
  const Result<plist::Value> value = plist::read(*document);
  if (!value) return reportUnusable(value.error().in(options.file + " cannot be read as a property list"));
  const Result<Bytes> output = converted(*value, options.format);
  if (!output) return reportUnusable(output.error().in(options.file + " cannot be converted to " + options.format));
  const Status written = device::writeHostFile(options.output, *output);
  return written ? ExitStatus::done : reportUnusable(written.error());
}

}  // namespace

void addPlistCommand(CLI::App& line, Invocation& invocation) {
  const auto options = std::make_shared<PlistOptions>();
  CLI::App* command = line.add_subcommand("plist", "Convert or show a property list.");
  command->add_option("FILE", options->file, "the property list; - is standard input")->required();
  command->add_option("--to", options->format, "the format to write: xml (default), binary or json")
      ->check(CLI::IsMember({"xml", "binary", "json"}));
  command->add_option("-o,--output", options->output, "write to this file instead of standard output");
  command->footer(kExamples);
  command->callback([options, &invocation] { invocation = [options] { return run(*options); }; });
}

}  // namespace appsync::cli
