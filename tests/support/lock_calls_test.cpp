// SPDX-License-Identifier: MIT
// What the semaphore and the lock ask of the kernel, call by call, and the fields of the lock at each
// addition. The kernel is this file's own and never sleeps.
#include <optional>
#include <string>
#include <thread>
#include <type_traits>
#include <vector>

#include "gmock/gmock.h"
#include "gtest/gtest.h"
#include "platform/atomic_add.h"
#include "platform/mach_semaphore.h"
#include "support/recursive_mutex.h"
#include "support/semaphore.h"

namespace {

using testing::ElementsAre;
using testing::IsEmpty;

struct Kernel {
  std::vector<std::string> calls;          // such as "wait S" and "wait null"; S is the one semaphore
  kern_return_t createAnswer = 0;          // a failure leaves the semaphore null
  std::vector<kern_return_t> waitAnswers;  // one for each wait; 0 after the last
  kern_return_t signalAnswer = 0;
  const NiduCoreRecursiveMutex* lock = nullptr;  // whose fields are recorded at an addition
};
Kernel kernel;

semaphore_t theSemaphore() { return reinterpret_cast<semaphore_t>(&kernel); }

void record(const std::string& call, semaphore_t semaphore) {
  kernel.calls.push_back(call + (semaphore == theSemaphore() ? " S" : semaphore ? " unknown" : " null"));
}

std::string nameOf(task_t task) { return task == mach_task_self() ? " self" : " another task"; }

std::string nameOf(const NiduThreadID& thread) {
  if (thread.IsEqual(NiduThreadID())) return "none";
  return thread.IsEqual(NiduThreadID::CurrentThread()) ? "me" : "another";
}

}  // namespace

task_t mach_task_self() { return 77; }

kern_return_t semaphore_create(task_t task, semaphore_t* semaphore, int policy, int value) {
  kernel.calls.push_back("create" + nameOf(task) + " policy " + std::to_string(policy) + " value " +
                         std::to_string(value));
  if (kernel.createAnswer == 0) *semaphore = theSemaphore();
  return kernel.createAnswer;
}

kern_return_t semaphore_destroy(task_t task, semaphore_t semaphore) {
  record("destroy" + nameOf(task), semaphore);
  return 0;
}

kern_return_t semaphore_wait(semaphore_t semaphore) {
  record("wait", semaphore);
  if (kernel.waitAnswers.empty()) return 0;
  const kern_return_t answer = kernel.waitAnswers.front();
  kernel.waitAnswers.erase(kernel.waitAnswers.begin());
  return answer;
}

kern_return_t semaphore_signal(semaphore_t semaphore) {
  record("signal", semaphore);
  return kernel.signalAnswer;
}

std::int32_t OSAtomicAdd32Barrier(std::int32_t amount, volatile std::int32_t* value) {
  std::string call = "add " + std::to_string(amount) + " to " + std::to_string(*value);
  if (kernel.lock != nullptr)
    call +=
        ", depth " + std::to_string(kernel.lock->recursionDepth) + ", owner " + nameOf(kernel.lock->owner);
  kernel.calls.push_back(call);
  return *value += amount;
}

