#include "base/TimeText.h"

#include <ctime>

namespace appsync {

void appendTime(std::string& out, std::chrono::sys_time<std::chrono::microseconds> time) {
  const auto seconds = std::chrono::floor<std::chrono::seconds>(time);
  const std::time_t stamp = std::chrono::system_clock::to_time_t(seconds);
  std::tm parts{};
  gmtime_r(&stamp, &parts);
  char text[64];
  out.append(text, std::strftime(text, sizeof text, "%Y-%m-%dT%H:%M:%S", &parts));
  const std::string fraction = std::to_string(1'000'000 + (time - seconds).count());
  out.append(".").append(fraction, 1).append("Z");
}

}  // namespace appsync
