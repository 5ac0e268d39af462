// SPDX-License-Identifier: MIT
// A stand-in for the kernel's semaphores that never sleeps: it records the calls and answers as told.
#pragma once

#include <string>
#include <vector>

#include "platform/mach_semaphore.h"

struct RecordingKernel {
  std::vector<std::string> calls;             // such as "wait S" and "wait null"; S is the one semaphore
  kern_return_t createAnswer = KERN_SUCCESS;  // a failure leaves the semaphore untouched
  std::vector<kern_return_t> waitAnswers;     // one for each wait; KERN_SUCCESS after the last
  kern_return_t signalAnswer = KERN_SUCCESS;
};

/// The one kernel of the test program. Tests start with a fresh one.
RecordingKernel& recordingKernel();
