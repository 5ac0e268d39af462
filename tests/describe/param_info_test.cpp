// SPDX-License-Identifier: MIT
// The description of one parameter: the conversation, the record, and the texts of integer steps.
#include <climits>
#include <cstdint>
#include <cstdio>
#include <cstring>
#include <string>
#include <vector>

#include "describe/param_info.h"
#include "gmock/gmock.h"
#include "tests/describe/described_plugin.h"

namespace {

using namespace doubles;
using KelVSTInfoCache::ParamInfo;
using testing::ElementsAre;
using testing::IsEmpty;
using testing::SizeIs;

constexpr std::int32_t kIntegerMinMax = 2;
constexpr std::int32_t kIntStep = 8;

VstParameterProperties steps(std::int32_t min, std::int32_t max, std::int32_t step = 1,
                             std::int32_t flags = kIntegerMinMax | kIntStep) {
  VstParameterProperties props = {};
  props.flags = flags;
  props.minInteger = min;
  props.maxInteger = max;
  props.stepInteger = step;
  return props;
}

class ParamInfoTest : public DescribedPlugin {
 protected:
  // A plug-in of one parameter at 0.5, which shows its value as "at VALUE".
  ParamInfoTest() {
    effect.setParameters({0.5F});
    effect.setText(effGetParamName, "Gain");
    effect.setText(effGetParamLabel, "dB");
    effect.onRequest = [this](const Request& received) {
      if (received.opcode != effGetParamDisplay) return;
      std::snprintf(static_cast<char*>(received.pointee.address), 64, "at %g",
                    static_cast<double>(effect.program(0).parameters.at(0)));
    };
  }

