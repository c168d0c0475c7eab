// Stands in for libFuzzer where a build has none: runs the fuzz target over the files and folders given, and over
// each of their inputs cut short and with each byte changed.

#include <algorithm>
#include <cstdio>
#include <exception>
#include <filesystem>
#include <fstream>
#include <iterator>
#include <string>
#include <vector>

#include "fuzz_input.h"

namespace {

// Past this, only the ends of an input are varied: the point is a quick run, not a search.
constexpr size_t kMostVaried = 600;

std::vector<std::filesystem::path> InputFiles(int argc, char** argv) {
  std::vector<std::filesystem::path> files;
  for (int i = 1; i < argc; ++i) {
    if (!std::filesystem::is_directory(argv[i])) {
      files.emplace_back(argv[i]);
      continue;
    }
    for (const auto& entry : std::filesystem::directory_iterator(argv[i])) files.push_back(entry.path());
  }
  std::sort(files.begin(), files.end());
  return files;
}

size_t Run(const std::vector<uint8_t>& input) {
  LLVMFuzzerTestOneInput(input.data(), input.size());
  return 1;
}

size_t RunVaried(const std::vector<uint8_t>& input) {
  size_t runs = Run(input);
  const size_t varied = std::min(input.size(), kMostVaried);
  for (size_t i = 0; i < varied; ++i) {
    runs += Run({input.begin(), input.begin() + static_cast<std::ptrdiff_t>(i)});
    std::vector<uint8_t> changed = input;
    for (const int value : {0x00, 0x01, 0x7f, 0x80, 0xff, input[i] ^ 0x10}) {
      changed[i] = static_cast<uint8_t>(value);
      runs += Run(changed);
    }
  }
  return runs;
}

}  // namespace

int main(int argc, char** argv) {
  const std::vector<std::filesystem::path> files = InputFiles(argc, argv);
  if (files.empty()) {
    std::fprintf(stderr, "no inputs: give files or folders that hold some\n");
    return 1;
  }
  size_t runs = 0;
  for (const std::filesystem::path& path : files) {
    std::ifstream file(path, std::ios::binary);
    if (!file) {
      std::fprintf(stderr, "cannot read %s\n", path.c_str());
      return 1;
    }
    runs += RunVaried({std::istreambuf_iterator<char>(file), {}});
  }
  std::printf("%zu inputs, %zu runs\n", files.size(), runs);
  return 0;
}
