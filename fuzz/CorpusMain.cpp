// The main of a fuzz target in builds without libFuzzer: runs the target's corpus once, as an ordinary test.
//
//     NAMEFuzz CORPUS NAME
//
// Input are the files of every folder in CORPUS whose name begins with NAME, whole and cut off at every length, because
// a reader's worst inputs are those that stop too early.

#include <cstddef>
#include <cstdint>
#include <filesystem>
#include <fstream>
#include <iostream>
#include <iterator>
#include <string>
#include <vector>

extern "C" int LLVMFuzzerTestOneInput(const std::uint8_t* data, std::size_t size);

namespace {

namespace fs = std::filesystem;

// Longer inputs are run whole only, to keep the test quick.
constexpr std::size_t kLongestToCut = 2048;

std::vector<std::uint8_t> bytesOf(const fs::path& file) {
  std::ifstream stream(file, std::ios::binary);
  return {std::istreambuf_iterator<char>(stream), std::istreambuf_iterator<char>()};
}

void runCutOff(const std::vector<std::uint8_t>& input) {
  for (std::size_t size = 0; size < input.size(); ++size) {
    // A copy of exactly that size, so that the address sanitizer sees a read past its end.
    const std::vector<std::uint8_t> cut(input.begin(), input.begin() + static_cast<std::ptrdiff_t>(size));
    LLVMFuzzerTestOneInput(cut.data(), cut.size());
  }
}

std::size_t runFolder(const fs::path& folder) {
  std::size_t count = 0;
  for (const auto& entry : fs::recursive_directory_iterator(folder)) {
    if (!entry.is_regular_file()) continue;
    const std::vector<std::uint8_t> input = bytesOf(entry.path());
    LLVMFuzzerTestOneInput(input.data(), input.size());
    if (input.size() <= kLongestToCut) runCutOff(input);
    ++count;
  }
  return count;
}

}  // namespace

int main(int argc, char** argv) {
  if (argc != 3) {
    std::cerr << "usage: " << argv[0] << " CORPUS NAME\n";
    return 2;
  }
  const fs::path corpus = argv[1];
  const std::string name = argv[2];
  std::size_t count = 0;
  for (const auto& entry : fs::directory_iterator(corpus)) {
    if (entry.is_directory() && entry.path().filename().string().starts_with(name)) count += runFolder(entry.path());
  }
  std::cout << count << " inputs\n";
  if (count > 0) return 0;
  std::cerr << "no input for " << name << " in " << corpus << '\n';
  return 1;
}
