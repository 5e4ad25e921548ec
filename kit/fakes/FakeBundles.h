// App bundles in the fake file system.
#pragma once

#include <memory>
#include <mutex>
#include <optional>
#include <set>
#include <string>

#include "kit/fakes/CallJournal.h"
#include "kit/fakes/FakeFileSystem.h"
#include "platform/Bundle.h"

namespace appsync::test {

/// By default the process has no bundle. Journal lines: "bundles.openBundle /path", "bundles.mainBundleIdentifier".
class FakeBundles final : public platform::Bundles {
 public:
  FakeBundles(CallJournal& journal, FakeFileSystem& files) : journal_(journal), files_(files) {}

  void setMainBundleIdentifier(std::optional<std::string> identifier);
  /// Makes all later attempts to open the directory as a bundle fail.
  void failOpening(std::string path);

  [[nodiscard]] std::unique_ptr<platform::Bundle> openBundle(const platform::FileLocation& location) override;
  [[nodiscard]] std::optional<std::string> mainBundleIdentifier() override;

 private:
  CallJournal& journal_;
  FakeFileSystem& files_;
  std::mutex mutex_;
  std::optional<std::string> mainIdentifier_;
  std::set<std::string> unreadable_;
};

}  // namespace appsync::test
