// How fast property lists are read and written, next to a plain copy of their bytes. bench/figures.txt says how fast
// they must be. With APPSYNC_BENCH_CORPUS=FOLDER set, the documents are also put there for peers.
#include <map>

#include <benchmark/benchmark.h>
#include <sys/mman.h>

#include "bench/plist/PropertyListCorpora.h"
#include "plist/PropertyList.h"

namespace appsync::bench {

namespace {

struct Form {
  std::string_view name;
  Result<plist::Value> (*read)(ByteView);
  Result<Bytes> (*write)(const plist::Value&);
};
constexpr std::array<Form, 2> kForms = {
    {{"binary", plist::readBinary, plist::writeBinary}, {"xml", plist::readXML, plist::writeXML}}};

/// Made when a benchmark first asks for it.
class Corpus {
 public:
  Corpus(std::string name, Documents (*make)()) : name_(std::move(name)), make_(make) {}

  [[nodiscard]] const std::string& name() const noexcept { return name_; }
  const Documents& documents() {
    if (documents_.empty()) documents_ = make_();
    return documents_;
  }
  const std::vector<Bytes>& files(const Form& form) {
    std::vector<Bytes>& files = files_[form.name];
    if (files.empty()) {
      for (const plist::Value& document : documents())
        files.push_back(*form.write(document));
    }
    return files;
  }

 private:
  std::string name_;
  Documents (*make_)();
  Documents documents_;
  std::map<std::string_view, std::vector<Bytes>> files_;
};
std::array<Corpus, 3> corpora = {{{"todo", makeTodo}, {"metadata", makeMetadata}, {"restore", makeRestore}}};

std::size_t totalSize(const std::vector<Bytes>& files) {
  std::size_t size = 0;
  for (const Bytes& file : files)
    size += file.size();
  return size;
}

void countBytes(benchmark::State& state, const std::vector<Bytes>& files) {
  state.SetBytesProcessed(static_cast<std::int64_t>(totalSize(files)) * static_cast<std::int64_t>(state.iterations()));
}

void parse(benchmark::State& state, const Form& form, const std::vector<Bytes>& files) {
  for (auto _ : state) {
    for (const Bytes& file : files) {
      const auto value = form.read(file);
      if (!value) return state.SkipWithError(value.error().text.c_str());
    }
  }
  countBytes(state, files);
}

void serialise(benchmark::State& state, const Form& form, const Documents& documents, const std::vector<Bytes>& files) {
  for (auto _ : state) {
    for (const plist::Value& document : documents) {
      const auto bytes = form.write(document);
      if (!bytes) return state.SkipWithError(bytes.error().text.c_str());
    }
  }
  countBytes(state, files);
}

/// What any reader or writer must at least do: put the bytes into memory that nobody has touched before.
void copy(benchmark::State& state, const std::vector<Bytes>& files) {
  for (auto _ : state) {
    for (const Bytes& file : files) {
      void* fresh = mmap(nullptr, file.size(), PROT_READ | PROT_WRITE, MAP_PRIVATE | MAP_ANONYMOUS, -1, 0);
      if (fresh == MAP_FAILED) return state.SkipWithError("no memory");
      std::memcpy(fresh, file.data(), file.size());
      benchmark::DoNotOptimize(fresh);
      munmap(fresh, file.size());
    }
  }
  countBytes(state, files);
}

template <class Body>
void add(const std::string& name, Body body) {
  benchmark::RegisterBenchmark(("PropertyList/" + name).c_str(), std::move(body))->Unit(benchmark::kMicrosecond);
}

void addForm(Corpus& corpus, const Form& form) {
  const std::string suffix = "/" + corpus.name() + "/" + std::string(form.name);
  add("parse" + suffix, [&](benchmark::State& state) { parse(state, form, corpus.files(form)); });
  add("serialise" + suffix,
      [&](benchmark::State& state) { serialise(state, form, corpus.documents(), corpus.files(form)); });
  add("copy" + suffix, [&](benchmark::State& state) { copy(state, corpus.files(form)); });
}

const bool kAdded = [] {
  const char* folder = std::getenv("APPSYNC_BENCH_CORPUS");
  for (Corpus& corpus : corpora) {
    for (const Form& form : kForms) {
      addForm(corpus, form);
      if (folder != nullptr)
        exportDocuments(std::filesystem::path(folder) / corpus.name(), form.name, corpus.files(form));
    }
  }
  return true;
}();

}  // namespace

}  // namespace appsync::bench
