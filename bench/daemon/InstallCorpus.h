// The packages that installing is measured with, and the floor: a program that only unpacks them.
#pragma once

#include <atomic>
#include <filesystem>
#include <fstream>
#include <random>
#include <stdexcept>
#include <string>
#include <thread>
#include <vector>

#include <archive.h>
#include <archive_entry.h>
#include <benchmark/benchmark.h>
#include <fcntl.h>
#include <unistd.h>

#include "device/packages/PackageWriter.h"
#include "device/storage/FileDescriptor.h"

namespace appsync::bench {

namespace fs = std::filesystem;

inline constexpr int kPackages = 200;
inline constexpr int kFiles = 40;
inline constexpr std::size_t kFileBytes = 25'000;
inline constexpr int kThreads = 10;

inline void require(bool condition, const char* what) {
  if (!condition) throw std::runtime_error(what);
}

inline std::string identifierOf(int number) {
  return "com.example.app" + std::to_string(number);
}

/// The packages, made once and removed at the end.
class Library {
 public:
  Library() : folder_(fs::temp_directory_path() / ("appsync-bench-" + std::to_string(getpid()))) {
    fs::create_directories(folder_ / "packages");
    std::mt19937 random(7);
    for (int number = 0; number < kPackages; ++number)
      makePackage(number, random);
  }
  ~Library() { fs::remove_all(folder_); }

  [[nodiscard]] fs::path packages() const { return folder_ / "packages"; }
  [[nodiscard]] std::string package(int number) const { return packages() / (std::to_string(number) + ".zip"); }
  /// A path for one run's results.
  [[nodiscard]] fs::path fresh() { return folder_ / ("run" + std::to_string(++runs_)); }

 private:
  void makePackage(int number, std::mt19937& random) const {
    const fs::path app = folder_ / "Sample.app";
    fs::create_directories(app / "resources");
    std::ofstream(app / "Info.plist") << "{ BundleIdentifier = \"" << identifierOf(number)
                                      << "\"; BundleVersion = \"1.0\"; BundleDisplayName = Sample; }";
    std::string content(kFileBytes, ' ');
    for (int file = 1; file < kFiles; ++file) {
      // Some of it packs, as in apps: pictures hardly, texts well.
      for (std::size_t place = 0; place < content.size(); ++place) {
        content[place] = static_cast<char>(place % 4 == 0 ? 'x' : random());
      }
      std::ofstream(app / "resources" / std::to_string(file), std::ios::binary) << content;
    }
    require(device::writePackage({app}, package(number)).ok(), "a package cannot be written");
  }

  fs::path folder_;
  int runs_ = 0;
};

inline Library& library() {
  static Library packages;
  return packages;
}

/// Calls `work` with each number below kPackages, on ten threads.
template <class Work>
void onTenThreads(Work work) {
  std::atomic<int> next{0};
  std::vector<std::thread> threads;
  for (int thread = 0; thread < kThreads; ++thread) {
    threads.emplace_back([&] {
      for (int number = next++; number < kPackages; number = next++)
        work(number);
    });
  }
  for (std::thread& thread : threads)
    thread.join();
}

inline void writeEntry(archive* reader, const std::string& path) {
  const device::FileDescriptor file(open(path.c_str(), O_WRONLY | O_CREAT | O_EXCL | O_CLOEXEC, 0644));
  require(file.valid(), "a file cannot be made");
  const void* bytes = nullptr;
  std::size_t size = 0;
  la_int64_t offset = 0;
  while (archive_read_data_block(reader, &bytes, &size, &offset) == ARCHIVE_OK) {
    require(pwrite(file.get(), bytes, size, offset) == static_cast<ssize_t>(size), "a file cannot be written");
  }
}

/// The floor: unpacks, syncs as the device does, renames.
inline void unpackOnly(const std::string& package, const fs::path& target) {
  const fs::path draft = target.string() + ".tmp";
  fs::create_directory(draft);
  archive* reader = archive_read_new();
  archive_read_support_format_zip_seekable(reader);
  require(archive_read_open_filename(reader, package.c_str(), 1 << 16) == ARCHIVE_OK, "a package cannot be read");
  archive_entry* entry = nullptr;
  while (archive_read_next_header(reader, &entry) == ARCHIVE_OK) {
    const std::string path = draft / archive_entry_pathname(entry);
    if (archive_entry_filetype(entry) == AE_IFDIR) {
      fs::create_directory(path);
    } else {
      writeEntry(reader, path);
    }
  }
  archive_read_free(reader);
  const device::FileDescriptor folder(open(draft.c_str(), O_RDONLY | O_DIRECTORY));
  require(syncfs(folder.get()) == 0, "the file system cannot be synced");
  fs::rename(draft, target);
}

/// All packages, each into a folder of its own in `folder`, on ten threads.
inline void unpackAll(const fs::path& folder) {
  onTenThreads([&](int number) { unpackOnly(library().package(number), folder / std::to_string(number)); });
}

inline void measureUnpacking(benchmark::State& state) {
  library();
  for (auto _ : state) {
    state.PauseTiming();
    const fs::path folder = library().fresh();
    fs::create_directory(folder);
    sync();
    state.ResumeTiming();
    unpackAll(folder);
  }
}

}  // namespace appsync::bench
