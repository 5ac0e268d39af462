// SPDX-License-Identifier: MIT
#include "scanner/system/linux/proc.h"

#include <csignal>
#include <cstdlib>
#include <sstream>
#include <string_view>

#include <dirent.h>
#include <fcntl.h>
#include <sys/syscall.h>
#include <unistd.h>

namespace scanner::system {
namespace {

std::vector<int> numbersIn(const std::string& folder) {
  std::vector<int> numbers;
  DIR* directory = opendir(folder.c_str());
  if (directory == nullptr) return numbers;
  while (const dirent* entry = readdir(directory)) {
    if (entry->d_name[0] >= '0' && entry->d_name[0] <= '9') numbers.push_back(std::atoi(entry->d_name));
  }
  closedir(directory);
  return numbers;
}

}  // namespace

std::string readProc(const std::string& name) {
  const int file = open(("/proc/" + name).c_str(), O_RDONLY | O_CLOEXEC);
  if (file < 0) return {};
  std::string content;
  char block[4096];
  for (ssize_t count = 0; (count = read(file, block, sizeof block)) > 0;) {
    content.append(block, static_cast<std::size_t>(count));
  }
  close(file);
  return content;
}

std::vector<int> threadsOf(int process) { return numbersIn("/proc/" + std::to_string(process) + "/task"); }

std::vector<int> childrenOf(int process) {
  std::vector<int> children;
  for (const int thread : threadsOf(process)) {
    std::istringstream list(
        readProc(std::to_string(process) + "/task/" + std::to_string(thread) + "/children"));
    for (int child = 0; list >> child;) children.push_back(child);
  }
  return children;
}

std::vector<int> descendantsOf(int process) {
  std::vector<int> descendants = childrenOf(process);
  for (std::size_t i = 0; i < descendants.size(); ++i) {
    for (const int child : childrenOf(descendants[i])) descendants.push_back(child);
  }
  return descendants;
}

std::vector<std::string> statFields(const std::string& stat) {
  // The name may hold blanks and brackets itself.
  const std::size_t end = stat.rfind(')');
  std::vector<std::string> fields;
  if (end == std::string::npos) return fields;
  std::istringstream rest(stat.substr(end + 1));
  for (std::string field; rest >> field;) fields.push_back(field);
  return fields;
}

Mark markOf(int process) {
  // The limit of file locks, which no kernel since 2.4.25 looks at: inherited by all, and raised by nobody without
  // the right to.
  constexpr std::string_view kName = "\nMax file locks";
  const std::string limits = readProc(std::to_string(process) + "/limits");
  const std::size_t line = limits.find(kName);
  if (line == std::string::npos) return 0;
  std::istringstream rest(limits.substr(line + kName.size()));
  std::string soft;
  std::string hard;
  rest >> soft >> hard;
  return std::strtoull(hard.c_str(), nullptr, 10);  // "unlimited" is 0.
}

bool killIfMarked(int process, const Marks& marks) {
  // The handle stays with the process that has the number now. If that has gone when the signal is sent, what was
  // read may have been another's; then there is nothing to be signalled.
  const auto handle = static_cast<int>(syscall(SYS_pidfd_open, process, 0));
  if (handle < 0) return false;
  const Mark mark = markOf(process);
  const std::vector<std::string> stat = statFields(readProc(std::to_string(process) + "/stat"));
  const bool hasEnded = !stat.empty() && (stat[0] == "Z" || stat[0] == "X");
  const bool isOurs = mark != 0 && mark >= marks.first && mark <= marks.last && !hasEnded;
  const bool isKilled = isOurs && syscall(SYS_pidfd_send_signal, handle, SIGKILL, nullptr, 0) == 0;
  close(handle);
  return isKilled;
}

std::vector<int> descriptorsOf(int process) { return numbersIn("/proc/" + std::to_string(process) + "/fd"); }

std::vector<int> allProcesses() { return numbersIn("/proc"); }

}  // namespace scanner::system
