// Base of all contract suites. A suite tests that an implementation of a platform service fulfils the contract in its
// header.
//
// To test your own implementation, derive from the suite's subject in a test program that links the suites
// (`appsync::contracts` in CMake, `appsync-contracts` in pkg-config), and instantiate the suite there:
//
//     INSTANTIATE_TEST_SUITE_P(MyDevice, FileSystemContract,
//                              testing::Values(implementation<FileSystemSubject, MyFileSystemSubject>("MyDevice")),
//                              implementationName);
//
// The program runs only the suites that it instantiates; a program that instantiates none fails. Tests that need an
// operation which the subject does not support are skipped.
#pragma once

#include <functional>
#include <memory>
#include <ostream>
#include <string>
#include <utility>

#include <gtest/gtest.h>

namespace appsync::test {

/// An implementation under test. `make` returns a new subject in its initial state, independent of all others.
template <class Subject>
struct Implementation {
  std::string name;  ///< letters and digits
  std::function<std::unique_ptr<Subject>()> make;
};

template <class Subject>
std::ostream& operator<<(std::ostream& out, const Implementation<Subject>& implementation) {
  return out << implementation.name;
}

/// Returns an implementation whose subject is default-constructed.
template <class Subject, class Made>
[[nodiscard]] Implementation<Subject> implementation(std::string name) {
  return {std::move(name), [] { return std::make_unique<Made>(); }};
}

/// Name generator for INSTANTIATE_TEST_SUITE_P.
inline constexpr auto implementationName = [](const auto& info) { return info.param.name; };

/// Base of the suites' fixtures. Creates a new subject for each test.
template <class SubjectType>
class Contract : public testing::TestWithParam<Implementation<SubjectType>> {
 protected:
  using Subject = SubjectType;
  [[nodiscard]] Subject& subject() { return *subject_; }

 private:
  std::unique_ptr<Subject> subject_ = this->GetParam().make();
};

}  // namespace appsync::test
