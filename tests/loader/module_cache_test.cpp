// SPDX-License-Identifier: MIT
// The cache of loaded modules: what is shared, what is loaded anew, and who holds which reference.
#include <string>
#include <vector>

#include "gmock/gmock.h"
#include "gtest/gtest.h"
#include "tests/loader/loader_fixture.h"

namespace {

using testing::ElementsAre;
using testing::IsEmpty;
using testing::SizeIs;

class ModuleCache : public LoaderFixture {
 protected:
  void SetUp() override {
    LoaderFixture::SetUp();
    for (const char* path : {"/a.vst", "/b.vst", "/c.vst", "/d.vst"}) core_foundation.addBundle(path, {});
  }
  static LoaderHandle demand(const std::string& path, const char* name = "test") {
    return VSTPluginLoader::demandLoadedPlugin(VST_DLL_Info(path, name));
  }
  static bool find(const std::string& path, const char* name, LoaderHandle& out) {
    return VSTPluginLoader::findLoadedDLL(VST_DLL_Info(path, name), out);
  }
  std::vector<std::string> loads() const { return core_foundation.callsOf("CFBundleLoadExecutable"); }
};

using VSTPluginLoaderDemand = ModuleCache;
using VSTPluginLoaderFind = ModuleCache;
using CompareVSTLoaderRefs = ModuleCache;

TEST_F(VSTPluginLoaderDemand, TheSameIdentityTwiceGivesOneLoaderLoadedOnce) {
  const LoaderHandle first = demand("/b.vst");
  const LoaderHandle second = demand("/b.vst");
  EXPECT_EQ(first.get(), second.get());
  EXPECT_THAT(core_foundation.callsOf("CFBundleCreate"), SizeIs(1));
  EXPECT_THAT(loads(), SizeIs(1));
  EXPECT_THAT(cachedPaths(), ElementsAre("/b.vst"));
}

TEST_F(VSTPluginLoaderDemand, OneReferenceIsOfTheConstructionOneOfTheCacheOneOfTheCaller) {
  VSTPluginLoader* loader = nullptr;
  {
    const LoaderHandle held = demand("/b.vst");
    loader = held.get();
    EXPECT_EQ(loader->refCount, 3u);
    const LoaderHandle again = demand("/b.vst");
    EXPECT_EQ(loader->refCount, 4u);
  }
  EXPECT_EQ(loader->refCount, 2u);
  emptyTheCache();
  EXPECT_EQ(loader->refCount, 1u);
}

TEST_F(VSTPluginLoaderDemand, TheReferenceOfTheConstructionIsNeverGivenBackAndTheBundleNeverUnloaded) {
  demand("/b.vst");
  core_foundation.forgetCalls();
  emptyTheCache();
  EXPECT_THAT(core_foundation.calls(), IsEmpty());
  EXPECT_THAT(core_foundation.aliveObjects(), ElementsAre("bundle \"/b.vst\""));
}

TEST_F(VSTPluginLoaderDemand, AHitAsksNothingOfTheSystem) {
  demand("/b.vst");
  core_foundation.forgetCalls();
  demand("/b.vst");
  EXPECT_THAT(core_foundation.calls(), IsEmpty());
}

TEST_F(VSTPluginLoaderDemand, TheTagIsNotLookedAt) {
  const LoaderHandle first = demand("/b.vst");
  VST_DLL_Info tagged("/b.vst", "test");
  tagged.dllTag = 99;
  EXPECT_EQ(VSTPluginLoader::demandLoadedPlugin(tagged).get(), first.get());
  EXPECT_EQ(first->info.dllTag, 0);
}

TEST_F(VSTPluginLoaderDemand, AnEarlierPathLandsOnTheNextLoaderOfTheSameName) {
  const LoaderHandle b = demand("/b.vst");
  const LoaderHandle a = demand("/a.vst");
  EXPECT_EQ(a.get(), b.get());
  EXPECT_THAT(cachedPaths(), ElementsAre("/b.vst"));
  EXPECT_THAT(loads(), ElementsAre("CFBundleLoadExecutable(\"/b.vst\") -> true"));
}

TEST_F(VSTPluginLoaderDemand, AnEarlierPathThatDoesNotExistLandsThereToo) {
  const LoaderHandle b = demand("/b.vst");
  EXPECT_EQ(demand("/absent.vst").get(), b.get());
}

TEST_F(VSTPluginLoaderDemand, ALaterPathIsLoadedOnItsOwn) {
  const LoaderHandle b = demand("/b.vst");
  const LoaderHandle c = demand("/c.vst");
  EXPECT_NE(c.get(), b.get());
  EXPECT_EQ(c->info.path, "/c.vst");
  EXPECT_THAT(cachedPaths(), ElementsAre("/b.vst", "/c.vst"));
}

TEST_F(VSTPluginLoaderDemand, AnEarlierPathOfAnotherNameIsLoadedAndCachedBeforeIt) {
  const LoaderHandle b = demand("/b.vst", "Reverb");
  const LoaderHandle a = demand("/a.vst", "Delay");
  EXPECT_EQ(a->info.path, "/a.vst");
  EXPECT_EQ(a->refCount, 3u);
  EXPECT_THAT(cachedPaths(), ElementsAre("/a.vst", "/b.vst"));
}

TEST_F(VSTPluginLoaderDemand, OneDifferentNameInBetweenHidesAFurtherOneOfTheSame) {
  const LoaderHandle c = demand("/c.vst", "Delay");
  const LoaderHandle b = demand("/b.vst", "Reverb");
  const LoaderHandle a = demand("/a.vst", "Delay");
  EXPECT_NE(a.get(), c.get());
  EXPECT_EQ(a->info.path, "/a.vst");
  EXPECT_THAT(cachedPaths(), ElementsAre("/a.vst", "/b.vst", "/c.vst"));
}

TEST_F(VSTPluginLoaderDemand, TheSamePathUnderAnotherNameIsLoadedAgainButNotCached) {
  const LoaderHandle first = demand("/b.vst", "test");
  VSTPluginLoader* second = nullptr;
  {
    const LoaderHandle held = demand("/b.vst", "other");
    second = held.get();
    EXPECT_NE(second, first.get());
    EXPECT_EQ(second->info.effectName, "other");
    EXPECT_EQ(second->refCount, 2u);
    EXPECT_EQ(first->refCount, 3u);
  }
  EXPECT_EQ(second->refCount, 1u);
  EXPECT_THAT(cachedPaths(), ElementsAre("/b.vst"));
  EXPECT_EQ(demand("/b.vst", "test").get(), first.get());
  EXPECT_NE(demand("/b.vst", "other").get(), second);
  EXPECT_THAT(loads(), SizeIs(3));
}

TEST_F(VSTPluginLoaderDemand, NamesAreComparedExactly) {
  const LoaderHandle first = demand("/b.vst", "test");
  for (const char* name : {"Test", "tes", "test ", ""}) {
    EXPECT_NE(demand("/b.vst", name).get(), first.get()) << name;
  }
}

TEST_F(VSTPluginLoaderDemand, AFailureLeavesEarlierLoadersInTheCache) {
  const LoaderHandle b = demand("/b.vst");
  EXPECT_EQ(intThrownBy([] { demand("/nowhere.vst"); }), -1);
  EXPECT_THAT(cachedPaths(), ElementsAre("/b.vst"));
  EXPECT_EQ(b->refCount, 3u);
}

TEST_F(VSTPluginLoaderFind, AHitAssignsTheCachedLoader) {
  const LoaderHandle b = demand("/b.vst");
  LoaderHandle out = demand("/c.vst");
  VSTPluginLoader* const c = out.get();
  EXPECT_TRUE(find("/b.vst", "test", out));
  EXPECT_EQ(out.get(), b.get());
  EXPECT_EQ(b->refCount, 4u);
  EXPECT_EQ(c->refCount, 2u);
}

TEST_F(VSTPluginLoaderFind, AMissLeavesTheHandleAsItIs) {
  LoaderHandle out;
  EXPECT_FALSE(find("/b.vst", "test", out));
  EXPECT_EQ(out.get(), nullptr);
  out = demand("/b.vst");
  VSTPluginLoader* const b = out.get();
  EXPECT_FALSE(find("/b.vst", "other", out));
  EXPECT_FALSE(find("/c.vst", "test", out));
  EXPECT_EQ(out.get(), b);
  EXPECT_EQ(b->refCount, 3u);
}

TEST_F(VSTPluginLoaderFind, LoadsNothing) {
  LoaderHandle out;
  find("/b.vst", "test", out);
  EXPECT_THAT(core_foundation.calls(), IsEmpty());
  EXPECT_THAT(cachedPaths(), IsEmpty());
}

TEST_F(CompareVSTLoaderRefs, OrdersByPathsAsUnsignedBytesUpToTheFirstZero) {
  const std::vector<std::string> paths = {"/", "/B.vst", "/b", "/b.vst", "/b.vst.vst", "/z", "/\xC3\xA9"};
  std::vector<LoaderHandle> loaders;
  for (const std::string& path : paths) {
    core_foundation.addBundle(path, {});
    loaders.emplace_back().reset(new VSTPluginLoader(test(path)), NiduCOM::AddRef::kAdopt);
  }
  const compareVSTLoaderRefs isLess;
  for (std::size_t a = 0; a < paths.size(); ++a) {
    for (std::size_t b = 0; b < paths.size(); ++b) {
      SCOPED_TRACE(paths[a] + " and " + paths[b]);
      EXPECT_EQ(isLess(loaders[a], loaders[b]), a < b);
      EXPECT_EQ(isLess(loaders[a], test(paths[b])), a < b);
      EXPECT_EQ(isLess(loaders[a], test(paths[b] + std::string("\0more", 5))), a < b);
    }
  }
}

TEST_F(CompareVSTLoaderRefs, TheNameTakesNoPart) {
  LoaderHandle loader;
  loader.reset(new VSTPluginLoader(test("/b.vst")), NiduCOM::AddRef::kAdopt);
  EXPECT_FALSE(compareVSTLoaderRefs()(loader, VST_DLL_Info("/b.vst", "zzz")));
  EXPECT_TRUE(compareVSTLoaderRefs()(loader, VST_DLL_Info("/c.vst", "aaa")));
}

}  // namespace
