// SPDX-License-Identifier: MIT
// The folder of one run: its home, temporary files and flight record. Removed with everything in it, unless it has
// to be left.
#pragma once

#include <cstdint>
#include <string>
#include <vector>

#include "scanner/engine/run_seen.h"

namespace scanner {

class ScratchFolder {
 public:
  /// Makes `folder`, which must not exist yet. Throws std::system_error.
  explicit ScratchFolder(const std::string& folder);
  /// Removes it, whatever a plug-in has done to the permissions of what is in it.
  ~ScratchFolder();
  ScratchFolder(const ScratchFolder&) = delete;
  ScratchFolder& operator=(const ScratchFolder&) = delete;

  /// HOME, the XDG_* folders and TMPDIR, each below this folder.
  [[nodiscard]] std::vector<std::string> environment() const;

  [[nodiscard]] const std::string& path() const { return folder; }
  [[nodiscard]] std::string home() const { return folder + "/home"; }
  [[nodiscard]] std::string record() const { return folder + "/record"; }
  /// What a sandbox shows as /dev/shm.
  [[nodiscard]] std::string sharedMemory() const { return folder + "/shm"; }

  /// True when there is nothing in it but the folders that it was made with, as they were: it can serve another run.
  [[nodiscard]] bool isAsNew() const;
  /// It is not removed: a process still uses it, and the file system that it is on may not answer.
  void leave() { isLeft = true; }
  /// What a plug-in has put here: files in its home and its temporary folder, down to 100 levels. The count ends at a
  /// million, and a name at 1024 bytes.
  void list(LeftBehind& leftBehind) const;
  /// The size of all that was put here. A file or folder counts as a block of 4096 bytes at least. No more is
  /// looked at once `most` is exceeded; what cannot be read, or is more than 100 levels deep, counts as nothing.
  [[nodiscard]] std::uint64_t sizeInBytes(std::uint64_t most) const;

 private:
  std::string folder;
  bool isLeft = false;
};

}  // namespace scanner
