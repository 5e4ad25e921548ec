// How fakes tell that a caller broke a platform contract.
#pragma once

#include <string_view>

namespace appsync::test {

/// Fails the running test. May be called on any thread.
void misuse(std::string_view what);

}  // namespace appsync::test
