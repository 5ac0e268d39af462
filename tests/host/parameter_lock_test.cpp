// SPDX-License-Identifier: MIT
// VSTWrapper::lock: held while the instance's getParameter and setParameter run, free again afterwards
// whatever happens.
#include "tests/shared/observed_thread.h"
#include "tests/shared/wrapper_fixture.h"

namespace {

using namespace doubles;
using host_tests::everyThrown;
using host_tests::Thrown;
using testing::ElementsAre;

/// The lock as it looks from inside the plug-in.
struct LockState {
  std::int32_t lockCount;
  std::int32_t recursionDepth;
  bool isCallers;
  bool operator==(const LockState& other) const {
    return lockCount == other.lockCount && recursionDepth == other.recursionDepth &&
           isCallers == other.isCallers;
  }
};

void PrintTo(const LockState& state, std::ostream* stream) {
  *stream << "lockCount " << state.lockCount << ", recursionDepth " << state.recursionDepth
          << (state.isCallers ? ", the caller's" : ", not the caller's");
}

constexpr LockState kHeld{1, 0, true};
constexpr LockState kHeldTwice{1, 1, true};
constexpr LockState kFree{0, 0, false};

class VSTWrapperLock : public host_tests::WrapperTest {
 protected:
  VSTWrapperLock() {
    effect.setParameters({0.25f, 0.5f});
    open();
  }

  LockState lockState() const {
    return {wrapper->lock.lockCount, wrapper->lock.recursionDepth,
            wrapper->lock.owner.IsEqual(NiduThreadID::CurrentThread())};
  }

  /// Nobody has the lock, and another thread gets it.
  void expectFree() const {
    ASSERT_EQ(lockState(), kFree);
    ObservedThread other([this] {
      wrapper->lock.lock();
      EXPECT_EQ(lockState(), kHeld);
      wrapper->lock.unlock();
    });
    other.join();
  }
};

TEST_F(VSTWrapperLock, IsHeldWhileThePluginReadsAParameter) {
  std::vector<LockState> seen;
  effect.onRequest = [&](const Request&) { seen.push_back(lockState()); };
  wrapper->getParameter(0);
  EXPECT_THAT(seen, ElementsAre(kHeld));
  expectFree();
}

TEST_F(VSTWrapperLock, IsHeldWhileThePluginIsComparedAndSet) {
  std::vector<LockState> seen;
  effect.onRequest = [&](const Request&) { seen.push_back(lockState()); };
  wrapper->setParameter(0, 0.9f);
  EXPECT_THAT(seen, ElementsAre(kHeld, kHeld));
  expectFree();
}

TEST_F(VSTWrapperLock, IsFreeAfterAValueThatWasNotSent) {
  wrapper->setParameter(0, 0.25f);
  expectFree();
}

TEST_F(VSTWrapperLock, IsNotTakenForAnIndexThatNoParameterHas) {
  wrapper->lock.lock();
  ObservedThread other([this] {
    wrapper->getParameter(2);
    wrapper->setParameter(-1, 0.5f);
  });
  other.join();
  wrapper->lock.unlock();
}

TEST_F(VSTWrapperLock, IsFreeAfterThePluginThrew) {
  for (const auto throwing : {Request::Kind::kGetParameter, Request::Kind::kSetParameter}) {
    for (const Thrown& thrown : everyThrown()) {
      SCOPED_TRACE(thrown.name);
      effect.onRequest = [&](const Request& request) {
        if (request.kind == throwing) thrown.raise();
      };
      wrapper->getParameter(0);
      expectFree();
      wrapper->setParameter(0, 0.9f);
      expectFree();
      effect.setParameters({0.25f, 0.5f});
    }
  }
}

// What plug-ins and their hosts do to each other: setting one parameter tells the host, which looks.
TEST_F(VSTWrapperLock, MayBeTakenAgainFromInsideThePlugin) {
  std::vector<LockState> seen;
  float readInside = 0.0f;
  effect.onRequest = [&](const Request& request) {
    seen.push_back(lockState());
    if (request == setParameterTo(0, 0.9f)) readInside = wrapper->getParameter(1);
  };
  wrapper->setParameter(0, 0.9f);
  EXPECT_EQ(readInside, 0.5f);
  EXPECT_THAT(effect.requests(), ElementsAre(getParameterOf(0), setParameterTo(0, 0.9f), getParameterOf(1)));
  EXPECT_THAT(seen, ElementsAre(kHeld, kHeld, kHeldTwice));
  expectFree();
}

TEST_F(VSTWrapperLock, IsFreeAfterASettingInsideASettingToo) {
  std::vector<VstInt32> beingSet;
  effect.onRequest = [&](const Request& request) {
    if (request.kind == Request::Kind::kSetParameter) beingSet.push_back(wrapper->paramBeingSet);
    if (request == setParameterTo(0, 0.9f)) wrapper->setParameter(1, 0.8f);
  };
  wrapper->setParameter(0, 0.9f);
  EXPECT_THAT(effect.requests(), ElementsAre(getParameterOf(0), setParameterTo(0, 0.9f), getParameterOf(1),
                                             setParameterTo(1, 0.8f)));
  EXPECT_THAT(beingSet, ElementsAre(0, 1));
  EXPECT_EQ(wrapper->paramBeingSet, -1);
  expectFree();
}

TEST_F(VSTWrapperLock, KeepsASecondThreadOutOfThePluginUntilTheFirstIsDone) {
  std::unique_ptr<ObservedThread> second;
  std::vector<Request> seenByTheFirst;
  effect.onRequest = [&](const Request& request) {
    if (request != setParameterTo(0, 0.9f)) return;
    second = std::make_unique<ObservedThread>([this] { EXPECT_EQ(wrapper->getParameter(1), 0.5f); });
    EXPECT_TRUE(second->isSeenAsleep());
    seenByTheFirst = effect.requests();
  };
  wrapper->setParameter(0, 0.9f);
  ASSERT_NE(second, nullptr);
  second->join();
  EXPECT_THAT(seenByTheFirst, ElementsAre(getParameterOf(0), setParameterTo(0, 0.9f)));
  EXPECT_THAT(effect.requests(), ElementsAre(getParameterOf(0), setParameterTo(0, 0.9f), getParameterOf(1)));
  expectFree();
}

TEST_F(VSTWrapperLock, MakesASecondThreadsSettingWaitToo) {
  std::unique_ptr<ObservedThread> second;
  effect.onRequest = [&](const Request& request) {
    if (request != getParameterOf(0) || second != nullptr) return;
    second = std::make_unique<ObservedThread>([this] { wrapper->setParameter(0, 0.9f); });
    EXPECT_TRUE(second->isSeenAsleep());
  };
  EXPECT_EQ(wrapper->getParameter(0), 0.25f);
  ASSERT_NE(second, nullptr);
  second->join();
  EXPECT_THAT(effect.requests(), ElementsAre(getParameterOf(0), getParameterOf(0), setParameterTo(0, 0.9f)));
}

TEST_F(VSTWrapperLock, BelongsToOneInstanceAlone) {
  RecordingEffect another;
  another.setParameters({0.125f});
  plugin.willCreate(another);
  const auto other = create();
  effect.onRequest = [&](const Request&) {
    ObservedThread second([&] { EXPECT_EQ(other->getParameter(0), 0.125f); });
    second.join();
  };
  wrapper->getParameter(0);
}

}  // namespace
