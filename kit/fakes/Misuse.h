// How fakes tell that a caller broke a platform contract.
#pragma once

#include <string_view>

namespace appsync::test {

/// Fails the running test; outside of tests, as in a daemon on fakes, it says so on standard output. Threads: any.
void misuse(std::string_view what);

}  // namespace appsync::test
