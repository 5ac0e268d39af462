// SPDX-License-Identifier: MIT
// A counting semaphore that starts without a token.
//
// Failures: if the kernel could not create the semaphore, wait() and signal() return KERN_INVALID_ARGUMENT
//           (4) at once.
// Threads:  any thread may wait and signal. Waiting threads are served in order of arrival.
#pragma once

#include <memory>

class NiduSemaphore {
 public:
  NiduSemaphore();
  ~NiduSemaphore();
  NiduSemaphore(NiduSemaphore const&) = delete;
  NiduSemaphore& operator=(NiduSemaphore const&) = delete;

  /// Takes one token, sleeping until there is one. After an interruption by a signal handler the wait
  /// begins again, at the end of the queue. Returns the kernel's last result: KERN_SUCCESS (0) with a token.
  int wait();

  /// Gives one token. Returns the kernel's result.
  int signal();

 private:
  struct Implementation;
  std::unique_ptr<Implementation> implementation;
};
