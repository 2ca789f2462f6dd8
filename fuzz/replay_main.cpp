// Runs a fuzz target over the files of a corpus: one program without a fuzzing engine for each target.

#include <cstdio>
#include <filesystem>
#include <fstream>
#include <iterator>
#include <set>
#include <string>
#include <vector>

#include "fuzz/support.h"

namespace {

/// From memory that ends with the file, so that a sanitizer sees who reads on.
void replay(const std::filesystem::path& file) {
  std::printf("%s\n", file.c_str());
  (void)std::fflush(stdout);
  std::ifstream stream(file, std::ios::binary);
  const std::vector<uint8_t> input{std::istreambuf_iterator<char>(stream), std::istreambuf_iterator<char>()};
  fuzz::require(!stream.bad(), "the file can be read");
  (void)LLVMFuzzerTestOneInput(input.data(), input.size());
}

}  // namespace

int main(int argc, char** argv) {
  LLVMFuzzerInitialize(&argc, &argv);
  std::set<std::filesystem::path> files;
  for (int index = 1; index < argc; ++index) {
    for (const auto& entry : std::filesystem::directory_iterator(argv[index])) files.insert(entry.path());
  }
  for (const auto& file : files) replay(file);
  std::printf("%zu inputs\n", files.size());
  return files.empty() ? 1 : 0;
}
