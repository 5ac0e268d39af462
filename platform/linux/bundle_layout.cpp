// SPDX-License-Identifier: MIT
// Which file is a bundle's executable.
#include "platform/linux/bundle_layout.h"

#include <cstddef>
#include <filesystem>
#include <optional>
#include <system_error>

#include "platform/linux/elf_header.h"
#include "platform/linux/info_plist.h"
#include "platform/linux/regular_file.h"

namespace core_foundation {
namespace {

namespace fs = std::filesystem;

constexpr std::size_t kLongestInfoPlistInBytes = 1 << 20;

bool isRegularFile(const fs::path& path) {
  std::error_code error;
  return fs::is_regular_file(path, error);
}

// A name that stays in the folder it is looked for in.
bool isPlainFileName(const std::string& name) {
  return !name.empty() && name != "." && name != ".." && name.find('/') == std::string::npos;
}

std::optional<std::string> executableNamedByInfoPlist(const fs::path& directory) {
  for (const char* place : {"Contents/Info.plist", "Info.plist"}) {
    const auto content = beginningOfFile(directory / place, kLongestInfoPlistInBytes + 1);
    if (!content || content->size() > kLongestInfoPlistInBytes) continue;
    if (auto name = bundleExecutableKey(*content)) return name;
  }
  return std::nullopt;
}

std::string nameOfDirectory(const fs::path& directory) {
  const fs::path plain = directory.lexically_normal();
  return (plain.has_filename() ? plain : plain.parent_path()).stem().string();
}

// The path of the executable `name` in `directory`, empty when there is none.
std::string searchExecutable(const fs::path& directory, const std::string& name) {
  if (!isPlainFileName(name)) return {};
  const std::string ofArchitecture = "Contents/" + std::string(architectureOfProgram()) + "-linux";
  for (const char* folder : {"Contents/Linux", ofArchitecture.c_str(), "Contents/MacOS", "Contents", "."})
    for (const std::string& file : {name, name + ".so", "lib" + name + ".so"})
      if (fs::path found = (directory / folder / file).lexically_normal(); isRegularFile(found)) return found;
  return {};
}

}  // namespace

BundleExecutable findBundleExecutable(const std::string& path) {
  std::error_code error;
  const fs::file_status status = fs::status(path, error);
  if (fs::is_regular_file(status)) return {path, {}};
  if (!fs::exists(status))
    return {{},
            path + ": " + (error ? error : make_error_code(std::errc::no_such_file_or_directory)).message()};
  if (!fs::is_directory(status)) return {{}, path + " is neither a file nor a directory"};

  const std::optional<std::string> named = executableNamedByInfoPlist(path);
  const std::string name = named ? *named : nameOfDirectory(path);
  std::string executable = searchExecutable(path, name);
  if (!executable.empty()) return {std::move(executable), {}};
  return {{}, path + " has no executable " + name + (named ? ", which its Info.plist names" : "")};
}

}  // namespace core_foundation
