// SPDX-License-Identifier: MIT
// VSTWrapper::New where the plug-in gives no instance: null, nothing thrown, nothing left over.
#include <stdexcept>

#include "tests/shared/wrapper_fixture.h"

namespace {

using namespace doubles;
using host_tests::everyThrown;
using host_tests::Thrown;
using testing::ElementsAre;
using testing::IsEmpty;

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

TEST_F(VSTWrapperFailedCreation, OfAnEntryPointThatAnswersNull) {
  plugin.willRefuse();
  expectNoInstance();
  EXPECT_THAT(plugin.entryCalls(), ElementsAre(&VSTWrapper::masterCallback));
  EXPECT_THAT(effect.requests(), IsEmpty());
}

TEST_F(VSTWrapperFailedCreation, OfAModuleWithoutAnEntryPoint) {
  core_foundation.addBundle("/test.vst", {{"somethingElse", plugin.entryPoint()}});
  expectNoInstance();
  EXPECT_THAT(plugin.entryCalls(), IsEmpty());
}

TEST_F(VSTWrapperFailedCreation, OfAnEntryPointThatThrows) {
  for (const Thrown& thrown : everyThrown()) {
    SCOPED_TRACE(thrown.name);
    plugin.onEntry = [&](audioMasterCallback) { thrown.raise(); };
    expectNoInstance();
  }
  EXPECT_EQ(plugin.entryCalls().size(), 4u);
}

TEST_F(VSTWrapperFailedCreation, CanBeFollowedByASuccessfulOne) {
  plugin.willRefuse();
  plugin.willThrow();
  expectNoInstance();
  expectNoInstance();
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
    // The wrapper never stood, so it never closes.
    EXPECT_EQ(effect.timesClosed(), 0);
  }
}

INSTANTIATE_TEST_SUITE_P(AtRequest, VSTWrapperCreationThatThrows, testing::Range<std::size_t>(1, 10),
                         testing::PrintToStringParamName());

TEST_F(VSTWrapperFailedCreation, IsOverAfterTheLastOfThoseRequests) {
  effect.aeffect.numInputs = 2;
  effect.aeffect.numOutputs = 1;
  plugin.willCreate(effect);
  EXPECT_NE(create(), nullptr);
  EXPECT_EQ(effect.requests().size(), 9u + 1u);  // And effClose.
}

}  // namespace
