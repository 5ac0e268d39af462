// SPDX-License-Identifier: MIT
#include "scanner/engine/scratch.h"

#include <algorithm>
#include <cerrno>
#include <filesystem>
#include <optional>
#include <system_error>

#include <sys/stat.h>

#include "scanner/system/system.h"

namespace scanner {
namespace {

namespace fs = std::filesystem;

constexpr std::size_t kMostFilesListed = 100;
constexpr std::uint64_t kMostFilesCounted = 1000000;
constexpr std::uint64_t kLeastBytes = 4096;

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

/// Calls `visit` with each entry until that returns false. Links are entries, and not followed.
template <class Visit>
void forEachEntry(const fs::path& folder, Visit visit) {
  std::error_code error;
  fs::recursive_directory_iterator entry(folder, fs::directory_options::skip_permission_denied, error);
  for (const fs::recursive_directory_iterator end; !error && entry != end; entry.increment(error)) {
    if (!visit(*entry)) return;
  }
}

std::uint64_t sizeOf(const fs::directory_entry& entry) {
  struct stat status = {};
  if (lstat(entry.path().c_str(), &status) != 0 || !S_ISREG(status.st_mode)) return 0;
  // What it takes on the disk: a file with a hole takes less than its length.
  return static_cast<std::uint64_t>(status.st_blocks) * 512;
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
  forEachEntry(folder, [&](const fs::directory_entry& entry) {
    std::error_code ignored;
    const std::string relative = entry.path().string().substr(folder.size() + 1);
    const bool isFolder = fs::is_directory(entry.symlink_status(ignored));
    if (relative == "record" || isFolder) return true;
    leftBehind.fileBytes += sizeOf(entry);
    if (leftBehind.files.size() < kMostFilesListed) leftBehind.files.push_back(relative);
    return ++leftBehind.fileCount < kMostFilesCounted;
  });
  std::sort(leftBehind.files.begin(), leftBehind.files.end());
}

std::uint64_t ScratchFolder::sizeInBytes(std::uint64_t most) const {
  std::uint64_t total = 0;
  forEachEntry(folder, [&](const fs::directory_entry& entry) {
    if (!isOfOurFolders(entry.path().string().substr(folder.size())))
      total += std::max(sizeOf(entry), kLeastBytes);
    return total <= most;
  });
  return total;
}

}  // namespace scanner
