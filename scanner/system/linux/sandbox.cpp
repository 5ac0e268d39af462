// SPDX-License-Identifier: MIT
// The sandbox: bubblewrap.
#include <cstdlib>
#include <sstream>

#include <fcntl.h>
#include <unistd.h>

#include "scanner/system/system.h"

namespace scanner::system {
namespace {

std::string pathOf(const std::string& program) {
  const char* path = std::getenv("PATH");
  std::istringstream folders(path == nullptr ? "/usr/bin:/bin" : path);
  for (std::string folder; std::getline(folders, folder, ':');) {
    std::string file = folder;
    file.append("/").append(program);
    if (!folder.empty() && access(file.c_str(), X_OK) == 0) return file;
  }
  return {};
}

}  // namespace

std::vector<std::string> sandboxCommand(const std::string& sandbox, const std::string& writable,
                                        const std::string& sharedMemory) {
  // The whole file system is bound, read-only: a plug-in may need any of it, and may lie in /tmp or a home.
  return {sandbox, "--ro-bind", "/", "/", "--dev", "/dev", "--proc", "/proc", "--bind", writable, writable,
          // Otherwise shared memory would be memory that no limit counts.
          "--bind", sharedMemory, "/dev/shm", "--remount-ro", "/dev", "--unshare-pid", "--unshare-net",
          "--unshare-ipc", "--die-with-parent", "--"};
}

std::optional<std::string> findSandbox(const std::string& writable, std::string& reason) {
  const std::string sandbox = pathOf("bwrap");
  if (sandbox.empty()) {
    reason = "bubblewrap (bwrap) is not installed";
    return std::nullopt;
  }
  int output[2];
  if (pipe2(output, O_CLOEXEC) != 0) {
    reason = "no pipe";
    return std::nullopt;
  }
  ProcessStart start;
  start.command = sandboxCommand(sandbox, writable, writable);
  // Writing is what the sandbox must allow there.
  start.command.insert(start.command.end(), {"/bin/sh", "-c", ": > \"$1/sandbox\"", "sh", writable});
  start.environment = {"PATH=/usr/bin:/bin"};
  start.workingDirectory = writable;
  start.standardOutput = output[1];
  start.standardError = output[1];
  const int process = startProcess(start, reason);
  close(output[1]);
  std::string said;
  char block[512];
  for (ssize_t count = 0; (count = read(output[0], block, sizeof block)) > 0;) {
    said.append(block, static_cast<std::size_t>(count));
  }
  close(output[0]);
  if (process < 0) return std::nullopt;
  const ProcessEnd end = reap(process);
  unlink((writable + "/sandbox").c_str());
  if (!end.isSignalled && end.value == 0) return sandbox;
  reason = said.substr(0, said.find('\n'));
  if (reason.empty()) reason = "bubblewrap does not work here";
  return std::nullopt;
}

}  // namespace scanner::system
