// SPDX-License-Identifier: MIT
// The description of a plug-in: what is asked, what is kept, and the record that is made without a plug-in.
#include <cstdint>
#include <stdexcept>
#include <string>
#include <vector>

#include "describe/vst_info.h"
#include "gmock/gmock.h"
#include "tests/describe/described_plugin.h"

namespace {

using namespace doubles;
using KelVSTInfoCache::VSTInfo;
using testing::ElementsAre;
using testing::IsEmpty;
using testing::SizeIs;

VST_Class_Spec bundleSpec() { return {VST_DLL_Info("/described.vst", "bundle"), VST_ChildSpec()}; }

std::vector<std::int32_t> rowsOf(const VSTInfo& info) {
  std::vector<std::int32_t> rows;
  for (const VSTVariant& variant : info.variants) rows.push_back(variant.variantID);
  return rows;
}

class VSTInfoTest : public DescribedPlugin {
 protected:
  VSTInfoTest() {
    effect.setText(effGetEffectName, "Chorus");
    effect.setText(effGetVendorString, "Maker");
    effect.answer(effGetVstVersion, 2300);
    effect.answer(effGetPlugCategory, 1);
    effect.aeffect.numInputs = 2;
    effect.aeffect.numOutputs = 2;
    effect.aeffect.uniqueID = 0x43686F72;
  }