  ParamInfo describe(const VstParameterProperties& props) {
    effect.setParameterProperties(0, props);
    return ParamInfo(open(), 0);
  }
};

TEST_F(ParamInfoTest, AsksTheseQuestions) {
  effect.setParameters({0.5F, 0.25F});
  const ParamInfo info(open(), 1);
  EXPECT_THAT(effect.requests(),
              ElementsAre(getParameterOf(1), request(effGetParamName, 1), request(effGetParamLabel, 1),
                          request(effCanBeAutomated, 1), request(effGetParameterProperties, 1)));
}

TEST_F(ParamInfoTest, KeepsTheAnswers) {
  effect.setParameters({0.5F, 0.1F});
  effect.answerAt(effCanBeAutomated, 1, 1);
  const ParamInfo info(open(), 1);
  EXPECT_EQ(info.paramIndex, 1);
  EXPECT_EQ(info.currentValue, 0.100000001490116119384765625);
  EXPECT_EQ(info.paramName.text, "Gain");
  EXPECT_EQ(info.paramLabel.text, "dB");
  EXPECT_EQ(info.paramName.firstWord, 0);
  EXPECT_TRUE(info.automatable);
  EXPECT_EQ(info.minValue, 0.0);
  EXPECT_EQ(info.maxValue, 1.0);
  EXPECT_THAT(info.valueTexts, IsEmpty());
}

TEST_F(ParamInfoTest, IsNotAutomatableWhenThePluginAnswersZero) {
  EXPECT_FALSE(ParamInfo(open(), 0).automatable);
}

TEST_F(ParamInfoTest, CopiesAreIndependent) {
  const ParamInfo info = describe(steps(0, 2));
  ParamInfo copy(info);
  copy.valueTexts[0] = "changed";
  copy.paramName.text = "changed";
  EXPECT_THAT(info.valueTexts, ElementsAre("at 0", "at 1", "at 2"));
  EXPECT_EQ(info.paramName.text, "Gain");
  copy = info;
  EXPECT_THAT(copy.valueTexts, ElementsAre("at 0", "at 1", "at 2"));
}

// ---- Properties ----

// The record of 152 bytes; the flags are the word at 76.
std::string bytesOf(const VstParameterProperties& props) {
  return std::string(reinterpret_cast<const char*>(&props), 152);
}

TEST_F(ParamInfoTest, FailingPropertiesOfAnAutomatableParameterSayThatItCanRampAndNothingElse) {
  effect.answer(effCanBeAutomated, 1);
  const ParamInfo info(open(), 0);
  EXPECT_EQ(info.props.flags, 64);
  VstParameterProperties expected = {};
  expected.flags = 64;
  EXPECT_EQ(bytesOf(info.props), bytesOf(expected));
}

TEST_F(ParamInfoTest, FailingPropertiesOfAnyOtherParameterAreZeros) {
  EXPECT_EQ(bytesOf(ParamInfo(open(), 0).props), std::string(152, '\0'));
}

TEST_F(ParamInfoTest, ForgetsWhatAPluginWroteBeforeItAnsweredZero) {
  effect.answer(effGetParameterProperties, 0);
  VstParameterProperties written = steps(0, 9);
  std::memset(written.label, 'x', sizeof written.label);
  std::memset(written.future, 'x', sizeof written.future);
  const ParamInfo info = describe(written);
  EXPECT_EQ(bytesOf(info.props), std::string(152, '\0'));
  EXPECT_EQ(info.maxValue, 1.0);
  EXPECT_THAT(info.valueTexts, IsEmpty());
}

TEST_F(ParamInfoTest, FlagsOfAPluginThatAnswersStayAsTheyAre) {
  effect.answer(effCanBeAutomated, 1);
  VstParameterProperties props = {};
  props.flags = 1;
  EXPECT_EQ(describe(props).props.flags, 1);
}

TEST_F(ParamInfoTest, EndsTheTextsWithinTheirFields) {
  VstParameterProperties props;
  std::memset(&props, 'x', sizeof props);
  props.flags = 0;
  const ParamInfo info = describe(props);
  EXPECT_EQ(std::string(info.props.label, 64), std::string(63, 'x') + '\0');
  EXPECT_EQ(std::string(info.props.shortLabel, 8), std::string(7, 'x') + '\0');
  EXPECT_EQ(std::string(info.props.categoryLabel, 24), std::string(23, 'x') + '\0');
  EXPECT_EQ(std::string(info.props.future, 16), std::string(16, 'x'));
}

// ---- Integer steps ----

TEST_F(ParamInfoTest, SetsTheParameterToEachIntegerAndReadsItsText) {
  const ParamInfo info = describe(steps(2, 4));
  EXPECT_THAT(info.valueTexts, ElementsAre("at 2", "at 3", "at 4"));
  EXPECT_THAT(effect.requests(),
              ElementsAre(getParameterOf(0), request(effGetParamName), request(effGetParamLabel),
                          request(effCanBeAutomated), request(effGetParameterProperties),  //
                          getParameterOf(0), setParameterTo(0, 2.0F), request(effGetParamDisplay),
                          getParameterOf(0), setParameterTo(0, 3.0F), request(effGetParamDisplay),
                          getParameterOf(0), setParameterTo(0, 4.0F), request(effGetParamDisplay)));
}

TEST_F(ParamInfoTest, LeavesTheParameterAtTheLastStep) {
  const ParamInfo info = describe(steps(-1, 7));
  EXPECT_THAT(effect.program(0).parameters, ElementsAre(7.0F));
  EXPECT_EQ(info.currentValue, 0.5);
  EXPECT_EQ(info.minValue, -1.0);
  EXPECT_EQ(info.maxValue, 7.0);
}

TEST_F(ParamInfoTest, ReadsATextAlsoForTheValueThatIsSetAlready) {
  effect.setParameters({0.0F});
  EXPECT_THAT(describe(steps(0, 1)).valueTexts, ElementsAre("at 0", "at 1"));
}

TEST_F(ParamInfoTest, OneHundredStepsAreFew) {
  const ParamInfo info = describe(steps(0, 99));
  ASSERT_THAT(info.valueTexts, SizeIs(100));
  EXPECT_EQ(info.valueTexts.front(), "at 0");
  EXPECT_EQ(info.valueTexts.back(), "at 99");
  EXPECT_EQ(info.maxValue, 99.0);
}

TEST_F(ParamInfoTest, ASingleStepIsOne) {
  EXPECT_THAT(describe(steps(5, 5)).valueTexts, ElementsAre("at 5"));
}

TEST_F(ParamInfoTest, TheLastIntegersAreStepsToo) {
  const ParamInfo info = describe(steps(INT_MAX - 1, INT_MAX));
  EXPECT_THAT(info.valueTexts, ElementsAre("at 2.14748e+09", "at 2.14748e+09"));
  EXPECT_THAT(describe(steps(INT_MIN, INT_MIN + 99)).valueTexts, SizeIs(100));
}

TEST_F(ParamInfoTest, AnExceptionInTheMiddleOfTheStepsPasses) {
  effect.onRequest = [](const Request& received) {
    if (received.opcode == effGetParamDisplay) throw 5;
  };
  EXPECT_THROW(describe(steps(0, 3)), int);
}

struct NoStepsCase {
  const char* name;
  VstParameterProperties props;
  double minValue;
  double maxValue;
};

void PrintTo(const NoStepsCase& noSteps, std::ostream* stream) { *stream << noSteps.name; }

class ParamInfoWithoutSteps : public DescribedPlugin, public testing::WithParamInterface<NoStepsCase> {};

TEST_P(ParamInfoWithoutSteps, HasNoTextsAndKeepsItsValue) {
  effect.setParameters({0.5F});
  effect.setParameterProperties(0, GetParam().props);
  const ParamInfo info(open(), 0);
  EXPECT_EQ(info.minValue, GetParam().minValue);
  EXPECT_EQ(info.maxValue, GetParam().maxValue);
  EXPECT_THAT(info.valueTexts, IsEmpty());
  EXPECT_THAT(effect.parameterWrites(), IsEmpty());
  EXPECT_THAT(effect.requestsOf(effGetParamDisplay), IsEmpty());
}

INSTANTIATE_TEST_SUITE_P(
    Ranges, ParamInfoWithoutSteps,
    testing::ValuesIn(std::vector<NoStepsCase>{
        {"ARangeOf100", steps(0, 100), 0.0, 100.0},
        {"TheWholeRange", steps(INT_MIN, INT_MAX), -2147483648.0, 2147483647.0},
        {"ARangeThatWouldWrapAround", steps(INT_MIN, INT_MAX - 4), -2147483648.0, 2147483643.0},
        {"ARangeUpsideDown", steps(9, 3), 9.0, 3.0},
        {"TheWholeRangeUpsideDown", steps(INT_MAX, INT_MIN), 2147483647.0, -2147483648.0},
        {"StepsOfTwo", steps(0, 10, 2), 0.0, 10.0},
        {"StepsOfZero", steps(0, 10, 0), 0.0, 10.0},
        {"StepsBackwards", steps(0, 10, -1), 0.0, 10.0},
        {"NoStepFlag", steps(0, 10, 1, kIntegerMinMax), 0.0, 10.0},
        {"NoRangeFlag", steps(3, 10, 1, kIntStep), 0.0, 1.0},
        {"NoFlag", steps(3, 10, 1, 0), 0.0, 1.0},
        {"AllOtherFlags", steps(3, 10, 1, 1 | 4 | 8 | 16 | 32 | 64), 0.0, 1.0},
    }),
    [](const auto& tested) { return tested.param.name; });

}  // namespace
