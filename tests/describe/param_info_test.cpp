// SPDX-License-Identifier: MIT
// The description of one parameter: the record, and the texts of integer steps. The requests are in
// tests/end_to_end/golden/conversation_*.txt.
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

void expectText(const NiduStringObj& actual, const std::string& text) {
  EXPECT_EQ(actual.text, text);
  EXPECT_EQ(actual.firstWord, 0);
  EXPECT_EQ(actual.secondWord, 0);
  EXPECT_EQ(actual.thirdWord, 0);
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

TEST_F(ParamInfoTest, KeepsTheAnswers) {
  effect.setParameters({0.5F, 0.1F});
  effect.answerAt(effCanBeAutomated, 1, 1);
  const ParamInfo info(open(), 1);
  EXPECT_EQ(info.paramIndex, 1);
  EXPECT_EQ(info.currentValue, 0.100000001490116119384765625);
  expectText(info.paramName, "Gain");
  expectText(info.paramLabel, "dB");
  EXPECT_TRUE(info.automatable);
  EXPECT_EQ(info.minValue, 0.0);
  EXPECT_EQ(info.maxValue, 1.0);
  EXPECT_THAT(info.valueTexts, IsEmpty());
}

// ---- Properties ----

// The record of 152 bytes; the flags are the word at 76.
std::string bytesOf(const VstParameterProperties& props) {
  return std::string(reinterpret_cast<const char*>(&props), 152);
}

TEST_F(ParamInfoTest, WithoutPropertiesCanOnlyRampWhenItIsAutomatable) {
  // Some plug-ins write into the record and then answer 0.
  effect.answer(effGetParameterProperties, 0);
  VstParameterProperties written = steps(0, 9);
  std::memset(written.label, 'x', sizeof written.label);
  std::memset(written.future, 'x', sizeof written.future);
  VstParameterProperties expected = {};
  EXPECT_EQ(bytesOf(describe(written).props), bytesOf(expected));
  EXPECT_FALSE(ParamInfo(wrapper.get(), 0).automatable);

  effect.answer(effCanBeAutomated, 1);
  expected.flags = 64;
  const ParamInfo info(wrapper.get(), 0);
  EXPECT_EQ(bytesOf(info.props), bytesOf(expected));
  EXPECT_EQ(info.maxValue, 1.0);
  EXPECT_THAT(info.valueTexts, IsEmpty());
}

TEST_F(ParamInfoTest, KeepsThePropertiesAndTerminatesTheirTexts) {
  effect.answer(effCanBeAutomated, 1);
  VstParameterProperties props;
  std::memset(&props, 'x', sizeof props);
  props.flags = 1;
  const ParamInfo info = describe(props);
  EXPECT_EQ(info.props.flags, 1);
  EXPECT_EQ(std::string(info.props.label, 64), std::string(63, 'x') + '\0');
  EXPECT_EQ(std::string(info.props.shortLabel, 8), std::string(7, 'x') + '\0');
  EXPECT_EQ(std::string(info.props.categoryLabel, 24), std::string(23, 'x') + '\0');
  EXPECT_EQ(std::string(info.props.future, 16), std::string(16, 'x'));
}

// ---- Integer steps ----

TEST_F(ParamInfoTest, ReadsTheTextOfEachIntegerAndLeavesTheParameterAtTheLast) {
  const ParamInfo info = describe(steps(-1, 1));
  EXPECT_THAT(info.valueTexts, ElementsAre("at -1", "at 0", "at 1"));
  EXPECT_THAT(effect.program(0).parameters, ElementsAre(1.0F));
  EXPECT_EQ(info.currentValue, 0.5);
  EXPECT_EQ(info.minValue, -1.0);
  EXPECT_EQ(info.maxValue, 1.0);
}

TEST_F(ParamInfoTest, ReadsTheTextOfAValueThatIsSetAlready) {
  effect.setParameters({5.0F});
  EXPECT_THAT(describe(steps(5, 5)).valueTexts, ElementsAre("at 5"));
  EXPECT_THAT(effect.parameterWrites(), IsEmpty());
}

TEST_F(ParamInfoTest, ReadsTheTextsOfARangeOf99) {
  const ParamInfo info = describe(steps(0, 99));
  ASSERT_THAT(info.valueTexts, SizeIs(100));
  EXPECT_EQ(info.valueTexts.front(), "at 0");
  EXPECT_EQ(info.valueTexts.back(), "at 99");
}

TEST_F(ParamInfoTest, ReadsTheTextsOfTheLowestAndTheHighestIntegers) {
  EXPECT_THAT(describe(steps(INT_MAX - 1, INT_MAX)).valueTexts,
              ElementsAre("at 2.14748e+09", "at 2.14748e+09"));
  EXPECT_THAT(describe(steps(INT_MIN, INT_MIN + 99)).valueTexts, SizeIs(100));
}

struct NoTextsCase {
  const char* name;
  VstParameterProperties props;
  double minValue;
  double maxValue;
};

class ParamInfoWithoutTexts : public DescribedPlugin, public testing::WithParamInterface<NoTextsCase> {};

TEST_P(ParamInfoWithoutTexts, HasThisRangeAndSetsNoValue) {
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
    Ranges, ParamInfoWithoutTexts,
    testing::ValuesIn(std::vector<NoTextsCase>{
        {"ARangeOf100", steps(0, 100), 0.0, 100.0},
        {"TheWholeRange", steps(INT_MIN, INT_MAX), -2147483648.0, 2147483647.0},
        {"ARangeThatIsNegativeInAnInt", steps(INT_MIN, INT_MAX - 4), -2147483648.0, 2147483643.0},
        {"AMinimumAboveTheMaximum", steps(9, 3), 9.0, 3.0},
        {"TheHighestAboveTheLowest", steps(INT_MAX, INT_MIN), 2147483647.0, -2147483648.0},
        {"StepsOfTwo", steps(0, 10, 2), 0.0, 10.0},
        {"StepsOfZero", steps(0, 10, 0), 0.0, 10.0},
        {"StepsOfMinusOne", steps(0, 10, -1), 0.0, 10.0},
        {"NoStepFlag", steps(0, 10, 1, kIntegerMinMax), 0.0, 10.0},
        {"NoRangeFlag", steps(3, 10, 1, kIntStep), 0.0, 1.0},
        {"AllFlagsButTheRange", steps(3, 10, 1, 1 | 4 | 8 | 16 | 32 | 64), 0.0, 1.0},
    }),
    [](const auto& tested) { return tested.param.name; });

}  // namespace
