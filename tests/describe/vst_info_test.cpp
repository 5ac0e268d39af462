// SPDX-License-Identifier: MIT
// The description of a plug-in: the record, and the record that is made without a plug-in. The requests are in
// tests/end_to_end/golden/conversation_*.txt.
#include <climits>
#include <cstdint>
#include <string>
#include <vector>

#include "describe/vst_info.h"
#include "gmock/gmock.h"
#include "tests/describe/described_plugin.h"
#include "tests/shared/scarce_memory.h"
#include "tests/shared/thrown.h"

namespace {

using namespace doubles;
using KelVSTInfoCache::VSTInfo;
using testing::ElementsAre;
using testing::IsEmpty;
using testing::SizeIs;

using Rows = std::vector<std::int32_t>;

Rows rowsOf(const VSTInfo& info) {
  Rows rows;
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

TEST_F(VSTInfoTest, KeepsTheAnswersOfAnEffect) {
  effect.setParameters({0.5F, 0.25F});
  const VSTInfo info = describe();
  EXPECT_EQ(info.effectName, "Chorus");
  EXPECT_EQ(info.vendorName, "Maker");
  EXPECT_EQ(info.uniqueID, 0x43686F72);
  EXPECT_EQ(info.dllTag, 0);
  EXPECT_EQ(info.vstVersion, 2300);
  EXPECT_EQ(info.statusFlags, 1U);
  EXPECT_FALSE(info.receivesMidi);
  EXPECT_FALSE(info.sendsMidi);
  EXPECT_FALSE(info.hasEditor);
  EXPECT_FALSE(info.wrapperFlag);
  ASSERT_THAT(info.params, SizeIs(2));
  EXPECT_EQ(info.params[0].paramIndex, 0);
  EXPECT_EQ(info.params[1].paramIndex, 1);
  EXPECT_EQ(info.params[1].currentValue, 0.25);
  EXPECT_THAT(rowsOf(info), ElementsAre(0, 1, 2));
}

struct CategoryCase {
  VstIntPtr category;
  bool isSynth;
  bool isShell;
};

class CategoryOf : public VSTInfoTest, public testing::WithParamInterface<CategoryCase> {};

TEST_P(CategoryOf, DecidesWhatThePluginIsAndNotItsFlags) {
  effect.answer(effGetPlugCategory, GetParam().category);
  effect.aeffect.flags = GetParam().isSynth ? 0 : 256;
  effect.setParameters({0.5F});
  effect.setShellChildren({{7, "Seventh"}});
  const VSTInfo info = describe();
  EXPECT_EQ(info.isSynth, GetParam().isSynth);
  EXPECT_EQ(info.isShell, GetParam().isShell);
  EXPECT_EQ(rowsOf(info), GetParam().isSynth ? (Rows{21, 22}) : (Rows{0, 1, 2}));
  EXPECT_THAT(info.params, SizeIs(GetParam().isShell ? 0 : 1));
  EXPECT_THAT(info.childIDs, SizeIs(GetParam().isShell ? 1 : 0));
}

INSTANTIATE_TEST_SUITE_P(Categories, CategoryOf,
                         testing::Values(CategoryCase{1, false, false}, CategoryCase{2, true, false},
                                         CategoryCase{3, false, false}, CategoryCase{9, false, false},
                                         CategoryCase{10, false, true}, CategoryCase{11, false, false}),
                         [](const auto& tested) {
                           return "Category" + std::to_string(tested.param.category);
                         });

TEST_F(VSTInfoTest, KeepsTheLow32BitsOfTheVersion) {
  // In a 32-bit build the answer is 2400 from the start.
  effect.answer(effGetVstVersion, static_cast<VstIntPtr>(0x500000960));
  EXPECT_EQ(describe().vstVersion, 2400);
}

TEST_F(VSTInfoTest, CopiesTheBundlesTag) {
  VSTWrapper* const live = open();
  module->info.dllTag = 0x123456789ABCDEF0;
  const std::uint32_t references = module->refCount;
  EXPECT_EQ(VSTInfo(live, bundleSpec()).dllTag, 0x123456789ABCDEF0);
  EXPECT_EQ(module->refCount, references);
}

TEST_F(VSTInfoTest, HasAnEditorWithBitZeroOfTheFlags) {
  effect.aeffect.flags = 0x7FFFFFFE;
  EXPECT_FALSE(describe().hasEditor);
  effect.aeffect.flags = 1;
  EXPECT_TRUE(describe().hasEditor);
}

TEST_F(VSTInfoTest, CopiesTheWrappersFlag) {
  open()->auxFlag = true;
  EXPECT_TRUE(VSTInfo(wrapper.get(), bundleSpec()).wrapperFlag);
}

TEST_F(VSTInfoTest, ReceivesOrSendsMidiWithAnyAnswerButZero) {
  for (const VstIntPtr yes : {1, -1}) {  // On purpose: -1, the answer "no", counts as well.
    effect.setCapability("receiveVstMidiEvent", yes);
    effect.setCapability("sendVstMidiEvent", 0);
    const VSTInfo receiver = describe();
    EXPECT_TRUE(receiver.receivesMidi);
    EXPECT_FALSE(receiver.sendsMidi);
    effect.setCapability("receiveVstMidiEvent", 0);
    effect.setCapability("sendVstMidiEvent", yes);
    const VSTInfo sender = describe();
    EXPECT_FALSE(sender.receivesMidi);
    EXPECT_TRUE(sender.sendsMidi);
  }
}

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

// ---- Parameter counts ----

TEST_F(VSTInfoTest, ReadsTheParameterCountBeforeEachParameter) {
  for (const VstInt32 changed : {1, 3}) {
    effect.setParameters({0.0F, 0.0F});
    effect.onRequest = [&](const Request& received) {
      if (received.opcode == effGetParamName) effect.aeffect.numParams = changed;
    };
    EXPECT_THAT(describe().params, SizeIs(changed));
  }
}

TEST_F(VSTInfoTest, HasNoParametersWhenTheCountIsNegative) {
  for (const VstInt32 count : {-1, INT_MIN}) {
    effect.aeffect.numParams = count;
    EXPECT_THAT(describe().params, IsEmpty());
  }
}

TEST_F(VSTInfoTest, ThrowsMinusOneBeforeTheFirstOfMoreParametersThanMemoryHolds) {
  effect.aeffect.numParams = INT_MAX;
  open();
  const preset_tests::ScarceMemory oneGibibyte(std::size_t{1} << 30);
  EXPECT_EQ(thrownInt([&] { VSTInfo(wrapper.get(), bundleSpec()); }), -1);
  EXPECT_THAT(effect.parameterReads(), IsEmpty());
}

// ---- Invalid records ----

TEST(VSTInfoWithoutAPlugin, IsNamedAfterTheChildAndHasOneAcceptedVariant) {
  VST_Class_Spec spec = bundleSpec();
  spec.child = VST_ChildSpec(7);
  spec.child.childName = "Seventh";
  const VSTInfo info(nullptr, spec);
  EXPECT_EQ(info.effectName, "Seventh");
  EXPECT_EQ(info.vstVersion, 2400);
  ASSERT_THAT(rowsOf(info), ElementsAre(0));
  EXPECT_TRUE(info.variants[0].accepted);
}

TEST_F(VSTInfoTest, BecomingInvalidSetsEverythingButTheFormerVariants) {
  effect.setParameters({0.5F});
  effect.answer(effGetPlugCategory, 2);
  effect.setCapability("receiveVstMidiEvent", 1);
  effect.setCapability("sendVstMidiEvent", 1);
  VSTInfo info = describe();
  info.dllTag = 5;
  info.isShell = true;
  info.statusFlags = 0xFFFFFFFF;
  info.childIDs.emplace_back(7);
  info.setToInvalid(bundleSpec());
  EXPECT_EQ(info.effectName, "bundle");
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
  ASSERT_THAT(rowsOf(info), ElementsAre(21, 22, 0));
  EXPECT_FALSE(info.variants[1].accepted);
  EXPECT_TRUE(info.variants[2].accepted);
}

}  // namespace
