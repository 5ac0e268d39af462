// SPDX-License-Identifier: MIT
#include "scanner/scan/whole_file.h"

#include <cerrno>
#include <cstdio>
#include <cstdlib>
#include <cstring>
#include <memory>
#include <stdexcept>

#include <fcntl.h>
#include <sys/stat.h>
#include <unistd.h>

namespace scanner {
namespace {

/// The file behind all links; the path itself where there is none yet.
std::string withoutLinks(const std::string& path) {
  const std::unique_ptr<char, void (*)(void*)> resolved(realpath(path.c_str(), nullptr), std::free);
  return resolved ? resolved.get() : path;
}

}  // namespace

WholeFile::WholeFile(const std::string& file) : name(file), path(withoutLinks(file)) {
  struct stat status = {};
  if (file == "-") {
    name = "standard output";
    descriptor = STDOUT_FILENO;
  } else if (stat(path.c_str(), &status) != 0) {
    openTemporary();
  } else if (S_ISREG(status.st_mode)) {
    // A file that may not be written to is not to be replaced either.
    if (access(path.c_str(), W_OK) != 0) fail();
    openTemporary();
    // The new file is for the same readers.
    [[maybe_unused]] const int result = fchmod(descriptor, status.st_mode & 07777);
  } else {
    descriptor = open(path.c_str(), O_WRONLY | O_CLOEXEC);
    if (descriptor < 0) fail();
  }
}

WholeFile::~WholeFile() {
  if (descriptor > STDERR_FILENO) close(descriptor);
  if (!temporary.empty()) unlink(temporary.c_str());
}

void WholeFile::openTemporary() {
  const std::size_t slash = path.rfind('/');
  const std::string folder = slash == std::string::npos ? "" : path.substr(0, slash + 1);
  for (int number = 0; descriptor < 0 && number < 100; ++number) {
    temporary = folder + ".vsttorture-scan-" + std::to_string(getpid()) + "-" + std::to_string(number);
    descriptor = open(temporary.c_str(), O_WRONLY | O_CREAT | O_EXCL | O_CLOEXEC, 0666);
    if (descriptor < 0 && errno != EEXIST) break;
  }
  if (descriptor < 0) {
    temporary.clear();
    fail();
  }
}

void WholeFile::write(const std::string& text) {
  std::size_t written = 0;
  while (written < text.size()) {
    const ssize_t count = ::write(descriptor, text.data() + written, text.size() - written);
    if (count < 0 && errno != EINTR) fail();
    if (count > 0) written += static_cast<std::size_t>(count);
  }
}

void WholeFile::finish() {
  if (descriptor == STDOUT_FILENO) return;
  // Some file systems say only now that the disk is full.
  const int result = close(descriptor);
  descriptor = -1;
  if (result != 0) fail();
  if (temporary.empty()) return;
  if (std::rename(temporary.c_str(), path.c_str()) != 0) fail();
  temporary.clear();
}

void WholeFile::fail() const { throw std::runtime_error(name + ": " + std::strerror(errno)); }

}  // namespace scanner
