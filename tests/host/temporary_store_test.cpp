// SPDX-License-Identifier: MIT
// VSTWrapper::createTempParameterStore and restoreFromTempParameterStore: bytes and conversation.
#include <climits>
#include <cstring>
#include <string>

#include "tests/shared/wrapper_fixture.h"

namespace {

using namespace doubles;
using testing::ElementsAre;
using testing::IsEmpty;

/// 64 bytes: the name, then zero bytes.
std::string nameField(const std::string& name) { return name + std::string(64 - name.size(), '\0'); }

/// Bytes with zero bytes among them.
template <std::size_t size>
std::string bytes(const char (&literal)[size]) {
  return std::string(literal, size - 1);
}

class VSTWrapperTempParameterStore : public host_tests::WrapperTest {
 protected:
  /// Two programs; "Loud" (1) is the current one.
  VSTWrapperTempParameterStore() {
    effect.setPrograms({{"Soft", {0.0f, 0.0f, 0.0f}}, {"Loud", {1.0f, -0.5f, 0.1f}}});
    open();
    effect.currentProgram = 1;
  }

  std::string created() {
    AutoBuffer<char> store;
    wrapper->createTempParameterStore(store);
    return std::string(store.data(), static_cast<std::size_t>(store.size()));
  }

  void restore(const std::string& content) {
    AutoBuffer<char> store;
    store.setSize(static_cast<int>(content.size()));
    std::memcpy(store.data(), content.data(), content.size());
    wrapper->restoreFromTempParameterStore(store);
  }
};

TEST_F(VSTWrapperTempParameterStore, HoldsTheNameAndTheValuesInMachineByteOrder) {
  EXPECT_EQ(created(), nameField("Loud") + bytes("\x00\x00\x80\x3F"
                                                 "\x00\x00\x00\xBF"
                                                 "\xCD\xCC\xCC\x3D"));
}

TEST_F(VSTWrapperTempParameterStore, IsMadeInThisConversation) {
  created();
  EXPECT_THAT(effect.requests(), ElementsAre(request(effGetProgramName), request(effGetProgram),
                                             getParameterOf(0), getParameterOf(1), getParameterOf(2)));
}

TEST_F(VSTWrapperTempParameterStore, StoresTheNameInTheWrapperToo) {
  created();
  EXPECT_THAT(wrapper->storedProgramNames, ElementsAre("", "Loud"));
}

TEST_F(VSTWrapperTempParameterStore, HoldsTheFirst63CharactersOfTheName) {
  effect.setParameters({});
  for (const std::size_t length : {0u, 62u, 63u, 64u, 65u, 200u}) {
    effect.setText(effGetProgramName, std::string(length, 'n'));
    EXPECT_EQ(created(), nameField(std::string(std::min<std::size_t>(length, 63), 'n'))) << length;
  }
  effect.setUnterminatedText(effGetProgramName, 256, 'n');
  EXPECT_EQ(created(), std::string(63, 'n') + '\0');
}

TEST_F(VSTWrapperTempParameterStore, Is64BytesForAPluginWithoutParameters) {
  for (const VstInt32 count : {0, -1, INT_MIN}) {
    effect.aeffect.numParams = count;
    EXPECT_EQ(created(), nameField("Loud"));
  }
}

TEST_F(VSTWrapperTempParameterStore, HoldsZeroWhereThePluginThrows) {
  effect.onRequest = [](const Request& request) {
    if (request == getParameterOf(1)) throw 7;
  };
  EXPECT_EQ(created(), nameField("Loud") + bytes("\x00\x00\x80\x3F"
                                                 "\x00\x00\x00\x00"
                                                 "\xCD\xCC\xCC\x3D"));
}

TEST_F(VSTWrapperTempParameterStore, ReplacesWhatTheBufferHeldBefore) {
  effect.setUnterminatedText(effGetProgramName, 63);
  effect.aeffect.numParams = 200;
  AutoBuffer<char> store;
  wrapper->createTempParameterStore(store);
  ASSERT_EQ(store.size(), 864);
  effect.setText(effGetProgramName, "Loud");
  effect.aeffect.numParams = 3;
  wrapper->createTempParameterStore(store);
  ASSERT_EQ(store.size(), 76);
  EXPECT_STREQ(store.data(), "Loud");
  EXPECT_EQ(std::string(store.data() + 4, 60), std::string(60, '\0'));
}

// ---- Restoring ----

TEST_F(VSTWrapperTempParameterStore, IsRestoredNameFirstAndThenTheValuesThatDiffer) {
  restore(nameField("Edited") + bytes("\x00\x00\x00\x3F"     // 0.5
                                      "\x00\x00\x00\xBF"     // -0.5, which it holds
                                      "\x00\x00\x80\x3F"));  // 1.0
  EXPECT_THAT(
      effect.requests(),
      ElementsAre(request(effGetProgram), request(effGetProgram), request(effGetProgramName),
                  request(effGetProgram), setProgramName("Edited"), getParameterOf(0),
                  setParameterTo(0, 0.5f), getParameterOf(1), getParameterOf(2), setParameterTo(2, 1.0f)));
  EXPECT_EQ(effect.program(1).name, "Edited");
  EXPECT_THAT(effect.program(1).parameters, ElementsAre(0.5f, -0.5f, 1.0f));
  EXPECT_EQ(effect.program(0).name, "Soft");
}

TEST_F(VSTWrapperTempParameterStore, ChangesNothingWhereNothingChangedSince) {
  const std::string content = created();
  effect.forget();
  restore(content);
  EXPECT_THAT(effect.requests(),
              ElementsAre(request(effGetProgram), request(effGetProgram), request(effGetProgramName),
                          request(effGetProgram), getParameterOf(0), getParameterOf(1), getParameterOf(2)));
}

TEST_F(VSTWrapperTempParameterStore, RestoresIntoTheProgramThatIsCurrentNow) {
  const std::string content = created();
  effect.currentProgram = 0;
  restore(content);
  EXPECT_EQ(effect.program(0).name, "Loud");
  EXPECT_THAT(effect.program(0).parameters, ElementsAre(1.0f, -0.5f, 0.1f));
}

TEST_F(VSTWrapperTempParameterStore, RestoresThe24CharactersOfANameThatCanBeSent) {
  restore(nameField("123456789.123456789.123456789.") + std::string(12, '\0'));
  EXPECT_THAT(effect.requestsOf(effSetProgramName), ElementsAre(setProgramName("123456789.123456789.1234")));
}

TEST_F(VSTWrapperTempParameterStore, ReadsTheNameUpToItsZeroByte) {
  std::string field = nameField("Loud");
  field[10] = 'x';
  restore(field + std::string(12, '\0'));
  EXPECT_THAT(effect.requestsOf(effSetProgramName), IsEmpty());
}

// On purpose: a store of another number of parameters is not refused.
TEST_F(VSTWrapperTempParameterStore, RestoresNoMoreValuesThanThereAreParametersNow) {
  const std::string content = created();
  effect.aeffect.numParams = 1;
  effect.forget();
  restore(content);
  EXPECT_THAT(effect.parameterReads(), ElementsAre(getParameterOf(0)));
  effect.aeffect.numParams = -1;
  effect.forget();
  restore(content);
  EXPECT_THAT(effect.parameterReads(), IsEmpty());
}

TEST_F(VSTWrapperTempParameterStore, RestoresNoMoreValuesThanItHolds) {
  const std::string content = created();
  effect.aeffect.numParams = 1000;
  effect.forget();
  restore(content);
  EXPECT_THAT(effect.parameterReads(), ElementsAre(getParameterOf(0), getParameterOf(1), getParameterOf(2)));
}

TEST_F(VSTWrapperTempParameterStore, RestoresNoNameInAPluginWithoutPrograms) {
  effect.aeffect.numPrograms = 0;
  restore(nameField("Edited") + std::string(12, '\0'));
  EXPECT_THAT(effect.requestsOf(effSetProgramName), IsEmpty());
  EXPECT_THAT(effect.parameterWrites(),
              ElementsAre(setParameterTo(0, 0.0f), setParameterTo(1, 0.0f), setParameterTo(2, 0.0f)));
}

TEST_F(VSTWrapperTempParameterStore, GoesOnWithTheNextValueWhereThePluginThrows) {
  effect.onRequest = [](const Request& request) {
    if (request.kind == Request::Kind::kSetParameter && request.index == 0) throw 7;
  };
  restore(nameField("Loud") + std::string(12, '\0'));
  EXPECT_THAT(effect.program(1).parameters, ElementsAre(1.0f, 0.0f, 0.0f));
}

}  // namespace
