// SPDX-License-Identifier: MIT
// VSTWrapper: the names of plug-in and maker.
#include <string>

#include "tests/shared/wrapper_fixture.h"

namespace {

using namespace doubles;
using testing::ElementsAre;

class VSTWrapperNames : public host_tests::WrapperTest {
 protected:
  VSTWrapperNames() { open(); }

  /// Opens an instance that is a shell's child called "Shimmer".
  void openChild() {
    VST_ChildSpec child(1234);
    child.childName = "Shimmer";
    open(child);
  }
};

TEST_F(VSTWrapperNames, TheEffectNameComesFirst) {
  effect.setText(effGetEffectName, "Reverb");
  effect.setText(effGetProductString, "Reverb Collection");
  EXPECT_EQ(wrapper->getEffectName(), "Reverb");
  EXPECT_THAT(effect.requests(), ElementsAre(request(effGetEffectName)));
}

TEST_F(VSTWrapperNames, TheProductStringIsAskedForWhereThereIsNoEffectName) {
  effect.setText(effGetProductString, "Reverb Collection");
  EXPECT_EQ(wrapper->getEffectName(), "Reverb Collection");
  EXPECT_THAT(effect.requests(), ElementsAre(request(effGetEffectName), request(effGetProductString)));
}

TEST_F(VSTWrapperNames, WithoutEitherAChildIsNamedByItsSpec) {
  openChild();
  EXPECT_EQ(wrapper->getEffectName(), "Shimmer");
  EXPECT_THAT(effect.requests(), ElementsAre(request(effGetEffectName), request(effGetProductString)));
}

TEST_F(VSTWrapperNames, WithoutEitherAPluginThatIsNoChildIsNamedByItsModule) {
  EXPECT_EQ(wrapper->getEffectName(), "The Module");
  EXPECT_THAT(effect.requests(), ElementsAre(request(effGetEffectName), request(effGetProductString)));
}

TEST_F(VSTWrapperNames, AChildsNameCountsOnlyWithItsFlag) {
  VST_ChildSpec child(1234);
  child.childName = "Shimmer";
  child.hasChildID = false;
  open(child);
  EXPECT_EQ(wrapper->getEffectName(), "The Module");
}

TEST_F(VSTWrapperNames, AnUnnamedChildHasAnEmptyName) {
  open(VST_ChildSpec(1234));
  EXPECT_EQ(wrapper->getEffectName(), "");
}

// It decides by the answer and not by the text.
TEST_F(VSTWrapperNames, AnEmptyEffectNameThatIsAnsweredWithOneIsTheName) {
  effect.setText(effGetEffectName, "");
  effect.setText(effGetProductString, "Reverb Collection");
  EXPECT_EQ(wrapper->getEffectName(), "");
  EXPECT_THAT(effect.requests(), ElementsAre(request(effGetEffectName)));
}

TEST_F(VSTWrapperNames, AnyAnswerButZeroCounts) {
  effect.setText(effGetEffectName, "Reverb");
  effect.answer(effGetEffectName, -1);
  EXPECT_EQ(wrapper->getEffectName(), "Reverb");
}

TEST_F(VSTWrapperNames, TextThatIsAnsweredWithZeroIsNoName) {
  effect.setText(effGetEffectName, "Reverb");
  effect.answer(effGetEffectName, 0);
  effect.setText(effGetProductString, "Reverb Collection");
  effect.answer(effGetProductString, 0);
  EXPECT_EQ(wrapper->getEffectName(), "The Module");
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

TEST_F(VSTWrapperNames, TheBufferIsClearedForEachQuery) {
  effect.setUnterminatedText(effGetEffectName, 100);
  effect.setUnterminatedText(effGetVendorString, 100);
  wrapper->getEffectName();
  wrapper->getManufacturerName();
  wrapper->getEffectName();
  EXPECT_THAT(effect.requests(),
              ElementsAre(request(effGetEffectName), request(effGetVendorString), request(effGetEffectName)));
}

TEST_F(VSTWrapperNames, ATextWithoutAZeroByteRunsToTheEndOfTheBuffer) {
  for (const std::size_t size : {1u, 63u, 64u, 113u, 114u}) {
    effect.setUnterminatedText(effGetEffectName, size);
    EXPECT_EQ(wrapper->getEffectName(), std::string(size, 'x'));
    effect.setUnterminatedText(effGetVendorString, size, 'v');
    EXPECT_EQ(wrapper->getManufacturerName(), std::string(size, 'v'));
  }
  effect.answer(effGetEffectName, 0);
  effect.setUnterminatedText(effGetProductString, 114, 'p');
  EXPECT_EQ(wrapper->getEffectName(), std::string(114, 'p'));
}

TEST_F(VSTWrapperNames, TextsAreNotTrimmed) {
  effect.setText(effGetEffectName, "  Reverb \n");
  effect.setText(effGetVendorString, " M\xC3\xBCller ");
  EXPECT_EQ(wrapper->getEffectName(), "  Reverb \n");
  EXPECT_EQ(wrapper->getManufacturerName(), " M\xC3\xBCller ");
}

TEST_F(VSTWrapperNames, TheMakerIsTheVendorString) {
  effect.setText(effGetVendorString, "Somebody");
  EXPECT_EQ(wrapper->getManufacturerName(), "Somebody");
  EXPECT_THAT(effect.requests(), ElementsAre(request(effGetVendorString)));
}

TEST_F(VSTWrapperNames, AMakerThatIsNotToldIsUnknown) {
  effect.setText(effGetVendorString, "Somebody");
  effect.answer(effGetVendorString, 0);
  EXPECT_EQ(wrapper->getManufacturerName(), "unknown");
  EXPECT_THAT(effect.requests(), ElementsAre(request(effGetVendorString)));
}

TEST_F(VSTWrapperNames, AMakerMayBeEmpty) {
  effect.setText(effGetVendorString, "");
  EXPECT_EQ(wrapper->getManufacturerName(), "");
}

TEST_F(VSTWrapperNames, PlayByPlayIsEastWest) {
  effect.setText(effGetVendorString, "Play");
  effect.setText(effGetEffectName, "Play");
  EXPECT_EQ(wrapper->getManufacturerName(), "EastWest");
  EXPECT_THAT(effect.requests(), ElementsAre(request(effGetVendorString), request(effGetEffectName)));
}

TEST_F(VSTWrapperNames, PlayByPlayIsEastWestWhereverThePluginsNameComesFrom) {
  effect.setText(effGetVendorString, "Play");
  effect.setText(effGetProductString, "Play");
  EXPECT_EQ(wrapper->getManufacturerName(), "EastWest");
  EXPECT_THAT(effect.requests(), ElementsAre(request(effGetVendorString), request(effGetEffectName),
                                             request(effGetProductString)));
  VST_ChildSpec child(1);
  child.childName = "Play";
  open(child);
  effect.answer(effGetProductString, 0);
  EXPECT_EQ(wrapper->getManufacturerName(), "EastWest");
}

TEST_F(VSTWrapperNames, AnotherPluginByPlayIsByPlay) {
  effect.setText(effGetVendorString, "Play");
  for (const char* name : {"play", "Play ", "Player", "", "Something"}) {
    effect.setText(effGetEffectName, name);
    EXPECT_EQ(wrapper->getManufacturerName(), "Play") << name;
  }
  effect.answer(effGetEffectName, 0);
  EXPECT_EQ(wrapper->getManufacturerName(), "Play");
}

TEST_F(VSTWrapperNames, OnlyPlayItselfLeadsToAQuestionForThePluginsName) {
  effect.setText(effGetEffectName, "Play");
  for (const char* vendor : {"play", "PLAY", "Play ", " Play", "Player", "Pla"}) {
    effect.setText(effGetVendorString, vendor);
    EXPECT_EQ(wrapper->getManufacturerName(), vendor);
  }
  EXPECT_EQ(effect.requests(), std::vector<Request>(6, request(effGetVendorString)));
}

TEST_F(VSTWrapperNames, QueriesWriteNothingIntoTheWrapper) {
  openChild();
  effect.setText(effGetEffectName, "Reverb");
  wrapper->getEffectName();
  EXPECT_EQ(wrapper->childSpec.childName, "Shimmer");
  EXPECT_EQ(wrapper->loader->info.effectName, "The Module");
}

}  // namespace
