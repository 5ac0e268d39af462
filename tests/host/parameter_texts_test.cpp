// SPDX-License-Identifier: MIT
// VSTWrapper: names, units, values as text and properties of parameters.
#include <climits>
#include <cstring>
#include <string>

#include "tests/shared/wrapper_fixture.h"

namespace {

using namespace doubles;
using testing::ElementsAre;

class VSTWrapperParameterTexts : public host_tests::WrapperTest {
 protected:
  VSTWrapperParameterTexts() {
    effect.setParameters({0.25f, 0.5f});
    open();
  }
};

TEST_F(VSTWrapperParameterTexts, AreWhatThePluginWrites) {
  effect.setTextAt(effGetParamName, 1, "Cutoff");
  effect.setTextAt(effGetParamLabel, 1, "Hz");
  effect.setTextAt(effGetParamDisplay, 1, "440.0");
  const VSTWrapper& readOnly = *wrapper;
  EXPECT_EQ(wrapper->getParameterName(1), "Cutoff");
  EXPECT_EQ(readOnly.getParameterLabel(1), "Hz");
  EXPECT_EQ(wrapper->getParameterCurValueAsText(1), "440.0");
  EXPECT_THAT(effect.requests(), ElementsAre(request(effGetParamName, 1), request(effGetParamLabel, 1),
                                             request(effGetParamDisplay, 1)));
}

TEST_F(VSTWrapperParameterTexts, CountWhateverThePluginAnswers) {
  for (const VstIntPtr answer : {0, 1, -1}) {
    for (const VstEffectOpcode opcode : {effGetParamName, effGetParamLabel, effGetParamDisplay}) {
      effect.setText(opcode, "text");
      effect.answer(opcode, answer);
    }
    EXPECT_EQ(wrapper->getParameterName(0), "text");
    EXPECT_EQ(wrapper->getParameterLabel(0), "text");
    EXPECT_EQ(wrapper->getParameterCurValueAsText(0), "text");
  }
}

TEST_F(VSTWrapperParameterTexts, AreEmptyWhereThePluginWritesNothing) {
  for (const VstEffectOpcode opcode : {effGetParamName, effGetParamLabel, effGetParamDisplay}) {
    effect.answer(opcode, 1);
  }
  EXPECT_EQ(wrapper->getParameterName(0), "");
  EXPECT_EQ(wrapper->getParameterLabel(0), "");
  EXPECT_EQ(wrapper->getParameterCurValueAsText(0), "");
}

TEST_F(VSTWrapperParameterTexts, AreNeitherCutNorTrimmed) {
  effect.setText(effGetParamName, " A name of more than eight characters, and of more than 24 as well ");
  effect.setText(effGetParamLabel, "\tseconds per octave\n");
  effect.setText(effGetParamDisplay, "   -12.000000000000 ");
  EXPECT_EQ(wrapper->getParameterName(0),
            " A name of more than eight characters, and of more than 24 as well ");
  EXPECT_EQ(wrapper->getParameterLabel(0), "\tseconds per octave\n");
  EXPECT_EQ(wrapper->getParameterCurValueAsText(0), "   -12.000000000000 ");
}

TEST_F(VSTWrapperParameterTexts, RunToTheEndOfTheBufferWithoutAZeroByte) {
  effect.setUnterminatedText(effGetParamName, 500, 'n');
  effect.setUnterminatedText(effGetParamLabel, 256, 'l');
  effect.setUnterminatedText(effGetParamDisplay, 256, 'd');
  EXPECT_EQ(wrapper->getParameterName(0), std::string(500, 'n'));
  EXPECT_EQ(wrapper->getParameterLabel(0), std::string(256, 'l'));
  EXPECT_EQ(wrapper->getParameterCurValueAsText(0), std::string(256, 'd'));
}

TEST_F(VSTWrapperParameterTexts, EndAtTheZeroByteThatTheClearingLeft) {
  effect.setUnterminatedText(effGetParamName, 499, 'n');
  effect.setUnterminatedText(effGetParamLabel, 255, 'l');
  effect.setUnterminatedText(effGetParamDisplay, 255, 'd');
  EXPECT_EQ(wrapper->getParameterName(0), std::string(499, 'n'));
  EXPECT_EQ(wrapper->getParameterLabel(0), std::string(255, 'l'));
  EXPECT_EQ(wrapper->getParameterCurValueAsText(0), std::string(255, 'd'));
}

TEST_F(VSTWrapperParameterTexts, AreAskedForInAClearedBufferEachTime) {
  effect.setUnterminatedText(effGetParamName, 500);
  effect.setUnterminatedText(effGetParamLabel, 256);
  effect.setUnterminatedText(effGetParamDisplay, 256);
  for (int i = 0; i < 2; ++i) {
    wrapper->getParameterName(0);
    wrapper->getParameterLabel(0);
    wrapper->getParameterCurValueAsText(0);
  }
  EXPECT_THAT(effect.requests(),
              ElementsAre(request(effGetParamName), request(effGetParamLabel), request(effGetParamDisplay),
                          request(effGetParamName), request(effGetParamLabel), request(effGetParamDisplay)));
}

TEST_F(VSTWrapperParameterTexts, AreAskedForAtAnyIndex) {
  VstParameterProperties properties{};
  for (const int index : {-1, 2, INT_MIN, INT_MAX}) {
    effect.forget();
    wrapper->getParameterName(index);
    wrapper->getParameterLabel(index);
    wrapper->getParameterCurValueAsText(index);
    wrapper->setParameterCurValueFromText(index, "on");
    wrapper->isParameterAutomatable(index);
    wrapper->getParameterProps(index, properties);
    EXPECT_THAT(effect.requests(),
                ElementsAre(request(effGetParamName, index), request(effGetParamLabel, index),
                            request(effGetParamDisplay, index), request(effString2Parameter, index),
                            request(effCanBeAutomated, index), request(effGetParameterProperties, index)));
  }
}

// ---- Setting by text ----

TEST_F(VSTWrapperParameterTexts, AreSetAfterTheQuestionWhetherThatCanBe) {
  effect.answerNext(effString2Parameter, {1, 7});
  EXPECT_EQ(wrapper->setParameterCurValueFromText(1, "440 Hz"), 7);
  EXPECT_THAT(effect.requests(),
              ElementsAre(canParameterBeSetFromText(1), setParameterFromText(1, "440 Hz")));
}

TEST_F(VSTWrapperParameterTexts, AreSentNowhereWhereThePluginCannotTakeThem) {
  effect.answerNext(effString2Parameter, {0, 1});
  EXPECT_EQ(wrapper->setParameterCurValueFromText(1, "440 Hz"), 0);
  EXPECT_THAT(effect.requests(), ElementsAre(canParameterBeSetFromText(1)));
}

TEST_F(VSTWrapperParameterTexts, AnyAnswerButZeroMeansThatTheyCanBeTaken) {
  effect.answerNext(effString2Parameter, {-1, -2});
  EXPECT_EQ(wrapper->setParameterCurValueFromText(0, ""), -2);
  EXPECT_THAT(effect.requests(), ElementsAre(canParameterBeSetFromText(0), setParameterFromText(0, "")));
}

TEST_F(VSTWrapperParameterTexts, MayBeRefusedAfterAll) {
  effect.answerNext(effString2Parameter, {1, 0});
  EXPECT_EQ(wrapper->setParameterCurValueFromText(0, "loud"), 0);
  EXPECT_EQ(effect.requests().size(), 2u);
}

TEST_F(VSTWrapperParameterTexts, AreSentWhole) {
  const std::string text(1000, 't');
  effect.answer(effString2Parameter, 1);
  wrapper->setParameterCurValueFromText(0, text.c_str());
  EXPECT_EQ(effect.requests().at(1), setParameterFromText(0, text));
  EXPECT_EQ(effect.requests().at(1).pointee.address, text.c_str());
}

// ---- Properties ----

TEST_F(VSTWrapperParameterTexts, AutomationIsAllowedWithAnyAnswerButZero) {
  const VSTWrapper& readOnly = *wrapper;
  effect.answerNext(effCanBeAutomated, {0, 1, -1, 2});
  EXPECT_FALSE(readOnly.isParameterAutomatable(1));
  EXPECT_TRUE(readOnly.isParameterAutomatable(1));
  EXPECT_TRUE(readOnly.isParameterAutomatable(1));
  EXPECT_TRUE(readOnly.isParameterAutomatable(1));
  EXPECT_EQ(effect.requests(), std::vector<Request>(4, request(effCanBeAutomated, 1)));
}

TEST_F(VSTWrapperParameterTexts, PropertiesAreFilledInPlace) {
  VstParameterProperties written{};
  written.flags = 2;
  written.minInteger = -3;
  written.maxInteger = 12;
  effect.setParameterProperties(1, written);
  VstParameterProperties properties{};
  EXPECT_TRUE(wrapper->getParameterProps(1, properties));
  EXPECT_EQ(properties.flags, 2);
  EXPECT_EQ(properties.minInteger, -3);
  EXPECT_EQ(properties.maxInteger, 12);
  EXPECT_THAT(effect.requests(), ElementsAre(request(effGetParameterProperties, 1)));
  EXPECT_EQ(effect.requests().at(0).pointee.address, &properties);
}

TEST_F(VSTWrapperParameterTexts, PropertiesThatAreAnsweredWithZeroAreFalseAlsoWhereTheyWereWritten) {
  VstParameterProperties written{};
  written.flags = 1;
  effect.setParameterProperties(0, written);
  effect.answerNext(effGetParameterProperties, {0, -1});
  VstParameterProperties properties{};
  EXPECT_FALSE(wrapper->getParameterProps(0, properties));
  EXPECT_EQ(properties.flags, 1);
  EXPECT_TRUE(wrapper->getParameterProps(0, properties));
}

// The caller clears a record, the wrapper does not.
TEST_F(VSTWrapperParameterTexts, PropertiesAreHandedOnAsTheyAre) {
  VstParameterProperties properties{};
  std::memset(&properties, 'x', sizeof properties);
  wrapper->getParameterProps(0, properties);
  EXPECT_THAT(effect.requests(), ElementsAre(request(effGetParameterProperties).withZeroBytes(0)));
}

}  // namespace
