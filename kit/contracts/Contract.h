// What all contract suites share. A suite holds an implementation of one platform service to what its header promises.
//
// To hold your own implementation to a suite, derive from the suite's subject in a test program that links the suites
// (`appsync::contracts` in CMake, `appsync-contracts` in pkg-config), and write there
//
//     INSTANTIATE_TEST_SUITE_P(MyDevice, FileSystemContract,
//                              testing::Values(implementation<FileSystemSubject, MyFileSystemSubject>("MyDevice")),
//                              implementationName);
//
// The program runs the suites that are instantiated in it and no others; one that instantiates none fails.
#pragma once

#include <functional>
#include <memory>
#include <ostream>
#include <string>
#include <utility>

#include <gtest/gtest.h>

namespace appsync::test {

/// An implementation under test. `make` gives a subject in its first state, independent of all others.
template <class Subject>
struct Implementation {
  std::string name;  ///< letters and digits
  std::function<std::unique_ptr<Subject>()> make;
};

template <class Subject>
std::ostream& operator<<(std::ostream& out, const Implementation<Subject>& implementation) {
  return out << implementation.name;
}

/// An implementation whose subject is made without arguments.
template <class Subject, class Made>
[[nodiscard]] Implementation<Subject> implementation(std::string name) {
  return {std::move(name), [] { return std::make_unique<Made>(); }};
}

/// Names instantiated tests after the implementation.
inline constexpr auto implementationName = [](const auto& info) { return info.param.name; };

/// Base of the suites' fixtures: a new subject for each test.
template <class SubjectType>
class Contract : public testing::TestWithParam<Implementation<SubjectType>> {
 protected:
  using Subject = SubjectType;
  [[nodiscard]] Subject& subject() { return *subject_; }

 private:
  std::unique_ptr<Subject> subject_ = this->GetParam().make();
};

}  // namespace appsync::test
