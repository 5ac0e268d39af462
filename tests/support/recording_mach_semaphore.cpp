// SPDX-License-Identifier: MIT
// The stand-in takes the place of the system's functions at link time.
#include "tests/support/recording_mach_semaphore.h"

namespace {

char theSemaphore;

semaphore_t semaphoreHandle() { return reinterpret_cast<semaphore_t>(&theSemaphore); }

std::string nameOf(semaphore_t semaphore) {
  if (!semaphore) return "null";
  return semaphore == semaphoreHandle() ? "S" : "unknown";
}

std::string nameOf(task_t task) { return task == mach_task_self() ? "self" : "unknown"; }

}  // namespace

RecordingKernel& recordingKernel() {
  static RecordingKernel kernel;
  return kernel;
}

task_t mach_task_self() { return 77; }

kern_return_t semaphore_create(task_t task, semaphore_t* semaphore, int policy, int value) {
  RecordingKernel& kernel = recordingKernel();
  kernel.calls.push_back("create " + nameOf(task) + " policy " + std::to_string(policy) + " value " +
                         std::to_string(value));
  if (kernel.createAnswer == KERN_SUCCESS) *semaphore = semaphoreHandle();
  return kernel.createAnswer;
}

kern_return_t semaphore_destroy(task_t task, semaphore_t semaphore) {
  recordingKernel().calls.push_back("destroy " + nameOf(task) + " " + nameOf(semaphore));
  return semaphore ? KERN_SUCCESS : KERN_INVALID_ARGUMENT;
}

kern_return_t semaphore_wait(semaphore_t semaphore) {
  RecordingKernel& kernel = recordingKernel();
  kernel.calls.push_back("wait " + nameOf(semaphore));
  if (kernel.waitAnswers.empty()) return KERN_SUCCESS;
  const kern_return_t answer = kernel.waitAnswers.front();
  kernel.waitAnswers.erase(kernel.waitAnswers.begin());
  return answer;
}

kern_return_t semaphore_signal(semaphore_t semaphore) {
  recordingKernel().calls.push_back("signal " + nameOf(semaphore));
  return recordingKernel().signalAnswer;
}
