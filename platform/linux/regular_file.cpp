// SPDX-License-Identifier: MIT
// Reading the beginning of a file that may turn out to be anything.
#include "platform/linux/regular_file.h"

#include <cstdio>
#include <filesystem>
#include <memory>
#include <system_error>

namespace core_foundation {

std::optional<std::string> beginningOfFile(const std::string& path, std::size_t limitInBytes) {
  std::error_code error;
  if (!std::filesystem::is_regular_file(path, error)) return std::nullopt;
  const std::unique_ptr<std::FILE, int (*)(std::FILE*)> file(std::fopen(path.c_str(), "rbe"), &std::fclose);
  if (!file) return std::nullopt;

  std::string content;
  char block[4096];
  while (content.size() < limitInBytes) {
    const std::size_t count = std::fread(block, 1, sizeof block, file.get());
    if (count == 0) break;
    content.append(block, count);
  }
  if (std::ferror(file.get()) != 0) return std::nullopt;
  if (content.size() > limitInBytes) content.resize(limitInBytes);
  return content;
}

}  // namespace core_foundation
