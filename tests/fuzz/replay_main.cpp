// SPDX-License-Identifier: MIT
// Runs a fuzz target once on each file of the folders named on the command line. Builds without a fuzzer use
// it to test the inputs that fuzzers have found.
#include <cstdint>
#include <cstdio>
#include <filesystem>
#include <fstream>
#include <iterator>
#include <vector>

extern "C" int LLVMFuzzerTestOneInput(const std::uint8_t* input, std::size_t size);

int main(int argumentCount, char** arguments) {
  int files = 0;
  for (int i = 1; i < argumentCount; ++i) {
    for (const auto& entry : std::filesystem::directory_iterator(arguments[i])) {
      std::ifstream file(entry.path(), std::ios::binary);
      const std::vector<char> text((std::istreambuf_iterator<char>(file)), std::istreambuf_iterator<char>());
      const std::vector<std::uint8_t> bytes(text.begin(), text.end());
      std::printf("%s, %zu bytes\n", entry.path().c_str(), bytes.size());
      std::fflush(stdout);
      LLVMFuzzerTestOneInput(bytes.data(), bytes.size());
      ++files;
    }
  }
  return files > 0 ? 0 : 1;
}
