// SPDX-License-Identifier: MIT
// What a file is that is no shared object of this system: a table of first bytes.
#include "platform/linux/file_format.h"

#include "platform/linux/regular_file.h"

namespace core_foundation {
namespace {

struct Format {
  std::string_view firstBytes;
  const char* name;
};
// Modules for macOS come in both word sizes, each in both byte orders, and as several of them in one file.
constexpr Format kFormats[] = {
    {"\xCE\xFA\xED\xFE", "a module for macOS"},
    {"\xCF\xFA\xED\xFE", "a module for macOS"},
    {"\xFE\xED\xFA\xCE", "a module for macOS"},
    {"\xFE\xED\xFA\xCF", "a module for macOS"},
    {"\xCA\xFE\xBA\xBE", "a module for macOS"},
    {"\xCA\xFE\xBA\xBF", "a module for macOS"},
    {"MZ", "a module for Windows"},
    {"!<arch>\n", "a static library"},
    {"#!", "a script"},
};
constexpr std::size_t kNeededInBytes = 8;

}  // namespace

std::optional<std::string> foreignFormat(std::string_view beginning) {
  for (const Format& format : kFormats)
    if (beginning.substr(0, format.firstBytes.size()) == format.firstBytes) return format.name;
  return std::nullopt;
}

std::optional<std::string> formatMismatch(const std::string& path) {
  const std::optional<std::string> beginning = beginningOfFile(path, kNeededInBytes);
  if (!beginning) return std::nullopt;
  const std::optional<std::string> format = foreignFormat(*beginning);
  if (!format) return std::nullopt;
  return path + " is " + *format + ", not a shared object for Linux";
}

}  // namespace core_foundation
