// SPDX-License-Identifier: MIT
// Loading a bundle, call by call: what is asked of CoreFoundation, what is released, what each failure
// leaves.
#include <optional>
#include <string>
#include <type_traits>
#include <vector>

#include "gmock/gmock.h"
#include "gtest/gtest.h"
#include "loader/module_loader.h"
#include "tests/loader/loader_fixture.h"
#include "tests/shared/thrown.h"

namespace {

using doubles::Step;
using testing::ElementsAre;
using testing::ElementsAreArray;
using testing::IsEmpty;

using Calls = std::vector<std::string>;

class VSTPluginLoaderTest : public LoaderFixture {
 protected:
  VSTPluginLoaderTest() { core_foundation.addBundle("/b.vst", {}); }
};

TEST_F(VSTPluginLoaderTest, AsksForEachStepInOrderAndReleasesStringAndUrlAtOnce) {
  const VSTPluginLoader loader(VST_DLL_Info(std::string("/b.vst\0.more", 12), "test"));
  EXPECT_THAT(core_foundation.calls(),
              ElementsAre("CFStringCreateWithCString(\"/b.vst\", UTF-8) -> string",
                          "CFURLCreateWithFileSystemPath(\"/b.vst\", POSIX, file) -> URL",
                          "CFRelease(string \"/b.vst\")", "CFBundleCreate(\"/b.vst\") -> bundle",
                          "CFRelease(URL \"/b.vst\")", "CFBundleLoadExecutable(\"/b.vst\") -> true"));
  EXPECT_THAT(core_foundation.aliveObjects(), ElementsAre("bundle \"/b.vst\""));
  EXPECT_THAT(cachedPaths(), IsEmpty());
}

TEST_F(VSTPluginLoaderTest, HoldsTheBundleACopyOfTheIdentityAndACountOfOneInThisOrder) {
  VST_DLL_Info identity("/b.vst", "Reverb");
  identity.dllTag = 0x123456789ABCDEF0;
  const VSTPluginLoader loader(identity);
  identity = VST_DLL_Info("/gone.vst", "gone");
  EXPECT_NE(loader.bundle, nullptr);
  EXPECT_EQ(loader.info.path, "/b.vst");
  EXPECT_EQ(loader.info.effectName, "Reverb");
  EXPECT_EQ(loader.info.dllTag, 0x123456789ABCDEF0);
  EXPECT_EQ(loader.refCount, 1u);

  EXPECT_FALSE(std::is_polymorphic_v<VSTPluginLoader>);
  EXPECT_EQ(static_cast<const void*>(&loader.bundle), static_cast<const void*>(&loader));
  EXPECT_EQ(reinterpret_cast<const char*>(&loader.info) - reinterpret_cast<const char*>(&loader),
            static_cast<std::ptrdiff_t>(sizeof(void*)));
  EXPECT_LT(static_cast<const void*>(&loader.info), static_cast<const void*>(&loader.refCount));
}

TEST_F(VSTPluginLoaderTest, ItsDestructorUnloadsTheBundleAndThenReleasesIt) {
  {
    const VSTPluginLoader loader(VST_DLL_Info("/b.vst", "test"));
    core_foundation.forgetCalls();
  }
  EXPECT_THAT(core_foundation.calls(),
              ElementsAre("CFBundleUnloadExecutable(\"/b.vst\")", "CFRelease(bundle \"/b.vst\")"));
}

TEST_F(VSTPluginLoaderTest, ItsDestructorDoesNothingWithoutABundle) {
  {
    VSTPluginLoader loader(VST_DLL_Info("/b.vst", "test"));
    loader.bundle = nullptr;
    core_foundation.forgetCalls();
  }
  EXPECT_THAT(core_foundation.calls(), IsEmpty());
}

struct FailingStep {
  const char* name;
  Step step;
  Calls calls;
  Calls alive;
};

class VSTPluginLoaderFailure : public VSTPluginLoaderTest, public testing::WithParamInterface<FailingStep> {};

TEST_P(VSTPluginLoaderFailure, ThrowsMinusOneCachesNothingAndIsForgottenOnTheNextDemand) {
  core_foundation.failStep(GetParam().step);
  EXPECT_EQ(thrownInt([] { demand("/b.vst"); }), -1);
  EXPECT_THAT(cachedPaths(), IsEmpty());
  EXPECT_THAT(core_foundation.calls(), ElementsAreArray(GetParam().calls));
  EXPECT_THAT(core_foundation.aliveObjects(), ElementsAreArray(GetParam().alive));

  core_foundation.mendStep(GetParam().step);
  EXPECT_EQ(demand("/b.vst")->info.path, "/b.vst");
  EXPECT_THAT(cachedPaths(), ElementsAre("/b.vst"));
}

const std::string kString = "CFStringCreateWithCString(\"/b.vst\", UTF-8) -> ";
const std::string kUrl = "CFURLCreateWithFileSystemPath(\"/b.vst\", POSIX, file) -> ";
const std::string kStringReleased = "CFRelease(string \"/b.vst\")";
const std::string kBundle = "CFBundleCreate(\"/b.vst\") -> ";
const std::string kUrlReleased = "CFRelease(URL \"/b.vst\")";
const std::string kLoad = "CFBundleLoadExecutable(\"/b.vst\") -> ";

// The bundle whose executable does not load is kept: neither unloaded nor released.
INSTANTIATE_TEST_SUITE_P(
    Steps, VSTPluginLoaderFailure,
    testing::Values(
        FailingStep{"String", Step::kCreateString, {kString + "null"}, {}},
        FailingStep{"Url", Step::kCreateUrl, {kString + "string", kUrl + "null", kStringReleased}, {}},
        FailingStep{"Bundle",
                    Step::kCreateBundle,
                    {kString + "string", kUrl + "URL", kStringReleased, kBundle + "null", kUrlReleased},
                    {}},
        FailingStep{"Load",
                    Step::kLoadExecutable,
                    {kString + "string", kUrl + "URL", kStringReleased, kBundle + "bundle", kUrlReleased,
                     kLoad + "false"},
                    {"bundle \"/b.vst\""}}),
    [](const auto& tested) { return tested.param.name; });

struct Exports {
  const char* name;
  std::vector<std::string> names;
  std::optional<std::string> systemName;
  std::string asked;  // The names that are asked for; the last one is found unless `found` is "".
  std::string found;
};

class VSTPluginLoaderMainEntry : public LoaderFixture, public testing::WithParamInterface<Exports> {};

TEST_P(VSTPluginLoaderMainEntry, IsTheFirstOfTheNamesInOrder) {
  static int addresses[3];
  doubles::SymbolTable symbols;
  for (const std::string& name : GetParam().names)
    symbols.emplace(name, static_cast<void*>(&addresses[name == "main" ? 0 : name == "main_macho" ? 1 : 2]));
  core_foundation.addBundle("/b.vst", symbols);
  core_foundation.setSystemEntryPointName(GetParam().systemName);
  VSTPluginLoader loader(VST_DLL_Info("/b.vst", "test"));
  core_foundation.forgetCalls();

  const auto found = symbols.find(GetParam().found);
  EXPECT_EQ(loader.getMainEntry(), found == symbols.end() ? nullptr : found->second.get());
  std::string asked;
  for (const std::string& call : core_foundation.calls())
    asked += call.substr(sizeof "CFBundleGetFunctionPointerForName(\"/b.vst\", " - 1) + "; ";
  EXPECT_EQ(asked, GetParam().asked);
}

INSTANTIATE_TEST_SUITE_P(
    Exports, VSTPluginLoaderMainEntry,
    testing::Values(Exports{"VSTPluginMainWins",
                            {"main", "main_macho", "VSTPluginMain"},
                            "main",
                            "\"VSTPluginMain\") -> function; ",
                            "VSTPluginMain"},
                    Exports{"MainMachoBeforeTheSystems",
                            {"main", "main_macho"},
                            "main",
                            "\"VSTPluginMain\") -> null; \"main_macho\") -> function; ",
                            "main_macho"},
                    Exports{"TheSystemsLast",
                            {"main"},
                            "main",
                            "\"VSTPluginMain\") -> null; \"main_macho\") -> null; \"main\") -> function; ",
                            "main"},
                    Exports{"NoNameOfTheSystem",
                            {"main"},
                            std::nullopt,
                            "\"VSTPluginMain\") -> null; \"main_macho\") -> null; ",
                            ""},
                    Exports{"None",
                            {"vstpluginmain"},
                            "main",
                            "\"VSTPluginMain\") -> null; \"main_macho\") -> null; \"main\") -> null; ",
                            ""}),
    [](const auto& tested) { return tested.param.name; });

}  // namespace
