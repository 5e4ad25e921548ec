#include <cerrno>
#include <memory>
#include <optional>
#include <string>

#include <gtest/gtest.h>

#include "base/Error.h"

namespace appsync::test {
namespace {

std::string described(const Error& error) {
  std::string out;
  appendDescription(out, error);
  return out;
}

TEST(Error, SystemErrorHasDomainNumberAndDescription) {
  const Error error = Error::fromErrno(ENOENT);
  EXPECT_EQ(error.domain, "POSIX");
  EXPECT_EQ(error.code, ENOENT);
  EXPECT_EQ(error.text, "No such file or directory");
  EXPECT_EQ(error.underlying, nullptr);
}

TEST(Error, SystemErrorPutsTheContextFirst) {
  EXPECT_EQ(Error::fromErrno(EACCES, "/var/mobile").text, "/var/mobile: Permission denied");
}

TEST(Error, UnknownSystemErrorNumberStillHasAText) {
  EXPECT_EQ(Error::fromErrno(99999).text, "Unknown error 99999");
}

TEST(Error, ContextKeepsDomainCodeAndUnderlyingError) {
  const auto cause = std::make_shared<const Error>(Error{"Store", 2, "inner", nullptr});
  const Error error{"ZTError", 29, "given up", cause};
  const Error wider = error.in("restore").in("sync");
  EXPECT_EQ(wider, (Error{"ZTError", 29, "sync: restore: given up", nullptr}));
  EXPECT_EQ(wider.underlying, cause);
  EXPECT_EQ(error.text, "given up");
}

TEST(Error, EqualityLooksAtDomainCodeAndTextOnly) {
  const Error error{"ZTError", 1, "text", nullptr};
  EXPECT_EQ(error, (Error{"ZTError", 1, "text", std::make_shared<const Error>(error)}));
  EXPECT_NE(error, (Error{"POSIX", 1, "text", nullptr}));
  EXPECT_NE(error, (Error{"ZTError", 2, "text", nullptr}));
  EXPECT_NE(error, (Error{"ZTError", 1, "other", nullptr}));
}

TEST(Error, DescriptionNamesDomainCodeAndText) {
  EXPECT_EQ(described(Error{"ZTError", -7, "went wrong", nullptr}), "ZTError -7 \"went wrong\"");
}

TEST(Error, DescriptionNestsTheUnderlyingErrorsInBraces) {
  const auto innermost = std::make_shared<const Error>(Error{"C", 3, "third", nullptr});
  const auto inner = std::make_shared<const Error>(Error{"B", 2, "second", innermost});
  EXPECT_EQ(described(Error{"A", 1, "first", inner}), "A 1 \"first\" {B 2 \"second\" {C 3 \"third\"}}");
}

TEST(Error, DescriptionIsAppended) {
  std::string out = "err=";
  appendDescription(out, Error{"A", 1, "first", nullptr});
  EXPECT_EQ(out, "err=A 1 \"first\"");
}

TEST(Error, SlotTakesErrorUnlessNull) {
  std::optional<Error> slot;
  setError(&slot, Error{"A", 1, "first", nullptr});
  EXPECT_EQ(slot, (Error{"A", 1, "first", nullptr}));
  setError(nullptr, Error{"A", 1, "first", nullptr});
}

TEST(Result, HoldsAValueOrAnError) {
  const Result<std::string> value = std::string("text");
  ASSERT_TRUE(value.ok());
  EXPECT_EQ(*value, "text");
  EXPECT_EQ(value->size(), 4u);
  const Result<std::string> failure = Error{"A", 1, "first", nullptr};
  ASSERT_FALSE(failure);
  EXPECT_EQ(failure.error().text, "first");
}

TEST(Result, TakesValuesThatOnlyMove) {
  const Result<std::unique_ptr<int>> value = std::make_unique<int>(4);
  EXPECT_EQ(**value, 4);
}

TEST(Status, IsSuccessUnlessMadeFromAnError) {
  EXPECT_TRUE(Status().ok());
  EXPECT_EQ(Status().failure(), std::nullopt);
  const Status failure = Error{"A", 1, "first", nullptr};
  EXPECT_FALSE(failure);
  EXPECT_EQ(failure.error().code, 1);
}

}  // namespace
}  // namespace appsync::test
