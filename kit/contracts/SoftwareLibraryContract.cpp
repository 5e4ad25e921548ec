#include "kit/contracts/SoftwareLibraryContract.h"

#include <optional>

#include "kit/contracts/EventCounter.h"

namespace appsync::test {

GTEST_ALLOW_UNINSTANTIATED_PARAMETERIZED_TEST(SoftwareLibraryContract);

TEST_P(SoftwareLibraryContract, RefreshCompletesOnce) {
  EventCounter completions;
  std::optional<Error> failure = Error{};
  auto library = subject().makeLibrary();
  ASSERT_NE(library, nullptr);
  library->refreshReceipts([&](const std::optional<Error>& error) {
    failure = error;
    completions.add();
  });
  ASSERT_TRUE(completions.waitFor(1));
  EXPECT_FALSE(failure);
  library.reset();
  EXPECT_EQ(completions.count(), 1U);
}

TEST_P(SoftwareLibraryContract, FailedRefreshReturnsAnError) {
  if (!subject().failRefreshes()) GTEST_SKIP() << "the subject cannot fail refreshes";
  EventCounter completions;
  std::optional<Error> failure;
  const auto library = subject().makeLibrary();
  library->refreshReceipts([&](const std::optional<Error>& error) {
    failure = error;
    completions.add();
  });
  ASSERT_TRUE(completions.waitFor(1));
  ASSERT_TRUE(failure);
  EXPECT_FALSE(failure->domain.empty());
}

TEST_P(SoftwareLibraryContract, EveryRefreshCompletes) {
  EventCounter completions;
  const auto library = subject().makeLibrary();
  for (int round = 0; round < 3; ++round) {
    library->refreshReceipts([&](const std::optional<Error>&) { completions.add(); });
  }
  EXPECT_TRUE(completions.waitFor(3));
}

TEST_P(SoftwareLibraryContract, CompletionCanDestroyTheLibrary) {
  EventCounter completions;
  std::shared_ptr<platform::SoftwareLibrary> library = subject().makeLibrary();
  platform::SoftwareLibrary& stillHeld = *library;
  stillHeld.refreshReceipts([&completions, owner = std::move(library)](const std::optional<Error>&) mutable {
    owner.reset();
    completions.add();
  });
  EXPECT_TRUE(completions.waitFor(1));
}

TEST_P(SoftwareLibraryContract, LibrariesAreIndependent) {
  EventCounter completions;
  const auto first = subject().makeLibrary();
  const auto second = subject().makeLibrary();
  first->refreshReceipts([&](const std::optional<Error>&) { completions.add(); });
  second->refreshReceipts([&](const std::optional<Error>&) { completions.add(); });
  EXPECT_TRUE(completions.waitFor(2));
}

}  // namespace appsync::test