namespace {

class NiduSemaphoreCalls : public testing::Test {
 protected:
  NiduSemaphoreCalls() { kernel = Kernel(); }
};

TEST_F(NiduSemaphoreCalls, CreatesAnEmptyFifoSemaphoreAndDestroysIt) {
  { const NiduSemaphore semaphore; }
  EXPECT_THAT(kernel.calls, ElementsAre("create self policy 0 value 0", "destroy self S"));
  EXPECT_FALSE(std::is_copy_constructible_v<NiduSemaphore> || std::is_copy_assignable_v<NiduSemaphore>);
}

TEST_F(NiduSemaphoreCalls, AWaitIsRepeatedForAsLongAsItIsAborted) {
  NiduSemaphore semaphore;
  kernel = Kernel();
  kernel.waitAnswers = {14, 14, 0, 14, 37, 0};
  EXPECT_EQ(semaphore.wait(), 0);
  EXPECT_THAT(kernel.calls, ElementsAre("wait S", "wait S", "wait S"));
  EXPECT_EQ(semaphore.wait(), 37);
  EXPECT_EQ(kernel.calls.size(), 5u);
}

TEST_F(NiduSemaphoreCalls, ASignalIsMadeOnceAndItsResultReturned) {
  NiduSemaphore semaphore;
  kernel = Kernel();
  kernel.signalAnswer = 14;
  EXPECT_EQ(semaphore.signal(), 14);
  EXPECT_THAT(kernel.calls, ElementsAre("signal S"));
}

TEST_F(NiduSemaphoreCalls, AFailedCreationIsIgnored) {
  kernel.createAnswer = 6;
  kernel.waitAnswers = {4};
  kernel.signalAnswer = 4;
  {
    NiduSemaphore semaphore;
    EXPECT_EQ(semaphore.wait(), 4);
    EXPECT_EQ(semaphore.signal(), 4);
  }
  EXPECT_THAT(kernel.calls,
              ElementsAre("create self policy 0 value 0", "wait null", "signal null", "destroy self null"));
}

class NiduCoreRecursiveMutexCalls : public testing::Test {
 protected:
  NiduCoreRecursiveMutexCalls() {
    kernel = Kernel();
    mutex.emplace();
    kernel.calls.clear();
    kernel.lock = &*mutex;
  }
  std::optional<NiduCoreRecursiveMutex> mutex;
};

TEST_F(NiduCoreRecursiveMutexCalls,
       OnlyTheFirstLockAndTheLastUnlockAddAndTheOwnerIsClearedBeforeTheCountGoesDown) {
  for (int lock = 0; lock < 3; ++lock) mutex->lock();
  EXPECT_EQ(mutex->recursionDepth, 2);
  EXPECT_EQ(nameOf(mutex->owner), "me");
  for (int unlock = 0; unlock < 3; ++unlock) mutex->unlock();
  EXPECT_THAT(kernel.calls,
              ElementsAre("add 1 to 0, depth 0, owner none", "add -1 to 1, depth 0, owner none"));
}

TEST_F(NiduCoreRecursiveMutexCalls, AThreadThatComesLaterWaitsOnceAndThenOwnsTheLockWithoutDepth) {
  mutex->lockCount = 1;
  mutex->recursionDepth = 5;
  mutex->lock();
  EXPECT_THAT(kernel.calls, ElementsAre("add 1 to 1, depth 5, owner none", "wait S"));
  EXPECT_EQ(mutex->recursionDepth, 0);
  EXPECT_EQ(nameOf(mutex->owner), "me");
}

TEST_F(NiduCoreRecursiveMutexCalls, AnUnlockWhileAnotherThreadWaitsSignalsOnce) {
  mutex->lock();
  mutex->lockCount = 3;
  mutex->unlock();
  EXPECT_THAT(kernel.calls,
              ElementsAre("add 1 to 0, depth 0, owner none", "add -1 to 3, depth 0, owner none", "signal S"));
}

TEST_F(NiduCoreRecursiveMutexCalls, AnUnlockByAThreadThatDoesNotHoldTheLockChangesNothing) {
  mutex->unlock();
  EXPECT_THAT(kernel.calls, IsEmpty());
  mutex->lock();
  mutex->lock();
  kernel.calls.clear();
  std::thread([&] { mutex->unlock(); }).join();
  EXPECT_THAT(kernel.calls, IsEmpty());
  EXPECT_EQ(mutex->recursionDepth, 1);
  EXPECT_EQ(nameOf(mutex->owner), "me");
}

TEST_F(NiduCoreRecursiveMutexCalls, WithoutASemaphoreAThreadThatShouldWaitDoesNot) {
  kernel.createAnswer = 6;
  mutex.emplace();
  kernel.waitAnswers = {4};
  mutex->lock();
  std::thread([&] {
    mutex->lock();
    EXPECT_EQ(nameOf(mutex->owner), "me");
    mutex->unlock();
  }).join();
  EXPECT_EQ(mutex->lockCount, 1);
  EXPECT_THAT(kernel.calls, testing::IsSupersetOf({"wait null", "signal null"}));
}

}  // namespace
