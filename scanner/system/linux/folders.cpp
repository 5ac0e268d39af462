// SPDX-License-Identifier: MIT
// Removing folders in which others have done what they liked.
#include <cerrno>
#include <string>
#include <vector>

#include <dirent.h>
#include <fcntl.h>
#include <sys/stat.h>
#include <unistd.h>

#include "scanner/system/system.h"

namespace scanner::system {
namespace {

/// Null when the folder cannot be read. Follows no link.
DIR* openFolder(int parent, const char* name) {
  const int folder = openat(parent, name, O_RDONLY | O_DIRECTORY | O_NOFOLLOW | O_CLOEXEC);
  DIR* const directory = folder < 0 ? nullptr : fdopendir(folder);
  if (directory == nullptr && folder >= 0) close(folder);
  return directory;
}

/// The next name in the folder; empty behind the last one.
std::string nextName(DIR* directory) {
  while (const dirent* entry = readdir(directory)) {
    std::string name = entry->d_name;
    if (name != "." && name != "..") return name;
  }
  return {};
}

/// Calls `visit` with each name in the folder; false when it cannot be read.
template <class Visit>
bool forEachName(int parent, const char* name, Visit visit) {
  DIR* const directory = openFolder(parent, name);
  if (directory == nullptr) return false;
  for (std::string one = nextName(directory); !one.empty(); one = nextName(directory))
    visit(dirfd(directory), one);
  closedir(directory);
  return true;
}

bool isFolder(int parent, const std::string& name) {
  struct stat status = {};
  return fstatat(parent, name.c_str(), &status, AT_SYMLINK_NOFOLLOW) == 0 && S_ISDIR(status.st_mode);
}

/// Of a folder, so that what is in it can be read and removed. Never of what a link leads to.
void makeWritable(int parent, const std::string& name) {
  [[maybe_unused]] const int ignored = fchmodat(parent, name.c_str(), 0700, AT_SYMLINK_NOFOLLOW);
}

}  // namespace

bool removeTree(const std::string& folder) {
  const int root = open(folder.c_str(), O_RDONLY | O_DIRECTORY | O_NOFOLLOW | O_CLOEXEC);
  if (root < 0) return errno == ENOENT;
  fchmod(root, 0700);
  // A folder in a folder is moved up to the root, so neither the depth nor the length of a path matters.
  std::uint64_t moved = 0;
  for (bool isProgress = true; isProgress;) {
    isProgress = false;
    forEachName(root, ".", [&](int, const std::string& name) {
      if (unlinkat(root, name.c_str(), 0) == 0) {
        isProgress = true;
        return;
      }
      if (!isFolder(root, name)) return;
      makeWritable(root, name);
      forEachName(root, name.c_str(), [&](int parent, const std::string& inner) {
        if (unlinkat(parent, inner.c_str(), 0) == 0) return;
        if (unlinkat(parent, inner.c_str(), AT_REMOVEDIR) == 0) return;
        // To be moved it must be writable.
        makeWritable(parent, inner);
        while (renameat(parent, inner.c_str(), root, ("moved" + std::to_string(moved++)).c_str()) != 0 &&
               (errno == EEXIST || errno == ENOTEMPTY || errno == ENOTDIR || errno == EISDIR)) {
        }
      });
      if (unlinkat(root, name.c_str(), AT_REMOVEDIR) == 0) isProgress = true;
    });
  }
  close(root);
  return rmdir(folder.c_str()) == 0;
}

void visitTree(const std::string& folder, unsigned mostLevels,
               const std::function<bool(const TreeEntry&)>& visit) {
  struct Level {
    DIR* directory;
    std::string prefix;  ///< The path of the folder with a slash; empty at the top.
  };
  std::vector<Level> levels;
  const auto enter = [&](int parent, const std::string& name, const std::string& prefix) {
    DIR* const directory = openFolder(parent, name.c_str());
    if (directory != nullptr) levels.push_back({directory, prefix});
  };
  bool goesOn = true;
  enter(AT_FDCWD, folder, "");
  while (!levels.empty()) {
    DIR* const directory = levels.back().directory;
    const std::string name = goesOn ? nextName(directory) : "";
    if (name.empty()) {
      closedir(directory);
      levels.pop_back();
      continue;
    }
    struct stat status = {};
    if (fstatat(dirfd(directory), name.c_str(), &status, AT_SYMLINK_NOFOLLOW) != 0) continue;
    TreeEntry entry;
    entry.path = levels.back().prefix + name;
    entry.isFolder = S_ISDIR(status.st_mode);
    // The unit of st_blocks is 512 bytes on every file system.
    if (S_ISREG(status.st_mode)) entry.bytesOnDisk = static_cast<std::uint64_t>(status.st_blocks) * 512;
    goesOn = visit(entry);
    if (entry.isFolder && levels.size() < mostLevels) enter(dirfd(directory), name, entry.path + "/");
  }
}

std::optional<FolderLook> lookAtFolder(const std::string& folder) {
  FolderLook look;
  struct stat status = {};
  const bool isRead =
      forEachName(AT_FDCWD, folder.c_str(), [&](int, const std::string&) { ++look.entries; }) &&
      lstat(folder.c_str(), &status) == 0;
  if (!isRead) return std::nullopt;
  look.permissions = status.st_mode & 07777U;
  return look;
}

}  // namespace scanner::system
