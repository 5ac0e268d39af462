// SPDX-License-Identifier: MIT
// Faults that make a run look like another: lines that the plug-in prints in the program's place, and a
// flight record that it writes over.
#include <cstdio>
#include <cstdlib>
#include <cstring>
#include <fstream>
#include <sstream>
#include <string>

#include <sys/wait.h>
#include <unistd.h>

#include "plugins/faulty/faults.h"

namespace sample_plugins {
namespace {

constexpr const char* kFixedSteps[] = {
    "test gathering info",    "inspect class info",
    "inspect preset info",    "inspect parameter info",
    "testing setting states", "inspect latency",
    "inspect stream format",  "inspect stream format",
    "inspect latency",        "testing setting states",
    "inspect parameter info", "inspect preset info",
    "inspect class info",     "initialize",
    "test gathering info",
};
constexpr int kStepsOfAPass = 65;

void print(const std::string& text) {
  for (std::size_t done = 0; done < text.size();) {
    const ssize_t count = write(STDOUT_FILENO, text.data() + done, text.size() - done);
    if (count <= 0) return;
    done += static_cast<std::size_t>(count);
  }
}

std::string linesOfAPass() {
  std::string lines = "total, 64\n";
  int number = 0;
  for (const char* text : kFixedSteps) lines += std::to_string(++number) + ", " + text + "\n";
  while (number < kStepsOfAPass) lines += std::to_string(++number) + ", inspect latency\n";
  return lines;
}

struct Memory {
  unsigned char* begin = nullptr;
  std::size_t size = 0;
};

/// Where the host has mapped a file of this name.
Memory mappingOf(const std::string& fileName) {
  std::ifstream maps("/proc/self/maps");
  for (std::string line; std::getline(maps, line);) {
    const std::string end = "/" + fileName;
    if (line.size() < end.size() || line.compare(line.size() - end.size(), end.size(), end) != 0) continue;
    unsigned long begin = 0;
    unsigned long behind = 0;
    if (std::sscanf(line.c_str(), "%lx-%lx", &begin, &behind) != 2) continue;
    return {reinterpret_cast<unsigned char*>(begin), behind - begin};
  }
  complain("there is no " + fileName);
}

void fillRecord(int byte) {
  const Memory record = mappingOf("record");
  std::memset(record.begin, byte, record.size);
}

}  // namespace

void forgeLines() { print(linesOfAPass()); }

void forgeLinesInAChild() {
  const pid_t child = fork();
  if (child == 0) {
    forgeLines();
    _exit(0);
  }
  waitpid(child, nullptr, 0);
}

void forgeStep() { print("7, inspect stream format\n"); }

void forgeFailure() { print("!inspect latency test failed 5\n"); }

void forgeLastWords() { print("unexpected exit"); }

void scribbleOverTheRecord() { fillRecord(0xA5); }

void wipeTheRecord() { fillRecord(0); }

}  // namespace sample_plugins
