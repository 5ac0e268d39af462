// SPDX-License-Identifier: MIT
#include "scanner/system/linux/system_calls.h"

#include <cstdlib>

#include <elf.h>
#include <fcntl.h>
#include <unistd.h>

namespace scanner::system {
namespace {

struct SystemCall {
  const char* name;
  int numberFor64Bit;  ///< x86-64; -1: not there
  int numberFor32Bit;  ///< i386
};

constexpr SystemCall kSystemCalls[] = {
    {"read", 0, 3},
    {"write", 1, 4},
    {"open", 2, 5},
    {"poll", 7, 168},
    {"ioctl", 16, 54},
    {"readv", 19, 145},
    {"writev", 20, 146},
    {"select", 23, 142},
    {"msync", 26, 144},
    {"pause", 34, 29},
    {"nanosleep", 35, 162},
    {"connect", 42, 362},
    {"accept", 43, -1},
    {"sendto", 44, 369},
    {"recvfrom", 45, 371},
    {"sendmsg", 46, 370},
    {"recvmsg", 47, 372},
    {"wait4", 61, 114},
    {"kill", 62, 37},
    {"semop", 65, -1},
    {"msgrcv", 70, 401},
    {"fcntl", 72, 221},
    {"flock", 73, 143},
    {"fsync", 74, 118},
    {"rt_sigtimedwait", 128, 177},
    {"rt_sigsuspend", 130, 179},
    {"futex", 202, 240},
    {"semtimedop", 220, -1},
    {"clock_nanosleep", 230, 267},
    {"tgkill", 234, 270},
    {"epoll_wait", 232, 256},
    {"mq_timedreceive", 243, 280},
    {"waitid", 247, 284},
    {"openat", 257, 295},
    {"pselect6", 270, 308},
    {"ppoll", 271, 309},
    {"epoll_pwait", 281, 319},
    {"accept4", 288, 364},
    {"io_uring_enter", 426, 426},
    {"futex_time64", -1, 422},
    {"clock_nanosleep_time64", -1, 407},
    {"ppoll_time64", -1, 414},
    {"pselect6_time64", -1, 413},
};

}  // namespace

std::string systemCallName(const std::string& line, bool is32Bit) {
  if (line.empty() || line[0] < '0' || line[0] > '9') return {};
  const int number = std::atoi(line.c_str());
#if defined(__x86_64__) || defined(__i386__)
  for (const SystemCall& call : kSystemCalls) {
    if (number == (is32Bit ? call.numberFor32Bit : call.numberFor64Bit)) return call.name;
  }
#endif
  return "system call " + std::to_string(number);
}

bool is32Bit(int process) {
  const int file = open(("/proc/" + std::to_string(process) + "/exe").c_str(), O_RDONLY | O_CLOEXEC);
  if (file < 0) return false;
  unsigned char header[EI_NIDENT] = {};
  const ssize_t count = read(file, header, sizeof header);
  close(file);
  return count == static_cast<ssize_t>(sizeof header) && header[EI_CLASS] == ELFCLASS32;
}

}  // namespace scanner::system
