// A set of bundle identifiers that several threads share.
#include <string>

#include <gtest/gtest.h>

#include "common/Identifiers.h"
#include "kit/fakes/Threads.h"

namespace appsync::test {

TEST(SharedIdentifierSet, HoldsEachIdentifierOnce) {
  SharedIdentifierSet set;
  set.insert("com.b");
  set.insert("com.a");
  set.insert("com.b");
  EXPECT_EQ(set.size(), 2U);
  EXPECT_EQ(set.identifiers(), (Identifiers{"com.a", "com.b"}));
}

TEST(SharedIdentifierSet, ForgetsWhatIsErased) {
  SharedIdentifierSet set;
  set.insert("com.a");
  set.insert("com.b");
  set.erase("com.a");
  set.erase("com.unknown");
  EXPECT_EQ(set.identifiers(), Identifiers{"com.b"});
  set.clear();
  EXPECT_EQ(set.size(), 0U);
}

TEST(SharedIdentifierSet, ACopyOfItsIdentifiersStaysAsItWas) {
  SharedIdentifierSet set;
  set.insert("com.a");
  const Identifiers before = set.identifiers();
  set.clear();
  EXPECT_EQ(before, Identifiers{"com.a"});
}

TEST(SharedIdentifierSet, ThreadsLoseNothing) {
  SharedIdentifierSet set;
  runOnThreads(8, [&](std::size_t thread) {
    for (int number = 0; number < 100; ++number) {
      const std::string identifier = std::to_string(thread) + "." + std::to_string(number);
      set.insert(identifier);
      if (number % 2 == 0) set.erase(identifier);
      EXPECT_GE(set.identifiers().size(), static_cast<std::size_t>(number / 2));
    }
  });
  EXPECT_EQ(set.size(), 400U);
}

}  // namespace appsync::test
