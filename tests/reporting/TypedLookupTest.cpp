// Values of the types that they should have.
#include <algorithm>
#include <vector>

#include <gtest/gtest.h>

#include "reporting/TypedLookup.h"
#include "tests/support/ClientFixture.h"

namespace appsync::test {
namespace {

class TypedLookup : public ClientFixture {
 protected:
  [[nodiscard]] const plist::Value* lookup(const plist::Value* value, ExpectedType type) {
    return typedLookup(value, type, "AltDSID", log_);
  }
  /// That only these are of that type; each other one is refused with one line.
  void expectOnly(ExpectedType type, const std::vector<plist::Type>& accepted) {
    for (const plist::Value& value : oneOfEachType()) {
      SCOPED_TRACE(static_cast<int>(value.type()));
      platform.log.clear();
      const bool isAccepted = std::ranges::find(accepted, value.type()) != accepted.end();
      EXPECT_EQ(lookup(&value, type), isAccepted ? &value : nullptr);
      const LogLines refusal{{0, LogLevel::error, "unexpected type for AltDSID"}};
      EXPECT_TRUE(sameLines(isAccepted ? LogLines() : refusal, platform.log.lines()));
    }
  }
  [[nodiscard]] static std::vector<plist::Value> oneOfEachType() {
    return {plist::Value(true),
            plist::Value(7),
            plist::Value(7.5),
            plist::Value("text"),
            plist::Value::data({}),
            plist::Value(plist::Date{7}),
            plist::Value(plist::Uid{7}),
            plist::Value(plist::Array{"text"}),
            plist::Value(plist::Dictionary{}),
            plist::Value()};
  }

 private:
  const PlugInLog log_{platform.framework};
};

TEST_F(TypedLookup, AMissingValueIsNoneWithoutAWord) {
  for (const ExpectedType type : {ExpectedType::string, ExpectedType::number, ExpectedType::dictionary})
    EXPECT_EQ(lookup(nullptr, type), nullptr);
  EXPECT_TRUE(platform.log.lines().empty());
}

TEST_F(TypedLookup, OnlyAStringIsAString) {
  expectOnly(ExpectedType::string, {plist::Type::string});
}

TEST_F(TypedLookup, ANumberIsAnIntegerOrARealAndNoTruthValue) {
  expectOnly(ExpectedType::number, {plist::Type::integer, plist::Type::real});
}

TEST_F(TypedLookup, OnlyADictionaryIsADictionary) {
  expectOnly(ExpectedType::dictionary, {plist::Type::dictionary});
}

TEST_F(TypedLookup, ARefusalWhoseLevelIsOffIsNotWritten) {
  platform.log.disable(0, LogLevel::error);
  const plist::Value number = 7;
  EXPECT_EQ(lookup(&number, ExpectedType::string), nullptr);
  EXPECT_TRUE(platform.log.lines().empty());
}

}  // namespace
}  // namespace appsync::test
