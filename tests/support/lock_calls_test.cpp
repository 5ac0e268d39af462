// SPDX-License-Identifier: MIT
// What the semaphore and the lock ask of the kernel, call by call.
#include <thread>

#include "gmock/gmock.h"
#include "gtest/gtest.h"
#include "support/recursive_mutex.h"
#include "support/semaphore.h"
#include "tests/support/recording_mach_semaphore.h"

namespace {

using testing::ElementsAre;
using testing::IsEmpty;

class LockCalls : public testing::Test {
 protected:
  void SetUp() override { recordingKernel() = RecordingKernel(); }
  static std::vector<std::string>& calls() { return recordingKernel().calls; }
};

using NiduSemaphoreCalls = LockCalls;
using NiduCoreRecursiveMutexCalls = LockCalls;

TEST_F(NiduSemaphoreCalls, CreatesAnEmptyFifoSemaphoreAndDestroysIt) {
  { const NiduSemaphore semaphore; }
  EXPECT_THAT(calls(), ElementsAre("create self policy 0 value 0", "destroy self S"));
}

TEST_F(NiduSemaphoreCalls, AWaitIsRepeatedForAsLongAsItIsAborted) {
  NiduSemaphore semaphore;
  calls().clear();
  recordingKernel().waitAnswers = {14, 14, 0};
  EXPECT_EQ(semaphore.wait(), 0);
  EXPECT_THAT(calls(), ElementsAre("wait S", "wait S", "wait S"));
}

TEST_F(NiduSemaphoreCalls, AnyOtherFailureEndsTheWaitAndIsReturned) {
  NiduSemaphore semaphore;
  calls().clear();
  recordingKernel().waitAnswers = {14, 37, 0};
  EXPECT_EQ(semaphore.wait(), 37);
  EXPECT_THAT(calls(), ElementsAre("wait S", "wait S"));
}

TEST_F(NiduSemaphoreCalls, ASignalIsMadeOnceAndItsResultReturned) {
  NiduSemaphore semaphore;
  calls().clear();
  recordingKernel().signalAnswer = 14;
  EXPECT_EQ(semaphore.signal(), 14);
  EXPECT_THAT(calls(), ElementsAre("signal S"));
}

TEST_F(NiduSemaphoreCalls, AFailedCreationIsIgnored) {
  recordingKernel().createAnswer = 6;
  {
    NiduSemaphore semaphore;
    recordingKernel().waitAnswers = {4};
    recordingKernel().signalAnswer = 4;
    EXPECT_EQ(semaphore.wait(), 4);
    EXPECT_EQ(semaphore.signal(), 4);
  }
  EXPECT_THAT(calls(),
              ElementsAre("create self policy 0 value 0", "wait null", "signal null", "destroy self null"));
}

TEST_F(NiduCoreRecursiveMutexCalls, ThreeLocksAndUnlocksOfOneThreadNeverTouchTheSemaphore) {
  const NiduCoreRecursiveMutex mutex;
  calls().clear();
  for (int lock = 0; lock < 3; ++lock) mutex.lock();
  for (int unlock = 0; unlock < 3; ++unlock) mutex.unlock();
  EXPECT_THAT(calls(), IsEmpty());
  EXPECT_EQ(mutex.lockCount, 0);
  EXPECT_EQ(mutex.recursionDepth, 0);
  EXPECT_TRUE(mutex.owner.IsEqual(NiduThreadID()));
}

TEST_F(NiduCoreRecursiveMutexCalls, RecursionLeavesTheCounterAlone) {
  const NiduCoreRecursiveMutex mutex;
  mutex.lock();
  // A value that no addition could leave in place.
  mutex.lockCount = 1000;
  mutex.lock();
  mutex.lock();
  EXPECT_EQ(mutex.recursionDepth, 2);
  EXPECT_EQ(mutex.lockCount, 1000);
  mutex.unlock();
  mutex.unlock();
  EXPECT_EQ(mutex.lockCount, 1000);
  mutex.lockCount = 1;
  mutex.unlock();
  EXPECT_EQ(mutex.lockCount, 0);
}

TEST_F(NiduCoreRecursiveMutexCalls, ALaterThreadWaitsOnceAndTheEarlierSignalsOnce) {
  const NiduCoreRecursiveMutex mutex;
  calls().clear();
  mutex.lock();
  mutex.lockCount = 2;  // as if another thread had come meanwhile
  mutex.unlock();
  EXPECT_THAT(calls(), ElementsAre("signal S"));
  EXPECT_EQ(mutex.lockCount, 1);
  mutex.lock();
  EXPECT_THAT(calls(), ElementsAre("signal S", "wait S"));
  EXPECT_EQ(mutex.lockCount, 2);
}

TEST_F(NiduCoreRecursiveMutexCalls, AnUnlockOfAThreadThatDoesNotHoldTheLockMakesNoCall) {
  const NiduCoreRecursiveMutex mutex;
  mutex.lock();
  mutex.lockCount = 2;
  calls().clear();
  std::thread([&] { mutex.unlock(); }).join();
  EXPECT_THAT(calls(), IsEmpty());
  EXPECT_EQ(mutex.lockCount, 2);
}

TEST_F(NiduCoreRecursiveMutexCalls, WithoutASemaphoreAThreadThatOughtToWaitGoesOn) {
  recordingKernel().createAnswer = 6;
  recordingKernel().waitAnswers = {4};
  recordingKernel().signalAnswer = 4;
  const NiduCoreRecursiveMutex mutex;
  mutex.lock();
  std::thread([&] {
    mutex.lock();
    EXPECT_TRUE(mutex.owner.IsEqual(NiduThreadID::CurrentThread()));
    mutex.unlock();
  }).join();
  EXPECT_THAT(calls(), ElementsAre("create self policy 0 value 0", "wait null", "signal null"));
  EXPECT_EQ(mutex.lockCount, 1);
}

}  // namespace
