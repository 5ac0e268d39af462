// SPDX-License-Identifier: MIT
// VSTWrapper::createTempParameterStore and restoreFromTempParameterStore: bytes and requests.
#include <climits>
#include <cstring>
#include <string>
#include <utility>

#include "tests/host/preset_fixture.h"
#include "tests/shared/thrown.h"

namespace {

using namespace doubles;
using namespace preset_tests;
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
    effect.forget();
    wrapper->restoreFromTempParameterStore(store);
  }
};

TEST_F(VSTWrapperTempParameterStore, HoldsTheNameAndTheValuesInMachineByteOrder) {
  EXPECT_EQ(created(), nameField("Loud") + bytes("\x00\x00\x80\x3F"
                                                 "\x00\x00\x00\xBF"
                                                 "\xCD\xCC\xCC\x3D"));
  EXPECT_EQ(effect.requests(), inOrder({asksName(), readsParameters(3)}));
  EXPECT_THAT(wrapper->storedProgramNames, ElementsAre("", "Loud"));
}

TEST_F(VSTWrapperTempParameterStore, HoldsTheFirst63CharactersOfTheName) {
  effect.setParameters({});
  for (const std::size_t length : {0u, 63u, 64u, 256u}) {
    effect.setUnterminatedText(effGetProgramName, length, 'n');
    EXPECT_EQ(created(), nameField(std::string(std::min<std::size_t>(length, 63), 'n'))) << length;
  }
}

// On purpose: a negative count is used as it is. 4 x -16 + 64 is 0, for which there still is the name.
TEST_F(VSTWrapperTempParameterStore, HasNoValuesForNegativeCountsAndIsMinusOneBelowASizeOfZero) {
  for (const VstInt32 count : {0, -1, -16}) {
    effect.aeffect.numParams = count;
    EXPECT_EQ(created(), nameField("Loud")) << count;
  }
  effect.forget();
  for (const VstInt32 count : {-17, INT_MIN, 536870896, INT_MAX}) {
    effect.aeffect.numParams = count;
    EXPECT_EQ(thrownInt([this] { created(); }), -1) << count;
  }
  EXPECT_THAT(effect.requests(), IsEmpty());
}

TEST_F(VSTWrapperTempParameterStore, HoldsZeroWhereThePluginThrows) {
  effect.onRequest = [](const Request& request) {
    if (request == getParameterOf(1)) throw 7;
  };
  EXPECT_EQ(created(), nameField("Loud") + bytes("\x00\x00\x80\x3F"
                                                 "\x00\x00\x00\x00"
                                                 "\xCD\xCC\xCC\x3D"));
}

TEST_F(VSTWrapperTempParameterStore, HoldsZeroWhereTheParametersAreGoneMeanwhile) {
  effect.onRequest = [this](const Request& request) {
    if (request == getParameterOf(0)) effect.aeffect.numParams = 1;
  };
  EXPECT_EQ(created(), nameField("Loud") + bytes("\x00\x00\x80\x3F") + std::string(8, '\0'));
}

// ---- Restoring

TEST_F(VSTWrapperTempParameterStore, IsRestoredNameFirstAndThenTheValuesThatDiffer) {
  restore(nameField("Edited") + bytes("\x00\x00\x00\x3F"     // 0.5
                                      "\x00\x00\x00\xBF"     // -0.5, the present value
                                      "\x00\x00\x80\x3F"));  // 1.0
  EXPECT_EQ(effect.requests(),
            inOrder({renames("Edited"), sets(0, 0.5f), {getParameterOf(1)}, sets(2, 1.0f)}));
}

TEST_F(VSTWrapperTempParameterStore, SendsTheFirst24CharactersOfANameThatEndsAtItsZeroByte) {
  restore(nameField("123456789.123456789.123456789."));
  EXPECT_THAT(effect.requestsOf(effSetProgramName), ElementsAre(setProgramName("123456789.123456789.1234")));
  std::string field = nameField("123456789.123456789.1234");
  field[30] = 'x';
  restore(field);
  EXPECT_THAT(effect.requestsOf(effSetProgramName), IsEmpty());
}

// On purpose: a store with another number of parameters is not refused.
TEST_F(VSTWrapperTempParameterStore, RestoresAsManyValuesAsBothItAndThePluginHave) {
  const std::string content = created();
  for (const auto& [parameters, restored] : {std::pair{1, 1}, std::pair{-1, 0}, std::pair{1000, 3}}) {
    effect.aeffect.numParams = parameters;
    restore(content);
    EXPECT_EQ(effect.parameterReads(), readsParameters(restored));
  }
}

}  // namespace
