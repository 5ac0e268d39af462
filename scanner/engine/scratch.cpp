// SPDX-License-Identifier: MIT
#include "scanner/engine/scratch.h"

#include <algorithm>
#include <cerrno>
#include <optional>
#include <system_error>

#include <sys/stat.h>

#include "scanner/system/system.h"

namespace scanner {
namespace {

constexpr std::size_t kMostFilesListed = 100;
constexpr std::size_t kMostBytesOfAName = 1024;
constexpr std::uint64_t kMostFilesCounted = 1000000;
constexpr std::uint64_t kLeastBytes = 4096;
/// Each level takes a descriptor and makes all paths below it longer. Nothing that is of use is so deep.
constexpr unsigned kMostLevels = 100;

struct Folder {
  const char* path;
  unsigned folders;  ///< How many of this list are directly in it.
};

constexpr Folder kFolders[] = {
    {"", 4},
    {"/home", 3},
    {"/home/.config", 0},
    {"/home/.cache", 0},
    {"/home/.local", 2},
    {"/home/.local/share", 0},
    {"/home/.local/state", 0},
    {"/run", 0},
    {"/shm", 0},
    {"/tmp", 0},
};

bool isOfOurFolders(const std::string& path) {
  return std::any_of(std::begin(kFolders), std::end(kFolders),
                     [&](const Folder& one) { return path == one.path; });
}

}  // namespace

ScratchFolder::ScratchFolder(const std::string& folder_) : folder(folder_) {
  for (const Folder& part : kFolders) {
    if (mkdir((folder + part.path).c_str(), 0700) == 0) continue;
    const std::error_code error(errno, std::generic_category());
    system::removeTree(folder);
    throw std::system_error(error, folder);
  }
}

ScratchFolder::~ScratchFolder() {
  if (!isLeft) system::removeTree(folder);
}

std::vector<std::string> ScratchFolder::environment() const {
  return {
      "HOME=" + home(),
      "XDG_CONFIG_HOME=" + home() + "/.config",
      "XDG_CACHE_HOME=" + home() + "/.cache",
      "XDG_DATA_HOME=" + home() + "/.local/share",
      "XDG_STATE_HOME=" + home() + "/.local/state",
      "XDG_RUNTIME_DIR=" + folder + "/run",
      "TMPDIR=" + folder + "/tmp",
  };
}

bool ScratchFolder::isAsNew() const {
  return std::all_of(std::begin(kFolders), std::end(kFolders), [&](const Folder& part) {
    const std::optional<system::FolderLook> look = system::lookAtFolder(folder + part.path);
    return look && look->permissions == 0700 && look->entries == part.folders;
  });
}

void ScratchFolder::list(LeftBehind& leftBehind) const {
  system::visitTree(folder, kMostLevels, [&](const system::TreeEntry& entry) {
    if (entry.path == "record" || entry.isFolder) return true;
    leftBehind.fileBytes += entry.bytesOnDisk;
    if (leftBehind.files.size() < kMostFilesListed)
      leftBehind.files.push_back(entry.path.substr(0, kMostBytesOfAName));
    return ++leftBehind.fileCount < kMostFilesCounted;
  });
  std::sort(leftBehind.files.begin(), leftBehind.files.end());
}

std::uint64_t ScratchFolder::sizeInBytes(std::uint64_t most) const {
  std::uint64_t total = 0;
  system::visitTree(folder, kMostLevels, [&](const system::TreeEntry& entry) {
    if (!isOfOurFolders("/" + entry.path)) total += std::max(entry.bytesOnDisk, kLeastBytes);
    return total <= most;
  });
  return total;
}

}  // namespace scanner
