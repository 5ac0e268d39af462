// SPDX-License-Identifier: MIT
// Removing folders in which others have done what they liked.
#include <cerrno>
#include <string>

#include <dirent.h>
#include <fcntl.h>
#include <sys/stat.h>
#include <unistd.h>

#include "scanner/system/system.h"

namespace scanner::system {
namespace {

/// Calls `visit` with each name in the folder; false when it cannot be read.
template <class Visit>
bool forEachName(int parent, const char* name, Visit visit) {
  const int folder = openat(parent, name, O_RDONLY | O_DIRECTORY | O_NOFOLLOW | O_CLOEXEC);
  if (folder < 0) return false;
  DIR* const directory = fdopendir(folder);
  if (directory == nullptr) {
    close(folder);
    return false;
  }
  while (const dirent* entry = readdir(directory)) {
    const std::string one = entry->d_name;
    if (one != "." && one != "..") visit(folder, one);
  }
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

/// What is in the folder `name`, which is `prefix` for those who look from the top. False when `visit` has had enough.
bool visitFolder(int parent, const std::string& name, const std::string& prefix, unsigned levelsLeft,
                 const std::function<bool(const TreeEntry&)>& visit) {
  bool goesOn = true;
  forEachName(parent, name.c_str(), [&](int folder, const std::string& inner) {
    struct stat status = {};
    if (!goesOn || fstatat(folder, inner.c_str(), &status, AT_SYMLINK_NOFOLLOW) != 0) return;
    TreeEntry entry;
    entry.path = prefix + inner;
    entry.isFolder = S_ISDIR(status.st_mode);
    // The unit of st_blocks is 512 bytes on every file system.
    if (S_ISREG(status.st_mode)) entry.bytesOnDisk = static_cast<std::uint64_t>(status.st_blocks) * 512;
    goesOn = visit(entry);
    if (goesOn && entry.isFolder && levelsLeft > 1)
      goesOn = visitFolder(folder, inner, entry.path + "/", levelsLeft - 1, visit);
  });
  return goesOn;
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
  visitFolder(AT_FDCWD, folder, "", mostLevels, visit);
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
