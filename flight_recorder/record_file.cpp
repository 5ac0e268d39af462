// SPDX-License-Identifier: MIT
#include "flight_recorder/record_file.h"

#include <cerrno>
#include <cstring>

#include <fcntl.h>
#include <pthread.h>
#include <sys/mman.h>
#include <sys/stat.h>
#include <unistd.h>

#include "flight_recorder/flight_recorder.h"

namespace {

constexpr mode_t kModeOfNewFile = 0666;

/// Closes the file at the end of the scope: the mapping needs it no longer, and the plug-in is to find the
/// descriptors that it would find without a record.
class OpenFile {
 public:
  explicit OpenFile(const std::string& path)
      : descriptor(open(path.c_str(), O_RDWR | O_CREAT | O_CLOEXEC | O_NONBLOCK | O_NOCTTY, kModeOfNewFile)) {
  }
  ~OpenFile() {
    if (descriptor >= 0) close(descriptor);
  }
  OpenFile(const OpenFile&) = delete;
  OpenFile& operator=(const OpenFile&) = delete;

  const int descriptor;
};

/// Writes the zeros rather than lengthen the file: on a full disk a store to what is not there is a SIGBUS.
bool fillWithZeros(int descriptor) {
  const char zeros[kFlightRecordSizeInBytes] = {};
  return pwrite(descriptor, zeros, sizeof zeros, 0) == static_cast<ssize_t>(sizeof zeros);
}

void* map(int descriptor, void* place, int flags) {
  return mmap(place, kFlightRecordSizeInBytes, PROT_READ | PROT_WRITE, MAP_SHARED | flags, descriptor, 0);
}

}  // namespace

bool keepRecordIn(const std::string& path, std::string& whyNot) {
  const OpenFile file(path);
  struct stat status = {};
  if (file.descriptor < 0 || fstat(file.descriptor, &status) != 0) {
    whyNot = std::strerror(errno);
    return false;
  }
  if (!S_ISREG(status.st_mode)) {
    whyNot = "Not a regular file";
    return false;
  }
  if (status.st_size != 0 && status.st_size != static_cast<off_t>(kFlightRecordSizeInBytes)) {
    whyNot = "The file has " + std::to_string(status.st_size) + " bytes, a record has 4096";
    return false;
  }
  errno = ENOSPC;
  void* observed = MAP_FAILED;
  if (!fillWithZeros(file.descriptor) || (observed = map(file.descriptor, nullptr, 0)) == MAP_FAILED ||
      map(file.descriptor, &gFlightRecordPage, MAP_FIXED) == MAP_FAILED) {
    whyNot = std::strerror(errno);
    return false;
  }
  pthread_atfork(nullptr, nullptr, forgetObservedRun);
  observeRun(*static_cast<FlightRecord*>(observed), static_cast<std::uint32_t>(getpid()));
  return true;
}
