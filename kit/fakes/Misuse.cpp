#include "kit/fakes/Misuse.h"

#include <gtest/gtest.h>

namespace appsync::test {

void misuse(std::string_view what) {
  ADD_FAILURE() << "misuse of the platform: " << what;
}

}  // namespace appsync::test
