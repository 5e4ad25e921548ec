// Reads the input as a line to a running sync, and as its answer. What reads must come out again as it was.
#include <cstddef>
#include <cstdint>
#include <cstdlib>
#include <string_view>

#include "daemon/control/Protocol.h"

namespace {

using namespace appsync::daemon;

void require(bool condition) {
  if (!condition) std::abort();
}

std::string_view withoutEnd(std::string_view line) {
  require(line.size() <= kLongestControlLine && line.find('\n') == line.size() - 1);
  return line.substr(0, line.size() - 1);
}

}  // namespace

extern "C" int LLVMFuzzerTestOneInput(const std::uint8_t* data, std::size_t size) {
  const std::string_view line(reinterpret_cast<const char*>(data), size);
  if (const auto request = readRequest(line)) {
    require(readRequest(withoutEnd(lineOf(*request))) == request);
  }
  if (const auto answer = readAnswer(line)) {
    const auto again = readAnswer(withoutEnd(lineOf(*answer)));
    require(again && again->result == answer->result);
  }
  return 0;
}
