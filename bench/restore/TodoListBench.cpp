// What one app's new word in a todo list of 10,000 costs, next to reading the file and writing the same bytes to a new
// one in its place. Neither waits for the disk.
#include <cstdio>
#include <filesystem>
#include <memory>
#include <string>
#include <string_view>

#include <benchmark/benchmark.h>
#include <fcntl.h>
#include <sys/stat.h>
#include <unistd.h>

#include "bench/plist/PropertyListCorpora.h"
#include "core/AppsClient.h"
#include "kit/fakes/FakePlatform.h"
#include "plist/PropertyList.h"

namespace appsync::bench {
namespace {

/// A file system in which every path is the same real file.
class OneFile final : public test::FakeFileSystem {
 public:
  OneFile(test::CallJournal& journal, ByteView content) : FakeFileSystem(journal) {
    std::string folder = (std::filesystem::temp_directory_path() / "todobench.XXXXXX").string();
    folder_ = mkdtemp(folder.data());
    if (!writeFileAtomically({}, content)) std::abort();
  }
  ~OneFile() override { std::filesystem::remove_all(folder_); }
  OneFile(const OneFile&) = delete;
  OneFile& operator=(const OneFile&) = delete;

  [[nodiscard]] Result<Bytes> readFile(std::string_view) override {
    const int file = open(path().c_str(), O_RDONLY | O_CLOEXEC);
    struct stat status {};
    fstat(file, &status);
    Bytes bytes(static_cast<std::size_t>(status.st_size));
    const auto count = ::read(file, bytes.data(), bytes.size());
    close(file);
    if (count != static_cast<ssize_t>(bytes.size())) return Error::fromErrno(EIO);
    return bytes;
  }
  [[nodiscard]] Status writeFileAtomically(std::string_view, ByteView bytes) override {
    const std::string draft = path() + ".new";
    const int file = open(draft.c_str(), O_WRONLY | O_CREAT | O_TRUNC | O_CLOEXEC, 0644);
    const auto count = ::write(file, bytes.data(), bytes.size());
    close(file);
    if (count != static_cast<ssize_t>(bytes.size()) || std::rename(draft.c_str(), path().c_str()) != 0) {
      return Error::fromErrno(EIO);
    }
    return {};
  }

 private:
  [[nodiscard]] std::string path() const { return folder_ / "todo.plist"; }

  std::filesystem::path folder_;
};

const plist::Value& todoList() {
  static const Documents documents = makeTodo();
  return documents[0];
}

Bytes todoFile() {
  return *plist::writeBinary(todoList());
}

void rewriteFile(benchmark::State& state) {
  test::CallJournal journal;
  OneFile file(journal, todoFile());
  for (auto _ : state) {
    if (!file.writeFileAtomically({}, *file.readFile({}))) return state.SkipWithError("cannot write");
  }
}
BENCHMARK(rewriteFile)->Name("TodoList/rewriteFile")->Unit(benchmark::kMicrosecond);

void changeAssetID(benchmark::State& state) {
  test::FakePlatform platform;
  OneFile file(platform.journal, todoFile());
  platform.use(file);
  platform.log.disable(8);
  const auto client = AppsClient::create(platform);
  const std::string identifier(*todoList().array()->at(7777).find("identifier")->string());
  bool isSent = false;
  for (auto _ : state) {
    isSent = !isSent;
    client->changeAssetID(identifier, isSent ? "SENT" : "INSTALLED");
  }
  if (client->_operationStateForIdentifier(identifier) != plist::Value(isSent ? "SENT" : "INSTALLED")) {
    state.SkipWithError("the entry did not change");
  }
}
BENCHMARK(changeAssetID)->Name("TodoList/changeAssetID")->Unit(benchmark::kMicrosecond);

}  // namespace
}  // namespace appsync::bench
