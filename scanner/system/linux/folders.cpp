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
      [[maybe_unused]] const int outer = fchmodat(root, name.c_str(), 0700, 0);
      forEachName(root, name.c_str(), [&](int parent, const std::string& inner) {
        if (unlinkat(parent, inner.c_str(), 0) == 0) return;
        if (unlinkat(parent, inner.c_str(), AT_REMOVEDIR) == 0) return;
        // To be moved it must be writable.
        [[maybe_unused]] const int writable = fchmodat(parent, inner.c_str(), 0700, 0);
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