  VSTInfo describe() { return VSTInfo(open(), bundleSpec()); }
};

TEST_F(VSTInfoTest, AsksAnEffectTheseQuestions) {
  effect.setParameters({0.5F, 0.25F});
  describe();
  EXPECT_THAT(
      effect.requests(),
      ElementsAre(request(effGetEffectName), request(effGetVendorString), request(effGetVstVersion),
                  request(effGetPlugCategory), canDo("receiveVstMidiEvent"), canDo("sendVstMidiEvent"),
                  getParameterOf(0), request(effGetParamName, 0), request(effGetParamLabel, 0),
                  request(effCanBeAutomated, 0), request(effGetParameterProperties, 0),  //
                  getParameterOf(1), request(effGetParamName, 1), request(effGetParamLabel, 1),
                  request(effCanBeAutomated, 1), request(effGetParameterProperties, 1)));
}

TEST_F(VSTInfoTest, KeepsWhatAnEffectAnswers) {
  effect.setParameters({0.5F, 0.25F});
  const VSTInfo info = describe();
  EXPECT_EQ(info.effectName, "Chorus");
  EXPECT_EQ(info.vendorName, "Maker");
  EXPECT_EQ(info.uniqueID, 0x43686F72);
  EXPECT_EQ(info.dllTag, 0);
  EXPECT_EQ(info.vstVersion, 2300);
  EXPECT_EQ(info.statusFlags, 1U);
  EXPECT_FALSE(info.isSynth);
  EXPECT_FALSE(info.receivesMidi);
  EXPECT_FALSE(info.sendsMidi);
  EXPECT_FALSE(info.isShell);
  EXPECT_FALSE(info.hasEditor);
  EXPECT_FALSE(info.wrapperFlag);
  ASSERT_THAT(info.params, SizeIs(2));
  EXPECT_EQ(info.params[0].paramIndex, 0);
  EXPECT_EQ(info.params[1].paramIndex, 1);
  EXPECT_EQ(info.params[1].currentValue, 0.25);
  EXPECT_THAT(info.childIDs, IsEmpty());
  EXPECT_THAT(rowsOf(info), ElementsAre(0, 1, 2));
}

TEST_F(VSTInfoTest, AsksAnInstrumentWithoutNamesForTheProductToo) {
  RecordingEffect silent;
  silent.answer(effGetPlugCategory, 2);
  silent.aeffect.numOutputs = 2;
  module.reset(new VSTPluginLoader(VST_DLL_Info("/described.vst", "test")), NiduCOM::AddRef::kAdopt);
  plugin.willCreate(silent);
  const std::unique_ptr<VSTWrapper> live(VSTWrapper::New(module, VST_ChildSpec(VST_loadID{}), nullptr));
  silent.forget();
  const VSTInfo info(live.get(), bundleSpec());
  EXPECT_THAT(silent.requests(),
              ElementsAre(request(effGetEffectName), request(effGetProductString),
                          request(effGetVendorString), request(effGetVstVersion), request(effGetPlugCategory),
                          canDo("receiveVstMidiEvent"), canDo("sendVstMidiEvent")));
  EXPECT_EQ(info.effectName, "test");
  EXPECT_EQ(info.vendorName, "unknown");
  EXPECT_EQ(info.vstVersion, 0);
  EXPECT_TRUE(info.isSynth);
  EXPECT_THAT(info.params, IsEmpty());
  EXPECT_THAT(rowsOf(info), ElementsAre(21, 22));
}

TEST_F(VSTInfoTest, AnInstrumentIsOneByCategoryAndNotByFlag) {
  effect.aeffect.flags = 256;
  const VSTInfo info = describe();
  EXPECT_FALSE(info.isSynth);
  EXPECT_THAT(rowsOf(info), ElementsAre(0, 1, 2));
}

TEST_F(VSTInfoTest, CopiesTheBundlesTag) {
  VSTWrapper* const live = open();
  module->info.dllTag = 0x123456789ABCDEF0;
  const std::uint32_t references = module->refCount;
  EXPECT_EQ(VSTInfo(live, bundleSpec()).dllTag, 0x123456789ABCDEF0);
  EXPECT_EQ(module->refCount, references);
}

TEST_F(VSTInfoTest, SeesTheEditorInTheFlags) {
  effect.aeffect.flags = 0x7FFFFFFE;
  EXPECT_FALSE(describe().hasEditor);
  effect.aeffect.flags = 1;
  EXPECT_TRUE(describe().hasEditor);
}

TEST_F(VSTInfoTest, CopiesTheWrappersFlag) {
  VSTWrapper* const live = open();
  live->auxFlag = true;
  EXPECT_TRUE(VSTInfo(live, bundleSpec()).wrapperFlag);
}

TEST_F(VSTInfoTest, ReceivesMidiByItsOwnAnswer) {
  effect.setCapability("receiveVstMidiEvent", 1);
  const VSTInfo info = describe();
  EXPECT_TRUE(info.receivesMidi);
  EXPECT_FALSE(info.sendsMidi);
}

TEST_F(VSTInfoTest, SendsMidiByItsOwnAnswer) {
  effect.setCapability("sendVstMidiEvent", 1);
  const VSTInfo info = describe();
  EXPECT_FALSE(info.receivesMidi);
  EXPECT_TRUE(info.sendsMidi);
}

TEST_F(VSTInfoTest, CountsMinusOneAsAble) {
  effect.setCapability("receiveVstMidiEvent", -1);
  effect.setCapability("sendVstMidiEvent", -1);
  const VSTInfo info = describe();
  EXPECT_TRUE(info.receivesMidi);
  EXPECT_TRUE(info.sendsMidi);
}

// The instance's own fields are read where they stand in the order of questions.
TEST_F(VSTInfoTest, ReadsTheIdentifierBeforeTheVersionAndTheFlagsAfterTheCategory) {
  VSTWrapper* const live = open();
  effect.onRequest = [this](const Request& received) {
    if (received.opcode == effGetVendorString) effect.aeffect.uniqueID = 1;
    if (received.opcode == effGetVstVersion) effect.aeffect.uniqueID = 2;
    if (received.opcode == effGetPlugCategory) effect.aeffect.flags = 1;
    if (received.opcode == effCanDo) effect.aeffect.flags = 0;
  };
  const VSTInfo info(live, bundleSpec());
  EXPECT_EQ(info.uniqueID, 1);
  EXPECT_TRUE(info.hasEditor);
}

TEST_F(VSTInfoTest, RefreshingReplacesTheVariantsAndAppendsTheParameters) {
  effect.setParameters({0.5F});
  VSTInfo info = describe();
  effect.aeffect.numOutputs = 1;
  info.refresh(wrapper.get(), bundleSpec());
  EXPECT_THAT(rowsOf(info), ElementsAre(0));
  EXPECT_THAT(info.params, SizeIs(2));
}

TEST_F(VSTInfoTest, RefreshingClearsOneBitOfTheStatus) {
  VSTInfo info = describe();
  info.statusFlags = 0xFFFFFFFF;
  info.refresh(wrapper.get(), bundleSpec());
  EXPECT_EQ(info.statusFlags, 0xFFEFFFFF);
}

TEST_F(VSTInfoTest, CopiesAreIndependent) {
  effect.setParameters({0.5F});
  const VSTInfo info = describe();
  VSTInfo copy(info);
  copy.effectName = "changed";
  copy.params[0].paramName.text = "changed";
  copy.variants.clear();
  EXPECT_EQ(info.effectName, "Chorus");
  EXPECT_EQ(info.params[0].paramName.text, "");
  EXPECT_THAT(rowsOf(info), ElementsAre(0, 1, 2));
  copy = info;
  EXPECT_EQ(copy.effectName, "Chorus");
  EXPECT_THAT(rowsOf(copy), ElementsAre(0, 1, 2));
}

// ---- Invalid records ----

void expectPlaceholders(const VSTInfo& info) {
  EXPECT_EQ(info.vendorName, "unknown");
  EXPECT_EQ(info.uniqueID, 0);
  EXPECT_EQ(info.dllTag, 0);
  EXPECT_EQ(info.vstVersion, 2400);
  EXPECT_EQ(info.statusFlags, 1U);
  EXPECT_FALSE(info.isSynth);
  EXPECT_FALSE(info.receivesMidi);
  EXPECT_FALSE(info.sendsMidi);
  EXPECT_FALSE(info.isShell);
  EXPECT_TRUE(info.hasEditor);
  EXPECT_TRUE(info.wrapperFlag);
  EXPECT_THAT(info.params, IsEmpty());
  EXPECT_THAT(info.childIDs, IsEmpty());
}

TEST(VSTInfoWithoutAPlugin, HoldsPlaceholders) {
  const VSTInfo info(nullptr, bundleSpec());
  EXPECT_EQ(info.effectName, "bundle");
  expectPlaceholders(info);
  ASSERT_THAT(info.variants, SizeIs(1));
  const VSTVariant& variant = info.variants[0];
  EXPECT_EQ(variant.variantID, 0);
  EXPECT_EQ(variant.numIns, 1);
  EXPECT_EQ(variant.numOuts, 1);
  EXPECT_TRUE(variant.accepted);
}

TEST(VSTInfoWithoutAPlugin, IsNamedAfterTheChildThatIsWanted) {
  VST_Class_Spec spec = bundleSpec();
  spec.child = VST_ChildSpec(7);
  spec.child.childName = "Seventh";
  EXPECT_EQ(VSTInfo(nullptr, spec).effectName, "Seventh");
}

TEST_F(VSTInfoTest, BecomingInvalidClearsAllButTheVariants) {
  effect.setParameters({0.5F});
  effect.answer(effGetPlugCategory, 2);
  effect.setCapability("receiveVstMidiEvent", 1);
  effect.setCapability("sendVstMidiEvent", 1);
  VSTInfo info = describe();
  info.dllTag = 5;
  info.isShell = true;
  info.statusFlags = 0xFFFFFFFF;
  info.childIDs.emplace_back(7);
  ASSERT_THAT(rowsOf(info), ElementsAre(21, 22));
  info.setToInvalid(bundleSpec());
  EXPECT_EQ(info.effectName, "bundle");
  expectPlaceholders(info);
  EXPECT_THAT(rowsOf(info), ElementsAre(21, 22, 0));
  EXPECT_FALSE(info.variants[1].accepted);
  EXPECT_TRUE(info.variants[2].accepted);
}

}  // namespace
