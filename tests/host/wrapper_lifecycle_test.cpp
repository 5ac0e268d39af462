// SPDX-License-Identifier: MIT
// VSTWrapper::New and ~VSTWrapper: what an instance is asked when it is created and closed, and what happens
// where that fails.
#include <climits>
#include <cstddef>
#include <cstdlib>
#include <cstring>
#include <stdexcept>
#include <string>
#include <vector>

#include "tests/shared/scarce_memory.h"
#include "tests/shared/wrapper_fixture.h"

namespace {

using namespace doubles;
using host_tests::everyThrown;
using host_tests::Thrown;
using testing::ElementsAre;
using testing::IsEmpty;

// The requests of a creation are in tests/end_to_end/golden/conversation_*.txt.
class VSTWrapperCreation : public host_tests::WrapperTest {};

TEST_F(VSTWrapperCreation, ConnectsNothingForCountsBelowZero) {
  effect.aeffect.numInputs = -1;
  effect.aeffect.numOutputs = INT_MIN;
  plugin.willCreate(effect);
  wrapper = create();
  ASSERT_NE(wrapper, nullptr);
  EXPECT_THAT(effect.requestsOf({effConnectInput, effConnectOutput}), IsEmpty());
}

TEST_F(VSTWrapperCreation, ReadsThePinCountsWhenItConnects) {
  plugin.willCreate(effect);
  effect.onRequest = [this](const Request& request) {
    if (request.opcode == effOpen) effect.aeffect.numInputs = 1;
  };
  wrapper = create();
  EXPECT_THAT(effect.requestsOf({effConnectInput, effConnectOutput}), ElementsAre(connectInput(0)));
}

TEST_F(VSTWrapperCreation, IgnoresThePluginsAnswers) {
  effect.aeffect.numInputs = 1;
  effect.aeffect.numOutputs = 1;
  for (const VstEffectOpcode opcode : {effIdentify, effSetSampleRate, effSetBlockSize, effOpen, effSetProgram,
                                       effConnectInput, effConnectOutput, effCanDo}) {
    effect.answer(opcode, -1);
  }
  plugin.willCreate(effect);
  wrapper = create();
  ASSERT_NE(wrapper, nullptr);
  EXPECT_EQ(effect.requests().size(), 8u);
}

TEST_F(VSTWrapperCreation, StoresItsArgumentsAndLeavesAllElseUnset) {
  int owner = 0;
  auto* const support = reinterpret_cast<KelVSTSupportEffect*>(&owner);
  VST_ChildSpec child(1234);
  child.childName = "Shimmer";
  plugin.willCreate(effect);
  wrapper = create(child, support);
  child.childName = "another";
  ASSERT_NE(wrapper, nullptr);
  EXPECT_EQ(wrapper->loader.get(), module.get());
  EXPECT_TRUE(wrapper->childSpec.hasChildID);
  EXPECT_EQ(wrapper->childSpec.childID, 1234);
  EXPECT_EQ(wrapper->childSpec.childName, "Shimmer");
  EXPECT_EQ(wrapper->supportEffect, support);
  EXPECT_EQ(wrapper->effect, &effect.aeffect);
  EXPECT_EQ(wrapper->paramBeingSet, -1);
  EXPECT_FALSE(wrapper->bypassed);
  EXPECT_FALSE(wrapper->mainsOn);
  EXPECT_FALSE(wrapper->hasCockosExtensions);
  EXPECT_FALSE(wrapper->auxFlag);
  EXPECT_THAT(wrapper->storedProgramNames, IsEmpty());
  EXPECT_EQ(wrapper->lock.lockCount, 0);
}

TEST_F(VSTWrapperCreation, WritesTheWrappersAddressIntoTheInstanceBeforeTheFirstRequest) {
  plugin.willCreate(effect);
  VstIntPtr seen = 0;
  effect.onRequest = [&](const Request& request) {
    if (request.opcode == effIdentify) seen = effect.aeffect.resvd2;
  };
  wrapper = create();
  ASSERT_NE(wrapper, nullptr);
  EXPECT_EQ(seen, reinterpret_cast<VstIntPtr>(wrapper.get()));
  EXPECT_EQ(effect.aeffect.resvd2, seen);
  EXPECT_EQ(effect.aeffect.resvd1, 0);
}

// On purpose: the magic number is not checked.
TEST_F(VSTWrapperCreation, AcceptsAnyMagicNumber) {
  for (const VstInt32 magic : {0, -1, 0x50747356}) {
    effect.aeffect.magic = magic;
    plugin.willCreate(effect);
    EXPECT_NE(create(), nullptr) << magic;
    EXPECT_EQ(effect.aeffect.magic, magic);
  }
}

struct TokenCase {
  const char* name;
  std::int64_t answer;
  bool known;
};

class VSTWrapperExtensionToken : public host_tests::WrapperTest,
                                 public testing::WithParamInterface<TokenCase> {};

TEST_P(VSTWrapperExtensionToken, IsTheUpperHalfOfTheAnswersLow32Bits) {
  effect.setCapability("hasCockosExtensions", static_cast<VstIntPtr>(GetParam().answer));
  open();
  EXPECT_EQ(wrapper->hasCockosExtensions, GetParam().known);
  EXPECT_FALSE(wrapper->auxFlag);
}

INSTANTIATE_TEST_SUITE_P(
    Answers, VSTWrapperExtensionToken,
    testing::Values(TokenCase{"Token", 0xBEEF0000, true}, TokenCase{"TokenAndMore", 0xBEEF1234, true},
                    TokenCase{"TokenAndAllElse", 0xBEEFFFFF, true}, TokenCase{"Zero", 0, false},
                    TokenCase{"MinusOne", -1, false}, TokenCase{"TokenInTheLowerHalf", 0x0000BEEF, false},
                    TokenCase{"OneBitLess", 0xBEEE0000, false}, TokenCase{"TopBitMissing", 0x3EEF0000, false},
                    TokenCase{"SignExtended", -0x41110000, true}),
    host_tests::nameOfCase<TokenCase>);

// ---- The child that is being created

VstIntPtr currentId() { return VSTWrapper::masterCallback(nullptr, 2, 0, 0, nullptr, 0.0f); }

class VSTWrapperCurrentLoadID : public host_tests::WrapperTest {
 protected:
  VSTWrapperCurrentLoadID() {
    plugin.onEntry = [this](audioMasterCallback) { inEntry.push_back(currentId()); };
    effect.onRequest = [this](const Request&) { inRequests.push_back(currentId()); };
  }

