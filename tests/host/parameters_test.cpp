// SPDX-License-Identifier: MIT
// VSTWrapper: values of parameters through the instance's own two functions, the lock around these, and texts
// and properties of parameters.
#include <climits>
#include <cmath>
#include <cstring>
#include <limits>
#include <string>
#include <utility>
#include <vector>

#include "flight_recorder/flight_recorder.h"
#include "tests/host/preset_bytes.h"
#include "tests/shared/observed_thread.h"
#include "tests/shared/wrapper_fixture.h"

namespace {

using namespace doubles;
using host_tests::everyThrown;
using host_tests::isWrite;
using host_tests::Thrown;
using testing::ElementsAre;
using testing::IsEmpty;

class VSTWrapperParameterValues : public host_tests::WrapperTest {
 protected:
  VSTWrapperParameterValues() {
    effect.setParameters({0.25f, 0.5f, 0.75f});
    open();
  }
};

TEST_F(VSTWrapperParameterValues, AreReadThroughTheInstancesOwnFunction) {
  EXPECT_EQ(wrapper->getParameter(2), 0.75f);
  EXPECT_EQ(wrapper->getParameter(0), 0.25f);
  EXPECT_THAT(effect.requests(), ElementsAre(getParameterOf(2), getParameterOf(0)));
}

TEST_F(VSTWrapperParameterValues, OutsideTheParametersReadAsZeroAndAreNotSet) {
  for (const VstInt32 count : {3, 0, -1, INT_MIN}) {
    effect.aeffect.numParams = count;
    for (const int index : {-1, 3, INT_MIN, INT_MAX}) {
      EXPECT_EQ(wrapper->getParameter(index), 0.0f);
      wrapper->setParameter(index, 0.9f);
    }
  }
  EXPECT_EQ(wrapper->getParameter(0), 0.0f);
  wrapper->setParameter(0, 0.9f);
  EXPECT_THAT(effect.requests(), IsEmpty());
}

TEST_F(VSTWrapperParameterValues, WithoutAnInstanceReadAsZeroAndAreNotSet) {
  wrapper->effect = nullptr;
  EXPECT_EQ(wrapper->getParameter(0), 0.0f);
  wrapper->setParameter(0, 0.9f);
  wrapper->effect = &effect.aeffect;
  EXPECT_THAT(effect.requests(), IsEmpty());
}

TEST_F(VSTWrapperParameterValues, AreReadBeforeTheyAreSet) {
  wrapper->setParameter(1, 0.125f);
  EXPECT_THAT(effect.requests(), ElementsAre(getParameterOf(1), setParameterTo(1, 0.125f)));
}

// On purpose.
TEST_F(VSTWrapperParameterValues, EqualToThePresentOnesAreNotSent) {
  effect.setParameters({0.5f, 0.0f, -0.0f});
  wrapper->setParameter(0, 0.5f);
  wrapper->setParameter(1, -0.0f);
  wrapper->setParameter(2, 0.0f);
  EXPECT_THAT(effect.requests(), ElementsAre(getParameterOf(0), getParameterOf(1), getParameterOf(2)));
}

TEST_F(VSTWrapperParameterValues, AreSentUnclampedWhereTheLastBitDiffers) {
  const float next = std::nextafter(0.5f, 1.0f);
  const float infinity = std::numeric_limits<float>::infinity();
  wrapper->setParameter(0, -1.0f);
  wrapper->setParameter(1, next);
  wrapper->setParameter(2, infinity);
  EXPECT_THAT(effect.parameterWrites(),
              ElementsAre(setParameterTo(0, -1.0f), setParameterTo(1, next), setParameterTo(2, infinity)));
}

TEST_F(VSTWrapperParameterValues, ThatAreNaNAreAlwaysSent) {
  const float nan = std::numeric_limits<float>::quiet_NaN();
  effect.setParameters({nan});
  EXPECT_TRUE(std::isnan(wrapper->getParameter(0)));
  wrapper->setParameter(0, nan);
  EXPECT_THAT(effect.parameterWrites(), ElementsAre(setParameterTo(0, nan)));
}

// Where floats are returned in a wider register, this function returns more than a float holds.
float wideThird(AEffect*, VstInt32) {
  static const volatile float one = 1.0f;
  static const volatile float three = 3.0f;
  return one / three;
}

TEST_F(VSTWrapperParameterValues, ThatWereJustReadAreNotSentBack) {
  effect.aeffect.getParameter = wideThird;
  const volatile float value = wrapper->getParameter(0);
  EXPECT_EQ(value, 0.333333343f);
  wrapper->setParameter(0, value);
  EXPECT_THAT(effect.parameterWrites(), IsEmpty());
}

TEST_F(VSTWrapperParameterValues, AreNamedByParamBeingSetOnlyWhileThePluginSetsThem) {
  std::vector<VstInt32> atReads;
  std::vector<VstInt32> atWrites;
  effect.onRequest = [&](const Request& request) {
    (isWrite(request) ? atWrites : atReads).push_back(wrapper->paramBeingSet);
  };
  wrapper->setParameter(2, 0.1f);
  EXPECT_EQ(wrapper->paramBeingSet, -1);
  wrapper->setParameter(0, 0.25f);
  wrapper->getParameter(1);
  EXPECT_THAT(atReads, ElementsAre(-1, -1, -1));
  EXPECT_THAT(atWrites, ElementsAre(2));
}

// What a crash in the middle of a row is explained by.
TEST_F(VSTWrapperParameterValues, AreNamedByTheFlightRecordOneByOneAlsoInARow) {
  AutoBuffer<char> store;
  wrapper->createTempParameterStore(store);
  effect.setParameters({0.9f, 0.9f});
  using Noted = std::pair<std::uint32_t, std::int32_t>;
  std::vector<Noted> noted;
  effect.onRequest = [&](const Request& request) {
    if (request.kind == Request::Kind::kDispatch) return;
    EXPECT_EQ(flightRecord().request.state, kFlightUnderWay);
    noted.emplace_back(flightRecord().request.kind, flightRecord().request.index);
    if (request.index == 1 && isWrite(request)) throw 7;
  };
  wrapper->restoreFromTempParameterStore(store);
  EXPECT_THAT(noted, ElementsAre(Noted(kFlightGetParameter, 0), Noted(kFlightSetParameter, 0),
                                 Noted(kFlightGetParameter, 1), Noted(kFlightSetParameter, 1)));
  EXPECT_EQ(flightRecord().request.state, kFlightReturned);
  EXPECT_EQ(flightRecord().thrown.kind, kFlightSetParameter);
}

// On purpose: the inner one does not restore the outer one's index.
TEST_F(VSTWrapperParameterValues, ThatAreSetInsideASettingLeaveParamBeingSetAtMinusOne) {
  std::vector<VstInt32> seen;
  effect.onRequest = [&](const Request& request) {
    if (!isWrite(request)) return;
    seen.push_back(wrapper->paramBeingSet);
    if (request.index != 0) return;
    wrapper->setParameter(1, 0.8f);
    seen.push_back(wrapper->paramBeingSet);
  };
  wrapper->setParameter(0, 0.9f);
  EXPECT_THAT(effect.requests(), ElementsAre(getParameterOf(0), setParameterTo(0, 0.9f), getParameterOf(1),
                                             setParameterTo(1, 0.8f)));
  EXPECT_THAT(seen, ElementsAre(0, 1, -1));
  EXPECT_EQ(wrapper->paramBeingSet, -1);
}

TEST_F(VSTWrapperParameterValues, ReadAsZeroAndAreNotSetIfThePluginThrowsOnReading) {
  for (const Thrown& thrown : everyThrown()) {
    SCOPED_TRACE(thrown.name);
    effect.forget();
    effect.onRequest = [&](const Request&) { thrown.raise(); };
    float value = 1.0f;
    EXPECT_NO_THROW(value = wrapper->getParameter(1));
    EXPECT_EQ(value, 0.0f);
    EXPECT_NO_THROW(wrapper->setParameter(1, 0.9f));
    EXPECT_THAT(effect.requests(), ElementsAre(getParameterOf(1), getParameterOf(1)));
  }
}

TEST_F(VSTWrapperParameterValues, MayThrowOnBeingSet) {
  for (const Thrown& thrown : everyThrown()) {
    SCOPED_TRACE(thrown.name);
    VstInt32 atThrow = -1;
    effect.onRequest = [&](const Request& request) {
      if (!isWrite(request)) return;
      atThrow = wrapper->paramBeingSet;
      thrown.raise();
    };
    EXPECT_NO_THROW(wrapper->setParameter(1, 0.9f));
    EXPECT_EQ(atThrow, 1);
    EXPECT_EQ(wrapper->paramBeingSet, -1);
  }
  EXPECT_EQ(effect.parameterWrites(), std::vector<Request>(4, setParameterTo(1, 0.9f)));
}

// ---- The lock

// Count and recursion depth of the lock, and whether it is the caller's.
const std::string kHeld = "1, 0, mine";
const std::string kHeldTwice = "1, 1, mine";
const std::string kFree = "0, 0, not mine";

class VSTWrapperLock : public host_tests::WrapperTest {
 protected:
  VSTWrapperLock() {
    effect.setPrograms({{"Soft", {0.25f, 0.5f}}});
    open();
  }

