// SPDX-License-Identifier: MIT
// VSTWrapper::getParameter and setParameter: what the instance's own two functions are asked.
#include <climits>
#include <cmath>
#include <limits>

#include "tests/shared/wrapper_fixture.h"

namespace {

using namespace doubles;
using host_tests::everyThrown;
using host_tests::Thrown;
using testing::ElementsAre;
using testing::IsEmpty;

bool isWrite(const Request& request) { return request.kind == Request::Kind::kSetParameter; }

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

TEST_F(VSTWrapperParameterValues, OutsideTheParametersAreZeroAndNotAskedFor) {
  for (const int index : {-1, 3, 4, INT_MIN, INT_MAX}) EXPECT_EQ(wrapper->getParameter(index), 0.0f);
  EXPECT_THAT(effect.requests(), IsEmpty());
}

TEST_F(VSTWrapperParameterValues, OutsideTheParametersAreNotSet) {
  for (const int index : {-1, 3, 4, INT_MIN, INT_MAX}) wrapper->setParameter(index, 0.9f);
  EXPECT_THAT(effect.requests(), IsEmpty());
}

TEST_F(VSTWrapperParameterValues, AreNoneInAPluginWithoutParameters) {
  for (const VstInt32 count : {0, -1, INT_MIN}) {
    effect.aeffect.numParams = count;
    EXPECT_EQ(wrapper->getParameter(0), 0.0f);
    wrapper->setParameter(0, 0.9f);
  }
  EXPECT_THAT(effect.requests(), IsEmpty());
}

TEST_F(VSTWrapperParameterValues, FollowTheNumberOfParametersAsItIsNow) {
  effect.aeffect.numParams = 1;
  EXPECT_EQ(wrapper->getParameter(1), 0.0f);
  effect.aeffect.numParams = 2;
  EXPECT_EQ(wrapper->getParameter(1), 0.5f);
  EXPECT_THAT(effect.requests(), ElementsAre(getParameterOf(1)));
}

TEST_F(VSTWrapperParameterValues, AreReadBeforeTheyAreSet) {
  wrapper->setParameter(1, 0.125f);
  EXPECT_THAT(effect.requests(), ElementsAre(getParameterOf(1), setParameterTo(1, 0.125f)));
  EXPECT_EQ(wrapper->getParameter(1), 0.125f);
}

TEST_F(VSTWrapperParameterValues, ThatThePluginHoldsAlreadyAreNotSent) {
  wrapper->setParameter(1, 0.5f);
  EXPECT_THAT(effect.requests(), ElementsAre(getParameterOf(1)));
}

TEST_F(VSTWrapperParameterValues, AreSentWhereTheLastBitDiffers) {
  const float next = std::nextafter(0.5f, 1.0f);
  wrapper->setParameter(1, next);
  EXPECT_THAT(effect.parameterWrites(), ElementsAre(setParameterTo(1, next)));
}

TEST_F(VSTWrapperParameterValues, AreSentUnclamped) {
  const float infinity = std::numeric_limits<float>::infinity();
  wrapper->setParameter(0, 2.0f);
  wrapper->setParameter(1, -1.0f);
  wrapper->setParameter(2, infinity);
  EXPECT_THAT(effect.parameterWrites(),
              ElementsAre(setParameterTo(0, 2.0f), setParameterTo(1, -1.0f), setParameterTo(2, infinity)));
  EXPECT_EQ(wrapper->getParameter(2), infinity);
}

TEST_F(VSTWrapperParameterValues, MinusZeroIsZero) {
  effect.setParameters({0.0f});
  wrapper->setParameter(0, -0.0f);
  EXPECT_THAT(effect.parameterWrites(), IsEmpty());
}

TEST_F(VSTWrapperParameterValues, NotANumberIsNeverHeldAlready) {
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

TEST_F(VSTWrapperParameterValues, NameTheOneThatIsBeingSetForAsLongAsThePluginTakesIt) {
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
  EXPECT_EQ(wrapper->paramBeingSet, -1);
}

// ---- What the plug-in throws ----

TEST_F(VSTWrapperParameterValues, AreZeroWhereThePluginThrowsInstead) {
  for (const Thrown& thrown : everyThrown()) {
    SCOPED_TRACE(thrown.name);
    effect.onRequest = [&](const Request&) { thrown.raise(); };
    float value = 1.0f;
    EXPECT_NO_THROW(value = wrapper->getParameter(1));
    EXPECT_EQ(value, 0.0f);
  }
  EXPECT_EQ(effect.requests(), std::vector<Request>(4, getParameterOf(1)));
}

TEST_F(VSTWrapperParameterValues, AreNotSetWhereThePluginThrowsOnBeingRead) {
  for (const Thrown& thrown : everyThrown()) {
    SCOPED_TRACE(thrown.name);
    effect.onRequest = [&](const Request&) { thrown.raise(); };
    EXPECT_NO_THROW(wrapper->setParameter(1, 0.9f));
    EXPECT_EQ(wrapper->paramBeingSet, -1);
  }
  EXPECT_EQ(effect.requests(), std::vector<Request>(4, getParameterOf(1)));
}

TEST_F(VSTWrapperParameterValues, StayAsTheyAreWhereThePluginThrowsOnBeingSet) {
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
  effect.onRequest = nullptr;
  EXPECT_EQ(wrapper->getParameter(1), 0.5f);
}

}  // namespace
