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

}  // namespace

FlightRecord* mapRecordFile(const std::string& path, std::string& whyNot) {
  const OpenFile file(path);
  struct stat status = {};
  if (file.descriptor < 0 || fstat(file.descriptor, &status) != 0) {
    whyNot = std::strerror(errno);
    return nullptr;
  }
  if (!S_ISREG(status.st_mode)) {
    whyNot = "Not a regular file";
    return nullptr;
  }
  if (status.st_size != 0 && status.st_size != static_cast<off_t>(kFlightRecordSizeInBytes)) {
    whyNot = "The file has " + std::to_string(status.st_size) + " bytes, a record has 4096";
    return nullptr;
  }
  errno = ENOSPC;
  if (!fillWithZeros(file.descriptor)) {
    whyNot = std::strerror(errno);
    return nullptr;
  }
  void* memory =
      mmap(nullptr, kFlightRecordSizeInBytes, PROT_READ | PROT_WRITE, MAP_SHARED, file.descriptor, 0);
  if (memory == MAP_FAILED) {
    whyNot = std::strerror(errno);
    return nullptr;
  }
  return static_cast<FlightRecord*>(memory);
}

void observeThisProcess(FlightRecord& record) {
  pthread_atfork(nullptr, nullptr, forgetObservedRun);
  observeRun(record, static_cast<std::uint32_t>(getpid()));
}
