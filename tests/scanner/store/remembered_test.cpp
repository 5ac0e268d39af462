// SPDX-License-Identifier: MIT
#include <gmock/gmock.h>

#include "scanner/store/remembered.h"

using namespace scanner;

namespace {

Circumstances circumstances() {
  Circumstances one;
  one.file = {2049, 77, 4096, 1700000000123456789};
  one.worker = "worker of today";
  one.options = "limit=120";
  one.sandboxWanted = "auto";
  one.libraries = "libraries of today";
  one.format = 1;
  one.toolVersion = "1.2.3";
  return one;
}

Remembered remembered(Verdict verdict) {
  Remembered one;
  one.circumstances = circumstances();
  one.verdict = verdict;
  return one;
}

struct Case {
  const char* name;
  Verdict verdict;
  /// Makes then and now differ.
  void (*change)(Remembered& then, Circumstances& now);
  Void why;
};
class WhyVoid : public ::testing::TestWithParam<Case> {};

TEST_P(WhyVoid, NamesWhatHasChanged) {
  Remembered then = remembered(GetParam().verdict);
  Circumstances now = circumstances();
  GetParam().change(then, now);
  EXPECT_EQ(whyVoid(then, now), GetParam().why);
}

using V = Verdict;
INSTANTIATE_TEST_SUITE_P(Table, WhyVoid,
                         ::testing::Values(Case{"NothingHasChanged", V::kPassed,
                                                [](Remembered&, Circumstances&) {}, Void::kNot},
                                           Case{"AFailureIsAnAnswerToo", V::kCrashed,
                                                [](Remembered&, Circumstances&) {}, Void::kNot},
                                           Case{"AnotherInode", V::kPassed,
                                                [](Remembered&, Circumstances& now) { now.file.inode = 78; },
                                                Void::kFile},
                                           Case{"AnotherSize", V::kPassed,
                                                [](Remembered&, Circumstances& now) {
                                                  ++now.file.sizeInBytes;
                                                },
                                                Void::kFile},
                                           Case{"ChangedANanosecondLater", V::kPassed,
                                                [](Remembered&, Circumstances& now) {
                                                  ++now.file.changedAtInNanoseconds;
                                                },
                                                Void::kFile},
                                           Case{"AnotherDeviceNumberIsTheSameFile", V::kPassed,
                                                [](Remembered&, Circumstances& now) { now.file.device = 45; },
                                                Void::kNot},
                                           Case{"ARebuiltWorker", V::kPassed,
                                                [](Remembered&, Circumstances& now) {
                                                  now.worker = "another";
                                                },
                                                Void::kWorker},
                                           Case{"OtherLimits", V::kPassed,
                                                [](Remembered&, Circumstances& now) {
                                                  now.options = "limit=60";
                                                },
                                                Void::kOptions},
                                           Case{"AnotherVersionOfTheTool", V::kPassed,
                                                [](Remembered&, Circumstances& now) {
                                                  now.toolVersion = "1.2.4";
                                                },
                                                Void::kToolVersion},
                                           Case{"AnotherFormat", V::kPassed,
                                                [](Remembered&, Circumstances& now) { now.format = 2; },
                                                Void::kFormat},
                                           Case{"TheEventIsNoLongerKept", V::kPassed,
                                                [](Remembered& then, Circumstances&) {
                                                  then.hasEvent = false;
                                                },
                                                Void::kFormat},
                                           Case{"ConfinedAndNowAuto", V::kPassed,
                                                [](Remembered& then, Circumstances&) {
                                                  then.wasSandboxed = true;
                                                  then.circumstances.sandboxWanted = "required";
                                                },
                                                Void::kNot},
                                           Case{"AutoWithoutASandboxAndNowAuto", V::kPassed,
                                                [](Remembered&, Circumstances&) {}, Void::kNot},
                                           Case{"OffAndNowAuto", V::kPassed,
                                                [](Remembered& then, Circumstances&) {
                                                  then.circumstances.sandboxWanted = "off";
                                                },
                                                Void::kSandbox},
                                           Case{"ConfinedAndNowOff", V::kPassed,
                                                [](Remembered& then, Circumstances& now) {
                                                  then.wasSandboxed = true;
                                                  now.sandboxWanted = "off";
                                                },
                                                Void::kSandbox},
                                           Case{
                                               "NotConfinedAndNowOff", V::kPassed,
                                               [](Remembered&, Circumstances& now) {
                                                 now.sandboxWanted = "off";
                                               },
                                               Void::kNot},
                                           Case{"NotConfinedAndNowRequired", V::kPassed,
                                                [](Remembered&, Circumstances& now) {
                                                  now.sandboxWanted = "required";
                                                },
                                                Void::kSandbox},
                                           Case{"NotLoadableAndALibraryWasInstalled", V::kNotLoadable,
                                                [](Remembered&, Circumstances& now) {
                                                  now.libraries = "one more";
                                                },
                                                Void::kLibraries},
                                           Case{"LoadedAndALibraryWasInstalled", V::kCrashed,
                                                [](Remembered&, Circumstances& now) {
                                                  now.libraries = "one more";
                                                },
                                                Void::kNot},
                                           Case{
                                               "AShellWithItsChildren", V::kShell,
                                               [](Remembered& then, Circumstances&) {
                                                 then.children = {{1, "One"}};
                                               },
                                               Void::kNot},
                                           Case{"AShellWithoutAnyChild", V::kShell,
                                                [](Remembered& then, Circumstances&) {
                                                  then.children = std::vector<Child>();
                                                },
                                                Void::kNot},
                                           Case{"AShellThatCouldNotBeDescribed", V::kShell,
                                                [](Remembered&, Circumstances&) {}, Void::kNoChildren},
                                           Case{"NotRun", V::kNotRun, [](Remembered&, Circumstances&) {},
                                                Void::kSaysNothing},
                                           Case{"Skipped", V::kSkipped, [](Remembered&, Circumstances&) {},
                                                Void::kSaysNothing},
                                           Case{"WrongArchitecture", V::kWrongArchitecture,
                                                [](Remembered&, Circumstances&) {}, Void::kSaysNothing}),
                         [](const auto& parameter) { return std::string(parameter.param.name); });

}  // namespace
