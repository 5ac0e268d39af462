// SPDX-License-Identifier: MIT
// The bundles that are refused by name, and the comparison of names.
#include <string>
#include <vector>

#include "driver/blacklist.h"
#include "gtest/gtest.h"

namespace {

struct PathCase {
  const char* name;
  const char* path;
  bool isRefused;
};

class IsBlackListedTest : public testing::TestWithParam<PathCase> {};

TEST_P(IsBlackListedTest, SaysWhetherTheBundleIsRefusedWhateverTheInteger) {
  for (const int ignored : {0, 1, -1}) {
    bool matched = !GetParam().isRefused;
    EXPECT_EQ(IsBlackListed(GetParam().path, ignored, matched), GetParam().isRefused);
    EXPECT_EQ(matched, GetParam().isRefused);
  }
}

INSTANTIATE_TEST_SUITE_P(Paths, IsBlackListedTest,
                         testing::ValuesIn(std::vector<PathCase>{
                             {"Row1", "/x/gROVEsAMPLER.VST", true},
                             {"Row2", "/Library/Audio/Plug-Ins/VST/grove.vst", true},
                             {"Row2AsInTheList", "/x/Grove.vst", true},
                             {"Row3", "/x/ASHKEYS vst.VST", true},
                             {"Row4", "/x/wEXLO3.vst", true},
                             {"Row5", "/x/nidu parlo instrument.VST", true},
                             {"Rows6And8", "/x/wexlo2 vst 5.1.VST", true},
                             {"Row7", "/x/WEXLO2 VST 7.1.VST", true},
                             {"Row9WithItsFullStop", "/x/wexlo2 vst. quad.vst", true},
                             {"Row10", "/x/wexlo2 vst.VST", true},
                             {"InTheRoot", "/Grove.vst", true},
                             {"InARelativeFolder", "x/Grove.vst", true},
                             {"BehindTwoSlashes", "/x//Grove.vst", true},
                             // On purpose: these two paths have no file name.
                             {"WithoutASlash", "Grove.vst", false},
                             {"WithATrailingSlash", "/x/Grove.vst/", false},
                             {"InsideARefusedBundle", "/x/Grove.vst/Contents", false},
                             {"WithASuffix", "/x/GroveSampler.vst.bak", false},
                             {"WithAPrefix", "/x/My Grove.vst", false},
                             {"WithABlankBehind", "/x/Grove.vst ", false},
                             {"Shorter", "/x/Grove", false},
                             {"Row9WithoutItsFullStop", "/x/Wexlo2 VST Quad.vst", false},
                             {"Empty", "", false},
                             {"OneSlash", "/", false},
                             {"AnotherBundle", "/x/Chorus.vst", false},
                             {"AByteAbove127", "/x/Grove.vs\xF4", false},
                         }),
                         [](const auto& tested) { return tested.param.name; });

struct ComparisonCase {
  const char* name;
  const char* a;
  const char* b;
  int difference;
};

class MyStricmp : public testing::TestWithParam<ComparisonCase> {};

TEST_P(MyStricmp, ReturnsTheFirstDifference) {
  EXPECT_EQ(my_stricmp(GetParam().a, GetParam().b), GetParam().difference);
}

INSTANTIATE_TEST_SUITE_P(Texts, MyStricmp,
                         testing::ValuesIn(std::vector<ComparisonCase>{
                             {"EqualInOtherCase", "gRoVe 5.1", "GrOvE 5.1", 0},
                             {"BothEmpty", "", "", 0},
                             {"Before", "a", "C", -2},
                             {"AtTheThirdCharacter", "abx", "ABC", 21},
                             {"Shorter", "abc", "abcd", -68},
                             {"Longer", "abcd", "abc", 68},
                             // Letters are compared as capitals.
                             {"AnUnderscoreAndALetter", "_", "a", 30},
                             {"BracketAndBrace", "[", "{", -32},
                             {"AtAndBackquote", "@", "`", -32},
                             // Characters are signed, and so is the 8-bit difference.
                             {"EqualAbove127", "\xE9", "\xE9", 0},
                             {"NoCasesAbove127", "\xE9", "\xC9", 32},
                             {"NothingAndTheLowestWrapsAround", "", "\x80", -128},
                             {"TheHighestAndTheLowestWrapsAround", "\x7F", "\x80", -1},
                             {"MinusOneAndOne", "\xFF", "\x01", -2},
                             {"ALetterAndOneAbove127", "A", "\xC1", -128},
                         }),
                         [](const auto& tested) { return tested.param.name; });

}  // namespace
