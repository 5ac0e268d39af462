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

namespace {

using doubles::Step;
using testing::ElementsAre;
using testing::ElementsAreArray;
using testing::IsEmpty;
using testing::SizeIs;

using Calls = std::vector<std::string>;

class VSTPluginLoaderLoad : public LoaderFixture {};
class VSTPluginLoaderEntry : public LoaderFixture {};
class VSTPluginLoaderEnd : public LoaderFixture {};

int anEntry() { return 1; }
int anotherEntry() { return 2; }
int aThirdEntry() { return 3; }

TEST_F(VSTPluginLoaderLoad, AsksForEachStepInOrderAndReleasesStringAndUrlAtOnce) {
  core_foundation.addBundle("/b.vst", {});
  const VSTPluginLoader loader(test("/b.vst"));
  EXPECT_THAT(core_foundation.calls(),
              ElementsAre("CFStringCreateWithCString(\"/b.vst\", UTF-8) -> string",
                          "CFURLCreateWithFileSystemPath(\"/b.vst\", POSIX, file) -> URL",
                          "CFRelease(string \"/b.vst\")", "CFBundleCreate(\"/b.vst\") -> bundle",
                          "CFRelease(URL \"/b.vst\")", "CFBundleLoadExecutable(\"/b.vst\") -> true"));
  EXPECT_THAT(core_foundation.aliveObjects(), ElementsAre("bundle \"/b.vst\""));
  EXPECT_NE(loader.bundle, nullptr);
}

TEST_F(VSTPluginLoaderLoad, CountsOneReferenceAndCachesNothing) {
  core_foundation.addBundle("/b.vst", {});
  const VSTPluginLoader loader(test("/b.vst"));
  EXPECT_EQ(loader.refCount, 1u);
  EXPECT_THAT(cachedPaths(), IsEmpty());
}

TEST_F(VSTPluginLoaderLoad, KeepsACopyOfTheIdentity) {
  core_foundation.addBundle("/b.vst", {});
  VST_DLL_Info identity("/b.vst", "Reverb");
  identity.dllTag = 0x123456789ABCDEF0;
  const VSTPluginLoader loader(identity);
  identity = VST_DLL_Info("/gone.vst", "gone");
  EXPECT_EQ(loader.info.path, "/b.vst");
  EXPECT_EQ(loader.info.effectName, "Reverb");
  EXPECT_EQ(loader.info.dllTag, 0x123456789ABCDEF0);
}

TEST_F(VSTPluginLoaderLoad, HandsThePathOverUpToItsFirstZeroByte) {
  core_foundation.addBundle("/\xC3\xA9.vst", {});
  const VSTPluginLoader loader(test(std::string("/\xC3\xA9.vst\0.more", 13)));
  EXPECT_EQ(core_foundation.calls().front(), "CFStringCreateWithCString(\"/\xC3\xA9.vst\", UTF-8) -> string");
}

TEST_F(VSTPluginLoaderLoad, IsNotPolymorphicAndKeepsItsFieldsInOrder) {
  core_foundation.addBundle("/b.vst", {});
  const VSTPluginLoader loader(test("/b.vst"));
  EXPECT_FALSE(std::is_polymorphic_v<VSTPluginLoader>);
  EXPECT_EQ(static_cast<const void*>(&loader.bundle), static_cast<const void*>(&loader));
  EXPECT_EQ(reinterpret_cast<const char*>(&loader.info) - reinterpret_cast<const char*>(&loader),
            static_cast<std::ptrdiff_t>(sizeof(void*)));
  EXPECT_LT(static_cast<const void*>(&loader.info), static_cast<const void*>(&loader.refCount));
}

struct FailingStep {
  const char* name;
  std::optional<Step> step;  // None: the bundle itself has no executable.
  Calls calls;
  Calls alive;
};

class VSTPluginLoaderFailure : public LoaderFixture, public testing::WithParamInterface<FailingStep> {
 protected:
  void SetUp() override {
    LoaderFixture::SetUp();
    if (GetParam().step) {
      core_foundation.addBundle("/b.vst", {{"VSTPluginMain", anEntry}});
      core_foundation.failStep(*GetParam().step);
    } else {
      core_foundation.addBundleWithoutExecutable("/b.vst");
    }
  }
};

TEST_P(VSTPluginLoaderFailure, ThrowsMinusOneAndCachesNothing) {
  EXPECT_EQ(intThrownBy([] { VSTPluginLoader::demandLoadedPlugin(test("/b.vst")); }), -1);
  EXPECT_THAT(cachedPaths(), IsEmpty());
  EXPECT_THAT(core_foundation.calls(), ElementsAreArray(GetParam().calls));
  EXPECT_THAT(core_foundation.aliveObjects(), ElementsAreArray(GetParam().alive));
}

TEST_P(VSTPluginLoaderFailure, ThrowsMinusOneFromTheConstructor) {
  EXPECT_EQ(intThrownBy([] { const VSTPluginLoader loader(test("/b.vst")); }), -1);
  EXPECT_THAT(core_foundation.calls(), ElementsAreArray(GetParam().calls));
  EXPECT_THAT(core_foundation.aliveObjects(), ElementsAreArray(GetParam().alive));
}

TEST_P(VSTPluginLoaderFailure, IsForgottenOnTheNextDemand) {
  EXPECT_EQ(intThrownBy([] { VSTPluginLoader::demandLoadedPlugin(test("/b.vst")); }), -1);
  if (GetParam().step) core_foundation.mendStep(*GetParam().step);
  core_foundation.addBundle("/b.vst", {});
  const auto loader = VSTPluginLoader::demandLoadedPlugin(test("/b.vst"));
  EXPECT_EQ(loader->info.path, "/b.vst");
  EXPECT_THAT(cachedPaths(), ElementsAre("/b.vst"));
}

const Calls kStringFails = {"CFStringCreateWithCString(\"/b.vst\", UTF-8) -> null"};
const Calls kUrlFails = {"CFStringCreateWithCString(\"/b.vst\", UTF-8) -> string",
                         "CFURLCreateWithFileSystemPath(\"/b.vst\", POSIX, file) -> null",
                         "CFRelease(string \"/b.vst\")"};
const Calls kBundleFails = {"CFStringCreateWithCString(\"/b.vst\", UTF-8) -> string",
                            "CFURLCreateWithFileSystemPath(\"/b.vst\", POSIX, file) -> URL",
                            "CFRelease(string \"/b.vst\")", "CFBundleCreate(\"/b.vst\") -> null",
                            "CFRelease(URL \"/b.vst\")"};
const Calls kLoadFails = {"CFStringCreateWithCString(\"/b.vst\", UTF-8) -> string",
                          "CFURLCreateWithFileSystemPath(\"/b.vst\", POSIX, file) -> URL",
                          "CFRelease(string \"/b.vst\")",
                          "CFBundleCreate(\"/b.vst\") -> bundle",
                          "CFRelease(URL \"/b.vst\")",
                          "CFBundleLoadExecutable(\"/b.vst\") -> false"};

// The bundle whose executable does not load is kept: neither unloaded nor released.
INSTANTIATE_TEST_SUITE_P(
    Steps, VSTPluginLoaderFailure,
    testing::Values(FailingStep{"String", Step::kCreateString, kStringFails, {}},
                    FailingStep{"Url", Step::kCreateUrl, kUrlFails, {}},
                    FailingStep{"Bundle", Step::kCreateBundle, kBundleFails, {}},
                    FailingStep{"Load", Step::kLoadExecutable, kLoadFails, {"bundle \"/b.vst\""}},
                    FailingStep{"NoExecutable", std::nullopt, kLoadFails, {"bundle \"/b.vst\""}}),
    [](const auto& tested) { return std::string(tested.param.name); });

TEST_F(VSTPluginLoaderLoad, APathWhereNothingIsThrowsMinusOneAndCachesNothing) {
  EXPECT_EQ(intThrownBy([] { VSTPluginLoader::demandLoadedPlugin(test("/nowhere.vst")); }), -1);
  EXPECT_THAT(cachedPaths(), IsEmpty());
  EXPECT_THAT(core_foundation.aliveObjects(), IsEmpty());
}

struct Exports {
  const char* name;
  std::vector<std::string> names;
  std::optional<std::string> systemName;
  std::vector<std::string> asked;
  int (*chosen)();
};

class VSTPluginLoaderMainEntry : public LoaderFixture, public testing::WithParamInterface<Exports> {};

TEST_P(VSTPluginLoaderMainEntry, IsTheFirstOfTheNamesInOrder) {
  doubles::SymbolTable symbols;
  for (const std::string& name : GetParam().names) {
    int (*const function)() = name == "VSTPluginMain" ? anEntry
                              : name == "main_macho"  ? anotherEntry
                                                      : aThirdEntry;
    symbols.emplace(name, function);
  }
  core_foundation.addBundle("/b.vst", symbols);
  core_foundation.setSystemEntryPointName(GetParam().systemName);
  VSTPluginLoader loader(test("/b.vst"));
  core_foundation.forgetCalls();

  EXPECT_EQ(loader.getMainEntry(), reinterpret_cast<void*>(GetParam().chosen));
  Calls expected;
  for (const std::string& name : GetParam().asked) {
    const bool found = &name == &GetParam().asked.back() && GetParam().chosen != nullptr;
    expected.push_back("CFBundleGetFunctionPointerForName(\"/b.vst\", \"" + name + "\") -> " +
                       (found ? "function" : "null"));
  }
  EXPECT_THAT(core_foundation.calls(), ElementsAreArray(expected));
}

const std::vector<std::string> kFirst = {"VSTPluginMain"};
const std::vector<std::string> kTwo = {"VSTPluginMain", "main_macho"};
const std::vector<std::string> kThree = {"VSTPluginMain", "main_macho", "main"};

INSTANTIATE_TEST_SUITE_P(
    Exports, VSTPluginLoaderMainEntry,
    testing::Values(
        Exports{"VSTPluginMainOnly", {"VSTPluginMain"}, "main", kFirst, anEntry},
        Exports{"VSTPluginMainWins", {"main", "main_macho", "VSTPluginMain"}, "main", kFirst, anEntry},
        Exports{"MainMachoOnly", {"main_macho"}, "main", kTwo, anotherEntry},
        Exports{"MainMachoBeforeTheSystems", {"main", "main_macho"}, "main", kTwo, anotherEntry},
        Exports{"TheSystemsLast", {"main"}, "main", kThree, aThirdEntry},
        Exports{"NoNameOfTheSystem", {"main"}, std::nullopt, kTwo, nullptr},
        Exports{"MainMachoWhereTheSystemHasNone", {"main_macho"}, std::nullopt, kTwo, anotherEntry},
        Exports{"None", {"vstpluginmain", "other"}, "main", kThree, nullptr}),
    [](const auto& tested) { return std::string(tested.param.name); });

TEST_F(VSTPluginLoaderEntry, IsAskedForAnewEachTime) {
  core_foundation.addBundle("/b.vst", {{"VSTPluginMain", anEntry}});
  VSTPluginLoader loader(test("/b.vst"));
  EXPECT_EQ(loader.getMainEntry(), loader.getMainEntry());
  EXPECT_THAT(core_foundation.callsOf("CFBundleGetFunctionPointerForName"), SizeIs(2));
}

TEST_F(VSTPluginLoaderEnd, UnloadsTheBundleAndThenReleasesIt) {
  core_foundation.addBundle("/b.vst", {});
  {
    const VSTPluginLoader loader(test("/b.vst"));
    core_foundation.forgetCalls();
  }
  EXPECT_THAT(core_foundation.calls(),
              ElementsAre("CFBundleUnloadExecutable(\"/b.vst\")", "CFRelease(bundle \"/b.vst\")"));
  EXPECT_THAT(core_foundation.aliveObjects(), IsEmpty());
}

TEST_F(VSTPluginLoaderEnd, DoesNothingWithoutABundle) {
  core_foundation.addBundle("/b.vst", {});
  {
    VSTPluginLoader loader(test("/b.vst"));
    loader.bundle = nullptr;
    core_foundation.forgetCalls();
  }
  EXPECT_THAT(core_foundation.calls(), IsEmpty());
}

}  // namespace
