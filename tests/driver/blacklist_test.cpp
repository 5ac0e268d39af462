// SPDX-License-Identifier: MIT
// The bundles that are refused by name, and the comparison behind it.
#include <string>
#include <vector>

#include "driver/blacklist.h"
#include "gtest/gtest.h"

namespace {

struct PathCase {
  const char* name;
  const char* path;
};

void PrintTo(const PathCase& tested, std::ostream* stream) { *stream << tested.path; }

class IsBlackListedRefuses : public testing::TestWithParam<PathCase> {};

TEST_P(IsBlackListedRefuses, ThePath) {
  bool matched = false;
  EXPECT_TRUE(IsBlackListed(GetParam().path, 0, matched));
  EXPECT_TRUE(matched);
}

INSTANTIATE_TEST_SUITE_P(Paths, IsBlackListedRefuses,
                         testing::ValuesIn(std::vector<PathCase>{
                             {"Row1", "/x/GroveSampler.vst"},
                             {"Row1InOtherCase", "/x/gROVEsAMPLER.VST"},
                             {"Row2", "/x/Grove.vst"},
                             {"Row2InOtherCase", "/Library/Audio/Plug-Ins/VST/grove.vst"},
                             {"Row3", "/x/Ashkeys VST.vst"},
                             {"Row3InOtherCase", "/x/ASHKEYS vst.VST"},
                             {"Row4", "/x/Wexlo3.VST"},
                             {"Row4InOtherCase", "/x/wEXLO3.vst"},
                             {"Row5", "/x/NIDU Parlo Instrument.vst"},
                             {"Row5InOtherCase", "/x/nidu parlo instrument.VST"},
                             {"Rows6And8", "/x/Wexlo2 VST 5.1.vst"},
                             {"Rows6And8InOtherCase", "/x/wexlo2 vst 5.1.VST"},
                             {"Row7", "/x/Wexlo2 VST 7.1.vst"},
                             {"Row7InOtherCase", "/x/WEXLO2 VST 7.1.VST"},
                             {"Row9WithItsPoint", "/x/WeXlo2 VST. Quad.vst"},
                             {"Row9InOtherCase", "/x/wexlo2 vst. quad.vst"},
                             {"Row10", "/x/Wexlo2 VST.vst"},
                             {"Row10InOtherCase", "/x/wexlo2 vst.VST"},
                             {"InTheRoot", "/Grove.vst"},
                             {"InARelativeFolder", "x/Grove.vst"},
                             {"BehindTwoSlashes", "/x//Grove.vst"},
                         }),
                         [](const auto& tested) { return tested.param.name; });

class IsBlackListedPasses : public testing::TestWithParam<PathCase> {};

TEST_P(IsBlackListedPasses, ThePath) {
  bool matched = true;
  EXPECT_FALSE(IsBlackListed(GetParam().path, 0, matched));
  EXPECT_FALSE(matched);
}

INSTANTIATE_TEST_SUITE_P(Paths, IsBlackListedPasses,
                         testing::ValuesIn(std::vector<PathCase>{
                             // On purpose: without a slash, and with one at the end, there is no file name.
                             {"WithoutASlash", "Grove.vst"},
                             {"WithATrailingSlash", "/x/Grove.vst/"},
                             {"WithTwoTrailingSlashes", "/x/Grove.vst//"},
                             {"Inside", "/x/Grove.vst/Contents"},
                             {"WithASuffix", "/x/GroveSampler.vst.bak"},
                             {"WithAPrefix", "/x/My Grove.vst"},
                             {"Shorter", "/x/Grove"},
                             {"WithABlankBefore", "/x/ Grove.vst"},
                             {"WithABlankBehind", "/x/Grove.vst "},
                             {"Row9WithoutItsPoint", "/x/Wexlo2 VST Quad.vst"},
                             {"Empty", ""},
                             {"OneSlash", "/"},
                             {"OneLetter", "G"},
                             {"TwoSlashes", "//"},
                             {"OneLetterInTheRoot", "/G"},
                             {"AnotherBundle", "/x/Chorus.vst"},
                             {"AnAccentedLetter", "/x/Gr\xC3\xB6ve.vst"},
                             {"AByteAbove127", "/x/Grove.vs\xF4"},
                         }),
                         [](const auto& tested) { return tested.param.name; });

TEST(IsBlackListed, DoesNotLookAtTheInteger) {
  bool matched = false;
  EXPECT_TRUE(IsBlackListed("/x/Grove.vst", -1, matched));
  EXPECT_FALSE(IsBlackListed("/x/Chorus.vst", 1, matched));
}

TEST(BundleFileName, IsWhatFollowsTheLastSlash) {
  EXPECT_EQ(bundleFileName("/x/y.vst"), "y.vst");
  EXPECT_EQ(bundleFileName("/y"), "y");
  EXPECT_EQ(bundleFileName("x/y"), "y");
  EXPECT_EQ(bundleFileName("y.vst"), "");
  EXPECT_EQ(bundleFileName("/x/"), "");
  EXPECT_EQ(bundleFileName("/"), "");
  EXPECT_EQ(bundleFileName(""), "");
}

struct ComparisonCase {
  const char* name;
  const char* a;
  const char* b;
  int difference;
};

void PrintTo(const ComparisonCase& tested, std::ostream* stream) { *stream << tested.name; }

class MyStricmp : public testing::TestWithParam<ComparisonCase> {};

TEST_P(MyStricmp, AnswersTheFirstDifference) {
  EXPECT_EQ(my_stricmp(GetParam().a, GetParam().b), GetParam().difference);
}

INSTANTIATE_TEST_SUITE_P(Texts, MyStricmp,
                         testing::ValuesIn(std::vector<ComparisonCase>{
                             {"Equal", "grove", "grove", 0},
                             {"EqualInOtherCase", "gRoVe 5.1", "GrOvE 5.1", 0},
                             {"BothEmpty", "", "", 0},
                             {"Before", "a", "C", -2},
                             {"After", "C", "a", 2},
                             {"AtTheThirdCharacter", "abx", "ABC", 21},
                             {"Shorter", "abc", "abcd", -68},
                             {"Longer", "abcd", "abc", 68},
                             {"NothingAndALetter", "", "z", -90},
                             // Letters count as their capitals, so what lies between the two alphabets
                             // comes after them.
                             {"AnUnderscoreAndALetter", "_", "a", 30},
                             {"BracketAndBrace", "[", "{", -32},
                             {"AtAndBackquote", "@", "`", -32},
                             // Characters are signed, and so is the 8-bit difference.
                             {"EqualAbove127", "\xE9", "\xE9", 0},
                             {"NoCasesAbove127", "\xE9", "\xC9", 32},
                             {"TheLowestAndNothing", "\x80", "", -128},
                             {"NothingAndTheLowestWrapsAround", "", "\x80", -128},
                             {"TheHighestAndTheLowestWrapsAround", "\x7F", "\x80", -1},
                             {"TheLowestAndTheHighestWrapsAround", "\x80", "\x7F", 1},
                             {"MinusOneAndOne", "\xFF", "\x01", -2},
                             {"ALetterAndOneAbove127", "A", "\xC1", -128},
                         }),
                         [](const auto& tested) { return tested.param.name; });

}  // namespace
