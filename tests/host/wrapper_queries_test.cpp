// SPDX-License-Identifier: MIT
// VSTWrapper: names, category, rates, speaker arrangements, pins and shell children.
#include <climits>
#include <cstring>
#include <stdexcept>
#include <string>

#include "tests/shared/wrapper_fixture.h"
#include "vst2/speakers.h"

namespace {

using namespace doubles;
using testing::ElementsAre;

class VSTWrapperNames : public host_tests::WrapperTest {
 protected:
  VSTWrapperNames() { open(); }

  /// Opens an instance that is a shell's child of this name.
  void openChild(const std::string& name, bool hasChildID = true) {
    VST_ChildSpec child(1234);
    child.childName = name;
    child.hasChildID = hasChildID;
    open(child);
  }
};

TEST_F(VSTWrapperNames, TheEffectNameComesFirstAndIsNotTrimmed) {
  effect.setText(effGetEffectName, "  Reverb \n");
  effect.setText(effGetProductString, "Reverb Collection");
  EXPECT_EQ(wrapper->getEffectName(), "  Reverb \n");
  EXPECT_THAT(effect.requests(), ElementsAre(request(effGetEffectName)));
}

TEST_F(VSTWrapperNames, TheProductStringComesNext) {
  effect.setText(effGetProductString, "Reverb Collection");
  EXPECT_EQ(wrapper->getEffectName(), "Reverb Collection");
  EXPECT_THAT(effect.requests(), ElementsAre(request(effGetEffectName), request(effGetProductString)));
}

TEST_F(VSTWrapperNames, TextsAnsweredWithZeroGiveWayToTheChildsNameOrTheModules) {
  effect.setText(effGetEffectName, "Reverb");
  effect.answer(effGetEffectName, 0);
  effect.setText(effGetProductString, "Reverb Collection");
  effect.answer(effGetProductString, 0);
  EXPECT_EQ(wrapper->getEffectName(), "The Module");
  openChild("Shimmer");
  EXPECT_EQ(wrapper->getEffectName(), "Shimmer");
  EXPECT_EQ(wrapper->childSpec.childName, "Shimmer");
  openChild("");
  EXPECT_EQ(wrapper->getEffectName(), "");
  openChild("Shimmer", false);
  EXPECT_EQ(wrapper->getEffectName(), "The Module");
}

TEST_F(VSTWrapperNames, AnyAnswerButZeroCountsAlsoANegativeOne) {
  effect.setText(effGetVendorString, " M\xC3\xBCller ");
  effect.answer(effGetVendorString, -1);
  EXPECT_EQ(wrapper->getManufacturerName(), " M\xC3\xBCller ");
  effect.setText(effGetProductString, "Product");
  effect.answer(effGetProductString, -1);
  EXPECT_EQ(wrapper->getEffectName(), "Product");
  effect.setText(effGetEffectName, "Reverb");
  effect.answer(effGetEffectName, -1);
  EXPECT_EQ(wrapper->getEffectName(), "Reverb");
}

TEST_F(VSTWrapperNames, AnEmptyTextThatIsAnsweredWithOneIsTheName) {
  effect.setText(effGetProductString, "");
  EXPECT_EQ(wrapper->getEffectName(), "");
  effect.setText(effGetProductString, "Reverb Collection");
  effect.setText(effGetEffectName, "");
  EXPECT_EQ(wrapper->getEffectName(), "");
  effect.setText(effGetVendorString, "");
  EXPECT_EQ(wrapper->getManufacturerName(), "");
}

// On purpose: the buffer is not cleared between the two requests.
TEST_F(VSTWrapperNames, TheProductStringIsAskedForInTheSameBufferWithWhatIsInIt) {
  effect.setText(effGetEffectName, "Left over");
  effect.answer(effGetEffectName, 0);
  effect.answer(effGetProductString, 1);  // And writes nothing.
  EXPECT_EQ(wrapper->getEffectName(), "Left over");
  EXPECT_THAT(effect.requests(),
              ElementsAre(request(effGetEffectName), request(effGetProductString).withZeroBytes(114 - 9)));
  EXPECT_EQ(effect.requests().at(0).pointee.address, effect.requests().at(1).pointee.address);
}

// The expected requests contain a cleared buffer each time.
TEST_F(VSTWrapperNames, TextsWithoutAZeroByteRunToTheEndOfABufferThatIsClearedEachTime) {
  for (const std::size_t size : {113u, 114u}) {
    effect.forget();
    effect.setUnterminatedText(effGetEffectName, size);
    EXPECT_EQ(wrapper->getEffectName(), std::string(size, 'x'));
    effect.setUnterminatedText(effGetVendorString, size, 'v');
    EXPECT_EQ(wrapper->getManufacturerName(), std::string(size, 'v'));
    EXPECT_THAT(effect.requests(), ElementsAre(request(effGetEffectName), request(effGetVendorString)));
  }
}

TEST_F(VSTWrapperNames, AMakerThatIsAnsweredWithZeroIsUnknown) {
  effect.setText(effGetVendorString, "Somebody");
  effect.answer(effGetVendorString, 0);
  EXPECT_EQ(wrapper->getManufacturerName(), "unknown");
  EXPECT_THAT(effect.requests(), ElementsAre(request(effGetVendorString)));
}

// On purpose, for one maker's sampler.
TEST_F(VSTWrapperNames, PlayByPlayIsEastWestWhereverThePluginsNameComesFrom) {
  effect.setText(effGetVendorString, "Play");
  openChild("Play");
  EXPECT_EQ(wrapper->getManufacturerName(), "EastWest");
  EXPECT_THAT(effect.requests(), ElementsAre(request(effGetVendorString), request(effGetEffectName),
                                             request(effGetProductString)));
  effect.setText(effGetEffectName, "Play");
  openChild("Something");
  EXPECT_EQ(wrapper->getManufacturerName(), "EastWest");
  EXPECT_THAT(effect.requests(), ElementsAre(request(effGetVendorString), request(effGetEffectName)));
}

TEST_F(VSTWrapperNames, AnotherPluginByPlayIsByPlay) {
  effect.setText(effGetVendorString, "Play");
  for (const char* name : {"play", "Play ", "Player", ""}) {
    effect.setText(effGetEffectName, name);
    EXPECT_EQ(wrapper->getManufacturerName(), "Play") << name;
  }
}

TEST_F(VSTWrapperNames, OnlyAVendorThatIsExactlyPlayLeadsToAQuestionForThePluginsName) {
  effect.setText(effGetEffectName, "Play");
  for (const char* vendor : {"play", "Play ", " Play", "Player", "Pla"}) {
    effect.setText(effGetVendorString, vendor);
    EXPECT_EQ(wrapper->getManufacturerName(), vendor);
  }
  EXPECT_EQ(effect.requests(), std::vector<Request>(5, request(effGetVendorString)));
}

// ---- Category, rates, arrangements, pins

class VSTWrapperQueries : public host_tests::WrapperTest {
 protected:
  VSTWrapperQueries() { open(); }
};

TEST_F(VSTWrapperQueries, TheCategoryIsThePluginsAnswer) {
  const VSTWrapper& readOnly = *wrapper;
  for (const VstInt32 category : {0, 2, 11, -1}) {
    effect.answer(effGetPlugCategory, category);
    EXPECT_EQ(readOnly.getEffectCategory(), category);
  }
  EXPECT_EQ(effect.requests(), std::vector<Request>(4, request(effGetPlugCategory)));
}

TEST_F(VSTWrapperQueries, RateAndBlockSizeAreSentAndThePluginsAnswersReturned) {
  effect.answer(effSetSampleRate, -3);
  effect.answer(effSetBlockSize, 12);
  EXPECT_EQ(wrapper->setSampleRate(44100.0001), -3);  // Sent as a 32-bit float.
  wrapper->setSampleRate(-1.0);
  EXPECT_EQ(wrapper->setBufferSize(INT_MAX), 12);
  wrapper->setBufferSize(-1);
  EXPECT_THAT(effect.requests(),
              ElementsAre(request(effSetSampleRate, 0, 0, 44100.0f), request(effSetSampleRate, 0, 0, -1.0f),
                          request(effSetBlockSize, 0, 2147483647), request(effSetBlockSize, 0, -1)));
}

// On purpose not effSetSpeakerArrangement (42), and not pointers to the records.
TEST_F(VSTWrapperQueries, SpeakerArrangementsAreOfferedWithOpcode69AndTheRecordsThemselves) {
  VstSpeakerArrangement input{};
  VstSpeakerArrangement output{};
  effect.answerNext(static_cast<VstEffectOpcode>(69), {1, -1, 0});
  EXPECT_TRUE(wrapper->setSpeakerArrangement(&input, &output));
  EXPECT_TRUE(wrapper->setSpeakerArrangement(&input, nullptr));
  EXPECT_FALSE(wrapper->setSpeakerArrangement(nullptr, nullptr));
  EXPECT_THAT(effect.requests(),
              ElementsAre(speakerArrangement(&input, &output), speakerArrangement(&input, nullptr),
                          request(effGetSpeakerArrangement)));
  EXPECT_EQ(effect.requests().at(0).opcode, 69);
}

TEST_F(VSTWrapperQueries, PropertiesOfPinsAreFilledInPlace) {
  VstPinProperties left{};
  std::strcpy(left.label, "Left");
  VstPinProperties side{};
  side.arrangementType = -2;
  effect.setInputProperties(7, side);
  effect.setOutputProperties(0, left);
  VstPinProperties input{};
  EXPECT_TRUE(wrapper->getInputProperties(7, input));
  EXPECT_EQ(input.arrangementType, -2);
  VstPinProperties output{};
  EXPECT_TRUE(wrapper->getOutputProperties(0, output));
  EXPECT_STREQ(output.label, "Left");
  EXPECT_THAT(effect.requests(),
              ElementsAre(request(effGetInputProperties, 7), request(effGetOutputProperties)));
}

// The caller clears the record, the wrapper does not; the index is not checked.
TEST_F(VSTWrapperQueries, RecordAndIndexOfAPinArePassedOnAsTheyAre) {
  VstPinProperties pin{};
  std::memset(&pin, 'x', sizeof pin);
  wrapper->getInputProperties(-1, pin);
  wrapper->getOutputProperties(INT_MAX, pin);
  EXPECT_THAT(effect.requests(), ElementsAre(request(effGetInputProperties, -1).withZeroBytes(0),
                                             request(effGetOutputProperties, 2147483647).withZeroBytes(0)));
}

TEST_F(VSTWrapperQueries, AnAnswerForAPinIsTrueUnlessItIsZero) {
  VstPinProperties written{};
  written.flags = 1;
  effect.setInputProperties(0, written);
  effect.answerNext(effGetInputProperties, {0, -1});
  effect.answerNext(effGetOutputProperties, {0, -1});
  VstPinProperties pin{};
  EXPECT_FALSE(wrapper->getInputProperties(0, pin));
  EXPECT_EQ(pin.flags, 1);
  EXPECT_TRUE(wrapper->getInputProperties(0, pin));
  EXPECT_FALSE(wrapper->getOutputProperties(0, pin));
  EXPECT_TRUE(wrapper->getOutputProperties(0, pin));
}

// ---- Shell children

class VSTWrapperShellChildren : public host_tests::WrapperTest {
 protected:
  VSTWrapperShellChildren() { open(); }
  VST_ChildSpec child;
};

TEST_F(VSTWrapperShellChildren, ComeOneByOneUntilNoneIsLeft) {
  effect.setShellChildren({{1234, "Shimmer"}, {-7, "Delay"}});
  EXPECT_TRUE(wrapper->getNextShellPlugin(child));
  EXPECT_TRUE(child.hasChildID);
  EXPECT_EQ(child.childID, 1234);
  EXPECT_EQ(child.childName, "Shimmer");
  EXPECT_TRUE(wrapper->getNextShellPlugin(child));
  EXPECT_EQ(child.childID, -7);
  EXPECT_EQ(child.childName, "Delay");
  child.hasChildID = false;
  // The end fills in the record too.
  EXPECT_FALSE(wrapper->getNextShellPlugin(child));
  EXPECT_TRUE(child.hasChildID);
  EXPECT_EQ(child.childID, 0);
  EXPECT_EQ(child.childName, "");
  EXPECT_EQ(effect.requests(), std::vector<Request>(3, request(effShellGetNextPlugin)));
  EXPECT_FALSE(wrapper->childSpec.hasChildID);
}

TEST_F(VSTWrapperShellChildren, ANameAtTheEndIsTakenOver) {
  effect.setText(effShellGetNextPlugin, "No more");
  effect.answer(effShellGetNextPlugin, 0);
  EXPECT_FALSE(wrapper->getNextShellPlugin(child));
  EXPECT_EQ(child.childName, "No more");
}

TEST_F(VSTWrapperShellChildren, ANameWithoutAZeroByteRunsToTheEndOfTheBuffer) {
  effect.setUnterminatedText(effShellGetNextPlugin, 114, 'c');
  EXPECT_TRUE(wrapper->getNextShellPlugin(child));
  EXPECT_EQ(child.childName, std::string(114, 'c'));
}

// ---- Every operation that calls the dispatcher

using W = VSTWrapper;

struct Operation {
  const char* name;
  void (*run)(VSTWrapper& wrapper);
  VstEffectOpcode lastRequest;  ///< Made after the operation's other requests.
};

VstPinProperties pin;
VstParameterProperties parameter;
VstSpeakerArrangement speakers;
VST_ChildSpec nextChild;
AutoBuffer<char> newStore;
AutoBuffer<char> storeOfAnotherName;

const Operation kOperations[] = {
    {"getEffectCategory", [](W& w) { w.getEffectCategory(); }, effGetPlugCategory},
    {"setSampleRate", [](W& w) { w.setSampleRate(48000.0); }, effSetSampleRate},
    {"setBufferSize", [](W& w) { w.setBufferSize(64); }, effSetBlockSize},
    {"setSpeakerArrangement", [](W& w) { w.setSpeakerArrangement(&speakers, &speakers); },
     effGetSpeakerArrangement},
    {"getInputProperties", [](W& w) { w.getInputProperties(0, pin); }, effGetInputProperties},
    {"getOutputProperties", [](W& w) { w.getOutputProperties(0, pin); }, effGetOutputProperties},
    {"getEffectName", [](W& w) { w.getEffectName(); }, effGetProductString},
    {"getManufacturerName", [](W& w) { w.getManufacturerName(); }, effGetVendorString},
    {"getNextShellPlugin", [](W& w) { w.getNextShellPlugin(nextChild); }, effShellGetNextPlugin},
    {"getParameterName", [](W& w) { w.getParameterName(0); }, effGetParamName},
    {"getParameterLabel", [](W& w) { w.getParameterLabel(0); }, effGetParamLabel},
    {"getParameterCurValueAsText", [](W& w) { w.getParameterCurValueAsText(0); }, effGetParamDisplay},
    {"setParameterCurValueFromText", [](W& w) { w.setParameterCurValueFromText(0, "on"); },
     effString2Parameter},
    {"isParameterAutomatable", [](W& w) { w.isParameterAutomatable(0); }, effCanBeAutomated},
    {"getParameterProps", [](W& w) { w.getParameterProps(0, parameter); }, effGetParameterProperties},
    {"setCurrentProgram", [](W& w) { w.setCurrentProgram(1); }, effSetProgram},
    {"getCurrentProgramName", [](W& w) { w.getCurrentProgramName(); }, effGetProgramName},
    {"getProgramName", [](W& w) { w.getProgramName(1); }, effGetProgramNameIndexed},
    {"changeProgramName", [](W& w) { w.changeProgramName(0, "New"); }, effSetProgramName},
    {"updateStoredProgramNames", [](W& w) { w.updateStoredProgramNames(); }, effSetProgram},
    {"createTempParameterStore", [](W& w) { w.createTempParameterStore(newStore); }, effGetProgramName},
    {"restoreFromTempParameterStore", [](W& w) { w.restoreFromTempParameterStore(storeOfAnotherName); },
     effSetProgramName},
};

class VSTWrapperOperation : public host_tests::WrapperTest, public testing::WithParamInterface<Operation> {
 protected:
  VSTWrapperOperation() {
    effect.setPrograms({{"Soft", {0.25f, 0.5f}}, {"Loud", {0.75f, 1.0f}}});
    open();
    wrapper->createTempParameterStore(storeOfAnotherName);
    storeOfAnotherName.data()[0] = 'X';
    effect.forget();
  }
};

TEST_P(VSTWrapperOperation, LetsExceptionsOfThePluginPass) {
  throwAt(GetParam().lastRequest);
  EXPECT_THROW(GetParam().run(*wrapper), int);
  effect.onRequest = [this](const Request& request) {
    if (request.opcode == GetParam().lastRequest) throw std::runtime_error("from the plug-in");
  };
  EXPECT_THROW(GetParam().run(*wrapper), std::runtime_error);
}

TEST_P(VSTWrapperOperation, HoldsTheLockForTheParameterFunctionsAndForNothingElse) {
  int asked = 0;
  effect.onRequest = [&](const Request& request) {
    ++asked;
    EXPECT_EQ(wrapper->lock.lockCount, request.kind == Request::Kind::kDispatch ? 0 : 1);
  };
  GetParam().run(*wrapper);
  EXPECT_GT(asked, 0);
  EXPECT_EQ(wrapper->lock.lockCount, 0);
}

INSTANTIATE_TEST_SUITE_P(All, VSTWrapperOperation, testing::ValuesIn(kOperations),
                         host_tests::nameOfCase<Operation>);

}  // namespace