  std::vector<VstIntPtr> inEntry;     ///< Answers to audioMasterCurrentId (2) in the entry point,
  std::vector<VstIntPtr> inRequests;  ///< and in every request.
};

TEST_F(VSTWrapperCurrentLoadID, IsTheChildsUntilItIsCreatedAndZeroAfterwards) {
  open(VST_ChildSpec(1234));
  EXPECT_THAT(inEntry, ElementsAre(1234));
  EXPECT_THAT(inRequests, ElementsAre(1234, 1234, 1234, 1234, 1234, 1234));
  inRequests.clear();
  wrapper->getEffectCategory();
  close();
  EXPECT_THAT(inRequests, ElementsAre(0, 0));
}

TEST_F(VSTWrapperCurrentLoadID, IsZeroForAPluginThatIsNoChild) {
  VST_ChildSpec child(99);
  child.hasChildID = false;
  open(child);
  EXPECT_THAT(inEntry, ElementsAre(0));
}

TEST_F(VSTWrapperCurrentLoadID, IsThatOfTheLatestChildWithItsSign) {
  for (int i = 0; i < 3; ++i) plugin.willCreate(effect);
  create(VST_ChildSpec(77));
  create(VST_ChildSpec(INT_MIN));
  create();
  EXPECT_THAT(inEntry, ElementsAre(77, VstIntPtr{INT_MIN}, 0));
}

// ---- Failed creation

class VSTWrapperFailedCreation : public host_tests::WrapperTest {
 protected:
  /// New() for child 1234 gives null and leaves no trace.
  void expectNoInstance() {
    std::unique_ptr<VSTWrapper> made;
    EXPECT_NO_THROW(made = create(VST_ChildSpec(1234)));
    EXPECT_EQ(made, nullptr);
    EXPECT_EQ(VSTWrapper::gCurrentLoadID, 0);
    EXPECT_EQ(module->refCount, 1u);
  }
};

TEST_F(VSTWrapperFailedCreation, OfAnEntryPointThatReturnsNull) {
  plugin.willRefuse();
  expectNoInstance();
  EXPECT_THAT(effect.requests(), IsEmpty());
}

TEST_F(VSTWrapperFailedCreation, OfAModuleWithoutAnEntryPoint) {
  core_foundation.addBundle("/test.vst", {{"somethingElse", plugin.entryPoint()}});
  expectNoInstance();
  EXPECT_THAT(plugin.entryCalls(), IsEmpty());
}

TEST_F(VSTWrapperFailedCreation, OfAnEntryPointThatThrowsCanBeFollowedByASuccessfulOne) {
  for (const Thrown& thrown : everyThrown()) {
    SCOPED_TRACE(thrown.name);
    plugin.onEntry = [&](audioMasterCallback) { thrown.raise(); };
    expectNoInstance();
  }
  EXPECT_EQ(plugin.entryCalls().size(), 4u);
  plugin.onEntry = nullptr;
  open();
  EXPECT_EQ(wrapper->effect, &effect.aeffect);
}

// Two inputs and one output: nine requests.
class VSTWrapperCreationThatThrows : public VSTWrapperFailedCreation,
                                     public testing::WithParamInterface<std::size_t> {};

TEST_P(VSTWrapperCreationThatThrows, EndsWithThatRequest) {
  const std::size_t throwing = GetParam();
  effect.aeffect.numInputs = 2;
  effect.aeffect.numOutputs = 1;
  for (const Thrown& thrown : everyThrown()) {
    SCOPED_TRACE(thrown.name);
    effect.forget();
    effect.onRequest = [&](const Request&) {
      EXPECT_EQ(VSTWrapper::gCurrentLoadID, 1234);
      EXPECT_EQ(module->refCount, 3u);  // The test's, New()'s and the wrapper's.
      if (effect.requests().size() == throwing) thrown.raise();
    };
    plugin.willCreate(effect);
    expectNoInstance();
    EXPECT_EQ(effect.requests().size(), throwing);
    // The wrapper was never complete, so it does not close the instance.
    EXPECT_EQ(effect.timesClosed(), 0);
  }
}

INSTANTIATE_TEST_SUITE_P(AtRequest, VSTWrapperCreationThatThrows, testing::Range<std::size_t>(1, 10),
                         testing::PrintToStringParamName());

// Each allocation fails once, also those that the doubles make meanwhile.
TEST(VSTWrapperWithoutMemory, NewReturnsNullAndLeavesNothingBehind) {
  VST_ChildSpec child(1234);
  child.childName = "A name that is too long for a string's own room";
  int failures = 0;
  for (bool made = false; !made;) {
    ASSERT_LT(failures, 1000);
    RecordingCoreFoundation core_foundation;
    InProcessPlugin plugin(core_foundation);
    RecordingEffect effect;
    effect.aeffect.numInputs = 2;
    plugin.willCreate(effect);
    NiduCOM::i_ptr<VSTPluginLoader> module;
    module.reset(new VSTPluginLoader(VST_DLL_Info("/test.vst", "test")), NiduCOM::AddRef::kAdopt);

    preset_tests::failAfterAllocations(failures);
    std::unique_ptr<VSTWrapper> wrapper(VSTWrapper::New(module, child, nullptr));
    const bool allSucceeded = preset_tests::stopFailing();

    made = wrapper != nullptr;
    EXPECT_EQ(made, allSucceeded) << "allocation " << failures;
    EXPECT_EQ(VSTWrapper::gCurrentLoadID, 0);
    wrapper.reset();
    EXPECT_EQ(module->refCount, 1u) << "allocation " << failures;
    if (!made) ++failures;
  }
  EXPECT_GE(failures, 3);  // At least the wrapper, its semaphore and the child's name.
}

// ---- Destruction

class VSTWrapperDestruction : public host_tests::WrapperTest {};

TEST_F(VSTWrapperDestruction, OnlyClosesAnInstanceThatIsOff) {
  effect.aeffect.numInputs = 2;
  open();
  wrapper->bypassed = true;
  close();
  EXPECT_THAT(effect.requests(), ElementsAre(request(effClose)));
}

TEST_F(VSTWrapperDestruction, SwitchesAnInstanceOffThenClosesItThenReleasesTheModule) {
  open();
  wrapper->mainsOn = true;
  const VSTWrapper* const dying = wrapper.get();
  bool onAtClose = true;
  std::uint32_t referencesAtClose = 0;
  effect.onRequest = [&](const Request& request) {
    if (request.opcode != effClose) return;
    onAtClose = dying->mainsOn;
    referencesAtClose = module->refCount;
  };
  close();
  EXPECT_THAT(effect.requests(), ElementsAre(request(effMainsChanged, 0, 0), request(effClose)));
  EXPECT_FALSE(onAtClose);
  EXPECT_EQ(referencesAtClose, 2u);
  EXPECT_EQ(module->refCount, 1u);
}

TEST_F(VSTWrapperDestruction, LetsExceptionsOfThePluginPass) {
  for (const VstEffectOpcode opcode : {effClose, effMainsChanged}) {
    open();
    wrapper->mainsOn = true;
    throwAt(opcode);
    EXPECT_THROW(close(), int);
    EXPECT_EQ(effect.requests().back(), request(opcode));
    EXPECT_EQ(module->refCount, 1u);
    effect.onRequest = nullptr;
  }
}

// A second exception would end the process.
TEST_F(VSTWrapperDestruction, SwallowsAnExceptionOfEffCloseWhileAnotherOnePropagates) {
  open();
  throwAt(effClose);
  const auto failWithAWrapperInScope = [this] {
    const std::unique_ptr<VSTWrapper> owner(wrapper.release());
    throw std::runtime_error("the first failure");
  };
  EXPECT_THROW(failWithAWrapperInScope(), std::runtime_error);
  EXPECT_EQ(effect.timesClosed(), 1);
  EXPECT_EQ(module->refCount, 1u);
}

// ---- The instance's memory. Some plug-ins own only the first part of the record, and all free it when they
// are closed. The address sanitizer reports a host that reads elsewhere.

constexpr std::size_t kOwnedSize = offsetof(AEffect, processDoubleReplacing);

AEffect* instanceToHandOut = nullptr;
AEffect* handOut(audioMasterCallback) { return instanceToHandOut; }

TEST_F(VSTWrapperCreation, AndUseAndClosingStayWithinAShortInstanceAndDoNotReadItOnceClosed) {
  effect.setPrograms({{"Soft", {0.25f}}, {"Loud", {0.75f}}});
  effect.aeffect.numInputs = 1;
  effect.aeffect.numOutputs = 1;
  void* const memory = std::malloc(kOwnedSize);
  std::memcpy(memory, &effect.aeffect, kOwnedSize);
  instanceToHandOut = static_cast<AEffect*>(memory);
  core_foundation.addBundle("/test.vst", {{"VSTPluginMain", handOut}});
  effect.onRequest = [memory](const Request& request) {
    if (request.kind != Request::Kind::kDispatch || request.opcode != effClose) return;
    std::memset(memory, 0xEE, kOwnedSize);
    std::free(memory);
  };
  wrapper = create();
  ASSERT_NE(wrapper, nullptr);
  wrapper->setParameter(0, 0.5f);
  EXPECT_EQ(wrapper->getParameter(0), 0.5f);
  wrapper->updateStoredProgramNames();
  EXPECT_EQ(wrapper->getProgramName(1), "Loud");
  wrapper->mainsOn = true;
  close();
  EXPECT_EQ(effect.requests().back(), request(effClose));
}

}  // namespace
