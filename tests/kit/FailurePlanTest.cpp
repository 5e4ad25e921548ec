#include <gtest/gtest.h>

#include "kit/fakes/FailurePlan.h"

namespace appsync::test {
namespace {

enum class Operation { read, write };

Error numbered(long code) {
  return {"Test", code, "injected", nullptr};
}

TEST(FailurePlan, InitiallyNothingFails) {
  FailurePlan<Operation> plan;
  EXPECT_EQ(plan.take(Operation::read, "/a"), std::nullopt);
}

TEST(FailurePlan, FailNextFailsOneCall) {
  FailurePlan<Operation> plan;
  plan.failNext(Operation::read, "/a", numbered(1));
  plan.failNext(Operation::read, "/a", numbered(2));
  EXPECT_EQ(plan.take(Operation::read, "/a"), numbered(1));
  EXPECT_EQ(plan.take(Operation::read, "/a"), numbered(2));
  EXPECT_EQ(plan.take(Operation::read, "/a"), std::nullopt);
}

TEST(FailurePlan, OtherOperationsAndSubjectsDoNotFail) {
  FailurePlan<Operation> plan;
  plan.failAlways(Operation::read, "/a", numbered(1));
  EXPECT_EQ(plan.take(Operation::write, "/a"), std::nullopt);
  EXPECT_EQ(plan.take(Operation::read, "/b"), std::nullopt);
  EXPECT_EQ(plan.take(Operation::read, "/a"), numbered(1));
  EXPECT_EQ(plan.take(Operation::read, "/a"), numbered(1));
}

TEST(FailurePlan, FailNextPrecedesFailAlways) {
  FailurePlan<Operation> plan;
  plan.failAlways(Operation::read, "/a", numbered(1));
  plan.failNext(Operation::read, "/a", numbered(2));
  EXPECT_EQ(plan.take(Operation::read, "/a"), numbered(2));
  EXPECT_EQ(plan.take(Operation::read, "/a"), numbered(1));
}

TEST(FailurePlan, AnythingMatchesEverySubject) {
  FailurePlan<Operation> plan;
  plan.failNext(Operation::write, kAnything, numbered(1));
  EXPECT_EQ(plan.take(Operation::write, "/whatever"), numbered(1));
  EXPECT_EQ(plan.take(Operation::write, "/whatever"), std::nullopt);
}

TEST(FailurePlan, FailingCanBeStopped) {
  FailurePlan<Operation> plan;
  plan.failAlways(Operation::read, "/a", numbered(1));
  plan.stopFailing();
  EXPECT_EQ(plan.take(Operation::read, "/a"), std::nullopt);
}

}  // namespace
}  // namespace appsync::test
