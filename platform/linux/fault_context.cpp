// SPDX-License-Identifier: MIT
// Images are looked up in /proc/self/maps: dladdr() takes a lock that the interrupted code may hold.
#include "platform/fault_context.h"

#include <algorithm>
#include <cerrno>
#include <cstring>

#include <fcntl.h>
#include <ucontext.h>
#include <unistd.h>

namespace {

/// The lines of a file, read in pieces.
class MapsFile {
 public:
  MapsFile() : descriptor(open("/proc/self/maps", O_RDONLY | O_CLOEXEC)) {}
  ~MapsFile() {
    if (descriptor >= 0) close(descriptor);
  }
  MapsFile(const MapsFile&) = delete;
  MapsFile& operator=(const MapsFile&) = delete;

  /// The next line, without its end; null behind the last. Valid until the next call. The front of a line
  /// that is too long is kept.
  const char* nextLine() {
    std::size_t length = 0;
    for (int c = next(); c != kEnd; c = next()) {
      if (c == '\n') {
        line[length] = '\0';
        return line;
      }
      if (length < sizeof line - 1) line[length++] = static_cast<char>(c);
    }
    return nullptr;
  }

 private:
  static constexpr int kEnd = -1;

  int next() {
    if (position == filled && !fill()) return kEnd;
    return static_cast<unsigned char>(buffer[position++]);
  }

  bool fill() {
    if (descriptor < 0) return false;
    ssize_t count = 0;
    do count = read(descriptor, buffer, sizeof buffer);
    while (count < 0 && errno == EINTR);
    position = 0;
    filled = count > 0 ? static_cast<std::size_t>(count) : 0;
    return filled > 0;
  }

  int descriptor;
  std::size_t position = 0;
  std::size_t filled = 0;
  char buffer[1024];
  char line[4352];  // the longest path, and what stands before it
};

/// Reads a hexadecimal number and leaves `text` behind it.
std::uint64_t takeHexadecimal(const char*& text) {
  std::uint64_t number = 0;
  for (;; ++text) {
    if (*text >= '0' && *text <= '9') {
      number = number * 16 + static_cast<std::uint64_t>(*text - '0');
    } else if (*text >= 'a' && *text <= 'f') {
      number = number * 16 + static_cast<std::uint64_t>(*text - 'a' + 10);
    } else {
      return number;
    }
  }
}

/// The path at the end of "BEGIN-END PERMISSIONS OFFSET DEVICE INODE    PATH"; empty for memory without a
/// file.
const char* pathIn(const char* rest) {
  const char* path = std::strchr(rest, '/');
  return path == nullptr ? "" : path;
}

template <std::size_t size>
void copyEnd(char (&to)[size], const char* from) {
  const std::size_t length = std::strlen(from);
  const std::size_t kept = std::min(length, size - 1);
  std::memcpy(to, from + length - kept, kept);
  to[kept] = '\0';
}

}  // namespace

std::uint64_t programCounterOf(const void* context) {
  [[maybe_unused]] const auto& machine = static_cast<const ucontext_t*>(context)->uc_mcontext;
#if defined(__x86_64__)
  return static_cast<std::uint64_t>(machine.gregs[REG_RIP]);
#elif defined(__i386__)
  return static_cast<std::uint32_t>(machine.gregs[REG_EIP]);
#elif defined(__aarch64__)
  return machine.pc;
#else
  return 0;
#endif
}

std::uint64_t faultAddressOf(const siginfo_t& info) {
  switch (info.si_signo) {
    case SIGSEGV:
    case SIGBUS:
    case SIGILL:
    case SIGFPE:
    case SIGTRAP:
    case SIGSYS:
      return info.si_code > 0 ? reinterpret_cast<std::uintptr_t>(info.si_addr) : 0;
    default:
      return 0;
  }
}

bool findLoadedImage(std::uint64_t address, LoadedImage& image) {
  image.address = 0;
  image.path[0] = '\0';
  LoadedImage candidate = {0, ""};
  MapsFile maps;
  while (const char* line = maps.nextLine()) {
    const std::uint64_t begin = takeHexadecimal(line);
    if (*line == '-') ++line;
    const std::uint64_t end = takeHexadecimal(line);
    const char* path = pathIn(line);
    if (*path != '\0') {
      char tail[sizeof candidate.path];
      copyEnd(tail, path);
      // An image begins with the first mapping of its file; all of them stand together.
      if (std::strcmp(tail, candidate.path) != 0) {
        candidate.address = begin;
        std::memcpy(candidate.path, tail, sizeof tail);
      }
    }
    if (address < begin || address >= end) continue;
    if (*path == '\0') return false;
    image = candidate;
    return true;
  }
  return false;
}
