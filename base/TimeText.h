// Times as text.
#pragma once

#include <chrono>
#include <string>

namespace appsync {

/// Appends "2026-02-03T04:05:06.789012Z", in UTC.
void appendTime(std::string& out, std::chrono::sys_time<std::chrono::microseconds> time);

}  // namespace appsync
