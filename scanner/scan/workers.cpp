// SPDX-License-Identifier: MIT
#include "scanner/scan/workers.h"

#include <csignal>
#include <filesystem>
#include <system_error>

#include <fcntl.h>
#include <poll.h>
#include <unistd.h>

#include "scanner/find/module_file.h"
#include "scanner/system/system.h"

namespace scanner {
namespace {

namespace fs = std::filesystem;

constexpr const char* kWorker = "vsttorture-worker";
constexpr const char* kDescribe = "vsttorture-describe";

constexpr int kPatienceInMilliseconds = 5000;

}  // namespace

std::string askVersion(const std::string& program) {
  int output[2];
  if (pipe2(output, O_CLOEXEC) != 0) return {};
  system::ProcessStart start;
  start.command = {program, "--version"};
  start.environment = {"PATH=/usr/bin:/bin"};
  start.workingDirectory = "/";
  start.standardOutput = output[1];
  start.standardError = output[1];
  std::string reason;
  const int process = system::startProcess(start, reason);
  close(output[1]);
  std::string said;
  char block[256];
  pollfd readable = {output[0], POLLIN, 0};
  while (said.size() < 4096 && said.find('\n') == std::string::npos &&
         poll(&readable, 1, kPatienceInMilliseconds) > 0) {
    const ssize_t count = read(output[0], block, sizeof block);
    if (count <= 0) break;
    said.append(block, static_cast<std::size_t>(count));
  }
  close(output[0]);
  if (process > 0) {
    kill(-process, SIGKILL);  // Its session, whatever it goes on to do.
    system::reap(process);
  }
  return said.substr(0, said.find('\n'));
}

std::string ownProcessor() {
  const std::optional<Target> self = targetOfProgram("/proc/self/exe");
  return self ? self->processor : std::string();
}

std::vector<std::string> workerFolders(const std::vector<std::string>& folders) {
  std::vector<std::string> all = folders;
  std::error_code error;
  const fs::path self = fs::read_symlink("/proc/self/exe", error).parent_path();
  if (!self.empty()) all.push_back(self.string());
  for (const fs::path& libraries :
       {self.parent_path() / "lib", fs::path("/usr/lib"), fs::path("/usr/local/lib")}) {
    for (fs::directory_iterator entry(libraries, error), end; !error && entry != end;
         entry.increment(error)) {
      const fs::path folder = entry->path() / "vsttorture";
      std::error_code ignored;
      if (fs::is_directory(folder, ignored)) all.push_back(folder.string());
    }
  }
  return all;
}

WorkersByProcessor findWorkers(const std::vector<std::string>& folders, std::vector<std::string>& notes,
                               const std::function<std::string(const std::string& program)>& versionOf) {
  WorkersByProcessor workers;
  for (const std::string& folder : workerFolders(folders)) {
    const std::string program = folder + "/" + kWorker;
    if (access(program.c_str(), X_OK) != 0) continue;
    const std::optional<Target> target = targetOfProgram(program);
    if (target && workers.count(target->processor) > 0) continue;
    const std::string version = target ? versionOf(program) : std::string();
    if (!target || version != std::string(kWorker) + " " VSTTORTURE_VERSION) {
      notes.push_back(program + " is not used: it is no vsttorture-worker of version " VSTTORTURE_VERSION +
                      (version.empty() ? "" : ", but says \"" + version + "\""));
      continue;
    }
    const std::string describe = fs::absolute(folder + "/" + kDescribe).string();
    if (access(describe.c_str(), X_OK) != 0)
      notes.push_back(describe +
                      " is missing: the children of shells cannot be found, nor anything described");
    workers[target->processor] = {fs::absolute(program).string(), describe};
  }
  return workers;
}

}  // namespace scanner
