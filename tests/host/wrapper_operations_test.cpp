// SPDX-License-Identifier: MIT
// All operations of the wrapper that ask the plug-in through its dispatcher, one row each: what the plug-in
// throws passes to the caller, and no lock is held.
#include <cstring>
#include <stdexcept>

#include "tests/shared/wrapper_fixture.h"
#include "vst2/speakers.h"

namespace {

using namespace doubles;

struct Operation {
  const char* name;
  void (*run)(VSTWrapper& wrapper);
  VstEffectOpcode lastRequest;  ///< Made after the operation's other requests of the plug-in.
};

VstPinProperties pin;
VstParameterProperties parameter;
VstSpeakerArrangement speakers;
AutoBuffer<char> storeOfAnotherName;

const Operation kOperations[] = {
    {"getEffectCategory", [](VSTWrapper& w) { w.getEffectCategory(); }, effGetPlugCategory},
    {"setSampleRate", [](VSTWrapper& w) { w.setSampleRate(48000.0); }, effSetSampleRate},
    {"setBufferSize", [](VSTWrapper& w) { w.setBufferSize(64); }, effSetBlockSize},
    {"setSpeakerArrangement", [](VSTWrapper& w) { w.setSpeakerArrangement(&speakers, &speakers); },
     effGetSpeakerArrangement},
    {"getInputProperties", [](VSTWrapper& w) { w.getInputProperties(0, pin); }, effGetInputProperties},
    {"getOutputProperties", [](VSTWrapper& w) { w.getOutputProperties(0, pin); }, effGetOutputProperties},
    {"getEffectName", [](VSTWrapper& w) { w.getEffectName(); }, effGetProductString},
    {"getManufacturerName", [](VSTWrapper& w) { w.getManufacturerName(); }, effGetVendorString},
    {"getNextShellPlugin",
     [](VSTWrapper& w) {
       VST_ChildSpec child;
       w.getNextShellPlugin(child);
     },
     effShellGetNextPlugin},
    {"getParameterName", [](VSTWrapper& w) { w.getParameterName(0); }, effGetParamName},
    {"getParameterLabel", [](VSTWrapper& w) { w.getParameterLabel(0); }, effGetParamLabel},
    {"getParameterCurValueAsText", [](VSTWrapper& w) { w.getParameterCurValueAsText(0); },
     effGetParamDisplay},
    {"setParameterCurValueFromText", [](VSTWrapper& w) { w.setParameterCurValueFromText(0, "on"); },
     effString2Parameter},
    {"isParameterAutomatable", [](VSTWrapper& w) { w.isParameterAutomatable(0); }, effCanBeAutomated},
    {"getParameterProps", [](VSTWrapper& w) { w.getParameterProps(0, parameter); },
     effGetParameterProperties},
    {"setCurrentProgram", [](VSTWrapper& w) { w.setCurrentProgram(1); }, effSetProgram},
    {"getCurrentProgramName", [](VSTWrapper& w) { w.getCurrentProgramName(); }, effGetProgramName},
    {"getProgramName", [](VSTWrapper& w) { w.getProgramName(1); }, effGetProgramNameIndexed},
    {"changeProgramName", [](VSTWrapper& w) { w.changeProgramName(0, "New"); }, effSetProgramName},
    {"updateStoredProgramNames", [](VSTWrapper& w) { w.updateStoredProgramNames(); }, effSetProgram},
    {"createTempParameterStore",
     [](VSTWrapper& w) {
       AutoBuffer<char> store;
       w.createTempParameterStore(store);
     },
     effGetProgramName},
    {"restoreFromTempParameterStore",
     [](VSTWrapper& w) { w.restoreFromTempParameterStore(storeOfAnotherName); }, effSetProgramName},
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

TEST_P(VSTWrapperOperation, LetsWhatThePluginThrowsPass) {
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