  std::string lockState() const {
    const NiduCoreRecursiveMutex& lock = wrapper->lock;
    return std::to_string(lock.lockCount) + ", " + std::to_string(lock.recursionDepth) +
           (lock.owner.IsEqual(NiduThreadID::CurrentThread()) ? ", mine" : ", not mine");
  }
};

TEST_F(VSTWrapperLock, IsHeldWhileThePluginReadsAndSetsAndFreeAfterwards) {
  std::vector<std::string> seen;
  effect.onRequest = [&](const Request&) { seen.push_back(lockState()); };
  wrapper->getParameter(0);
  EXPECT_THAT(seen, ElementsAre(kHeld));
  EXPECT_EQ(lockState(), kFree);
  wrapper->setParameter(0, 0.9f);
  EXPECT_THAT(seen, ElementsAre(kHeld, kHeld, kHeld));
  EXPECT_EQ(lockState(), kFree);
  wrapper->setParameter(0, 0.9f);  // Which is not sent.
  EXPECT_EQ(lockState(), kFree);
}

TEST_F(VSTWrapperLock, IsFreeAfterThePluginThrew) {
  for (const Thrown& thrown : everyThrown()) {
    SCOPED_TRACE(thrown.name);
    effect.onRequest = [&](const Request&) { thrown.raise(); };
    wrapper->getParameter(0);
    EXPECT_EQ(lockState(), kFree);
    effect.onRequest = [&](const Request& request) {
      if (isWrite(request)) thrown.raise();
    };
    wrapper->setParameter(0, 0.9f);
    EXPECT_EQ(lockState(), kFree);
  }
}

TEST_F(VSTWrapperLock, IsNotTakenWhereThereIsNoParameter) {
  AutoBuffer<char> full;
  wrapper->createTempParameterStore(full);
  effect.aeffect.numParams = 0;
  const std::string noValue = preset_bytes::program("", {});
  const std::string oneValue = preset_bytes::program("", {0});
  wrapper->lock.lock();
  ObservedThread other([&] {
    wrapper->getParameter(0);
    wrapper->setParameter(-1, 0.5f);
    AutoBuffer<char> store;
    AutoBuffer<char> saved;
    wrapper->createTempParameterStore(store);
    wrapper->restoreFromTempParameterStore(store);
    wrapper->restoreFromTempParameterStore(full);
    wrapper->saveToFXBData(saved, false);
    wrapper->loadFromFXBData(oneValue.data(), 60);
    effect.aeffect.numParams = 2;
    wrapper->restoreFromTempParameterStore(store);
    wrapper->loadFromFXBData(noValue.data(), 56);
  });
  other.join();
  wrapper->lock.unlock();
}

// Some plug-ins ask their host from inside setParameter, and the host asks them back.
TEST_F(VSTWrapperLock, CanBeTakenAgainFromInsideThePlugin) {
  std::vector<std::string> seen;
  effect.onRequest = [&](const Request& request) {
    seen.push_back(lockState());
    if (request == setParameterTo(0, 0.9f)) {
      EXPECT_EQ(wrapper->getParameter(1), 0.5f);
    }
  };
  wrapper->setParameter(0, 0.9f);
  EXPECT_THAT(seen, ElementsAre(kHeld, kHeld, kHeldTwice));
  EXPECT_EQ(lockState(), kFree);
}

// ---- Name, unit and value as text

struct TextCase {
  const char* name;
  VstEffectOpcode opcode;
  std::size_t bufferSize;
  std::string (*ask)(VSTWrapper& wrapper, int index);
};

class VSTWrapperParameterText : public host_tests::WrapperTest, public testing::WithParamInterface<TextCase> {
 protected:
  VSTWrapperParameterText() { open(); }
  std::string text(int index = 0) { return GetParam().ask(*wrapper, index); }
  const VstEffectOpcode opcode = GetParam().opcode;
};

TEST_P(VSTWrapperParameterText, IsAskedForWithAnyIndexInAClearedBufferOfItsSize) {
  effect.setUnterminatedText(opcode, GetParam().bufferSize, 'n');
  for (const int index : {1, -1, INT_MAX}) {
    effect.forget();
    EXPECT_EQ(text(index), std::string(GetParam().bufferSize, 'n'));
    EXPECT_THAT(effect.requests(), ElementsAre(request(opcode, index)));
  }
}

TEST_P(VSTWrapperParameterText, IsTakenWhateverThePluginAnswers) {
  effect.setText(opcode, "text");
  for (const VstIntPtr answer : {0, 1, -1}) {
    effect.answer(opcode, answer);
    EXPECT_EQ(text(), "text");
  }
}

TEST_P(VSTWrapperParameterText, IsNeitherCutNorTrimmed) {
  effect.setText(opcode, "\t A text of more than eight and of more than 24 characters \n");
  EXPECT_EQ(text(), "\t A text of more than eight and of more than 24 characters \n");
}

INSTANTIATE_TEST_SUITE_P(
    Of, VSTWrapperParameterText,
    testing::Values(TextCase{"Name", effGetParamName, 500,
                             [](VSTWrapper& wrapper, int index) { return wrapper.getParameterName(index); }},
                    TextCase{"Label", effGetParamLabel, 256,
                             [](VSTWrapper& wrapper, int index) {
                               return static_cast<const VSTWrapper&>(wrapper).getParameterLabel(index);
                             }},
                    TextCase{"Display", effGetParamDisplay, 256,
                             [](VSTWrapper& wrapper, int index) {
                               return wrapper.getParameterCurValueAsText(index);
                             }}),
    host_tests::nameOfCase<TextCase>);

class VSTWrapperParameters : public host_tests::WrapperTest {
 protected:
  VSTWrapperParameters() { open(); }
};

TEST_F(VSTWrapperParameters, AreSetByTextAfterTheQuestionWhetherThatIsPossible) {
  const std::string text(1000, 't');
  for (const VstIntPtr answer : {7, -2, 0}) {
    effect.forget();
    effect.answerNext(effString2Parameter, {-1, answer});
    EXPECT_EQ(wrapper->setParameterCurValueFromText(-5, text.c_str()), answer);
    EXPECT_THAT(effect.requests(),
                ElementsAre(canParameterBeSetFromText(-5), setParameterFromText(-5, text)));
    EXPECT_EQ(effect.requests().at(1).pointee.address, text.c_str());
  }
}

TEST_F(VSTWrapperParameters, AreNotSentTextIfThePluginAnswersZeroToTheQuestion) {
  effect.answerNext(effString2Parameter, {0, 1});
  EXPECT_EQ(wrapper->setParameterCurValueFromText(1, "440 Hz"), 0);
  EXPECT_THAT(effect.requests(), ElementsAre(canParameterBeSetFromText(1)));
}

TEST_F(VSTWrapperParameters, CanBeAutomatedWithAnyAnswerButZero) {
  const VSTWrapper& readOnly = *wrapper;
  effect.answerNext(effCanBeAutomated, {0, 1, -1});
  EXPECT_FALSE(readOnly.isParameterAutomatable(-1));
  EXPECT_TRUE(readOnly.isParameterAutomatable(-1));
  EXPECT_TRUE(readOnly.isParameterAutomatable(-1));
  EXPECT_EQ(effect.requests(), std::vector<Request>(3, request(effCanBeAutomated, -1)));
}

// The caller clears the record, the wrapper does not; the index is not checked.
TEST_F(VSTWrapperParameters, HavePropertiesThatAreFilledInPlaceWhateverTheAnswer) {
  VstParameterProperties written{};
  written.minInteger = -3;
  effect.setParameterProperties(-1, written);
  effect.answerNext(effGetParameterProperties, {0, -1});
  for (const bool expected : {false, true}) {
    effect.forget();
    VstParameterProperties properties{};
    std::memset(&properties, 'x', sizeof properties);
    EXPECT_EQ(wrapper->getParameterProps(-1, properties), expected);
    EXPECT_EQ(properties.minInteger, -3);
    EXPECT_THAT(effect.requests(), ElementsAre(request(effGetParameterProperties, -1).withZeroBytes(0)));
  }
}

}  // namespace
