// Resources of an idle plug-in.
#include <algorithm>
#include <filesystem>
#include <string_view>

#include <gtest/gtest.h>
#include <link.h>

#include "generated/BuildPaths.h"
#include "kit/fakes/FakePlatform.h"
#include "tests/module/LoadedModule.h"
#include "tests/support/HeldMemory.h"

namespace appsync::test {

namespace {

constexpr std::size_t kMostOfItsOwn = 2 * 1024 * 1024;

/// Bytes of the loaded module's variables: the writable segments of its file.
std::size_t writableBytes() {
  std::size_t bytes = 0;
  ::dl_iterate_phdr(
      [](dl_phdr_info* object, std::size_t, void* sum) {
        if (!std::string_view(object->dlpi_name).ends_with("/AppsClient.so")) return 0;
        for (const ElfW(Phdr)* part = object->dlpi_phdr; part != object->dlpi_phdr + object->dlpi_phnum; ++part) {
          if (part->p_type == PT_LOAD && (part->p_flags & PF_W) != 0) *static_cast<std::size_t*>(sum) += part->p_memsz;
        }
        return 1;
      },
      &bytes);
  return bytes;
}

bool isInstrumented() {
  return *kInstrumentation != '\0';
}

std::ptrdiff_t threads() {
  const std::filesystem::directory_iterator tasks("/proc/self/task");
  return std::distance(begin(tasks), end(tasks));
}

class Idle : public testing::Test {
 protected:
  FakePlatform platform;
  /// The fakes allocate memory and threads for their first client; a second client measures the plug-in alone.
  const std::shared_ptr<platform::ZTClient> first = makeModuleClient(platform);
};

TEST_F(Idle, ClientHoldsLittleMemory) {
  const std::ptrdiff_t before = memory::held;
  const auto client = makeModuleClient(platform);
  const auto held = static_cast<std::size_t>(memory::held - before);
  EXPECT_GT(held, sizeof(platform::ZTClient)) << "the module's memory is not measured";
  EXPECT_GT(writableBytes(), 0);
  // Instrumentation needs memory of its own.
  const std::size_t variables = isInstrumented() ? 0 : writableBytes();
  EXPECT_LT(held + variables, kMostOfItsOwn);
}

TEST_F(Idle, ClientStartsNoThread) {
  const std::ptrdiff_t before = threads();
  const auto client = makeModuleClient(platform);
  EXPECT_EQ(threads(), before);
}

}  // namespace

}  // namespace appsync::test
