// SPDX-License-Identifier: MIT
// The cache of loaded modules: what is shared, what is loaded anew, and who holds which reference.
#include <cstddef>
#include <string>
#include <vector>

#include "gmock/gmock.h"
#include "gtest/gtest.h"
#include "tests/loader/loader_fixture.h"
#include "tests/shared/thrown.h"

namespace {

using testing::ElementsAre;
using testing::IsEmpty;
using testing::SizeIs;

class ModuleCache : public LoaderFixture {
 protected:
  ModuleCache() {
    for (const char* path : {"/a.vst", "/b.vst", "/c.vst"}) core_foundation.addBundle(path, {});
  }
  static bool find(const std::string& path, const char* name, LoaderHandle& out) {
    return VSTPluginLoader::findLoadedDLL(VST_DLL_Info(path, name), out);
  }
  std::vector<std::string> loads() const { return core_foundation.callsOf("CFBundleLoadExecutable"); }
};

TEST_F(ModuleCache, TheSameIdentityTwiceGivesOneLoaderLoadedOnceWhateverTheTag) {
  const LoaderHandle first = demand("/b.vst");
  core_foundation.forgetCalls();
  VST_DLL_Info tagged("/b.vst", "test");
  tagged.dllTag = 99;
  EXPECT_EQ(VSTPluginLoader::demandLoadedPlugin(tagged).get(), first.get());
  EXPECT_EQ(first->info.dllTag, 0);
  EXPECT_THAT(core_foundation.calls(), IsEmpty());
  EXPECT_THAT(cachedPaths(), ElementsAre("/b.vst"));
}

TEST_F(ModuleCache, ConstructorCacheAndCallerHoldAReferenceAndTheConstructorsIsNeverGivenBack) {
  VSTPluginLoader* loader = nullptr;
  {
    const LoaderHandle held = demand("/b.vst");
    loader = held.get();
    EXPECT_EQ(loader->refCount, 3u);
  }
  EXPECT_EQ(loader->refCount, 2u);
  core_foundation.forgetCalls();
  emptyTheCache();
  EXPECT_EQ(loader->refCount, 1u);
  EXPECT_THAT(core_foundation.calls(), IsEmpty());
  EXPECT_THAT(core_foundation.aliveObjects(), ElementsAre("bundle \"/b.vst\""));
}

TEST_F(ModuleCache, AnEarlierPathGivesTheNextLoaderOfTheSameNameEvenIfItDoesNotExist) {
  const LoaderHandle b = demand("/b.vst");
  EXPECT_EQ(demand("/a.vst").get(), b.get());
  EXPECT_EQ(demand("/absent.vst").get(), b.get());
  EXPECT_THAT(cachedPaths(), ElementsAre("/b.vst"));
}

TEST_F(ModuleCache, ALaterPathIsLoadedOnItsOwn) {
  const LoaderHandle b = demand("/b.vst");
  EXPECT_EQ(demand("/c.vst")->info.path, "/c.vst");
  EXPECT_THAT(cachedPaths(), ElementsAre("/b.vst", "/c.vst"));
}

TEST_F(ModuleCache, OnlyTheNextLoaderIsComparedByName) {
  demand("/c.vst", "Delay");
  demand("/b.vst", "Reverb");
  EXPECT_EQ(demand("/a.vst", "Delay")->info.path, "/a.vst");
  EXPECT_THAT(cachedPaths(), ElementsAre("/a.vst", "/b.vst", "/c.vst"));
}

TEST_F(ModuleCache, TheSamePathUnderAnotherNameIsLoadedAgainButNotCached) {
  const LoaderHandle first = demand("/b.vst", "test");
  for (const char* name : {"other", "Test", "tes", "test ", ""}) {
    const LoaderHandle second = demand("/b.vst", name);
    EXPECT_NE(second.get(), first.get()) << name;
    EXPECT_EQ(second->info.effectName, name);
    EXPECT_EQ(second->refCount, 2u) << "of the constructor and the caller";
  }
  EXPECT_EQ(first->refCount, 3u);
  EXPECT_THAT(loads(), SizeIs(6));
  EXPECT_EQ(demand("/b.vst", "test").get(), first.get());
  EXPECT_THAT(cachedPaths(), ElementsAre("/b.vst"));
}

TEST_F(ModuleCache, AFailureLeavesEarlierLoadersInTheCache) {
  const LoaderHandle b = demand("/b.vst");
  EXPECT_EQ(thrownInt([] { demand("/nowhere.vst"); }), -1);
  EXPECT_THAT(cachedPaths(), ElementsAre("/b.vst"));
  EXPECT_EQ(b->refCount, 3u);
}

TEST_F(ModuleCache, FindAssignsAHitLeavesTheHandleOnAMissAndLoadsNothing) {
  LoaderHandle out;
  EXPECT_FALSE(find("/b.vst", "test", out));
  EXPECT_EQ(out.get(), nullptr);
  EXPECT_THAT(core_foundation.calls(), IsEmpty());

  const LoaderHandle b = demand("/b.vst");
  out = demand("/c.vst");
  VSTPluginLoader* const c = out.get();
  EXPECT_FALSE(find("/b.vst", "other", out));
  EXPECT_FALSE(find("/d.vst", "test", out));
  EXPECT_EQ(out.get(), c);
  EXPECT_TRUE(find("/b.vst", "test", out));
  EXPECT_EQ(out.get(), b.get());
  EXPECT_EQ(b->refCount, 4u);
  EXPECT_EQ(c->refCount, 2u);
}

TEST_F(ModuleCache, CompareVSTLoaderRefsOrdersPathsAsUnsignedBytesUpToTheFirstZeroByte) {
  const std::vector<std::string> paths = {"/", "/B.vst", "/b", "/b.vst", "/b.vst.vst", "/z", "/\xC3\xA9"};
  // For each path one loader of just that path, and one with a zero byte and more behind it. The names, in
  // the opposite order, take no part.
  std::vector<LoaderHandle> loaders[2];
  const auto identity = [&](std::size_t i, int variant) {
    const std::string rest = variant == 0 ? std::string() : std::string("\0more", 5);
    return VST_DLL_Info(paths[i] + rest, std::string(1, static_cast<char>('z' - i)).c_str());
  };
  for (std::size_t i = 0; i < paths.size(); ++i) {
    core_foundation.addBundle(paths[i], {});
    for (const int variant : {0, 1})
      loaders[variant].emplace_back().reset(new VSTPluginLoader(identity(i, variant)),
                                            NiduCOM::AddRef::kAdopt);
  }
  const compareVSTLoaderRefs isLess;
  for (std::size_t a = 0; a < paths.size(); ++a) {
    for (std::size_t b = 0; b < paths.size(); ++b) {
      SCOPED_TRACE(paths[a] + " and " + paths[b]);
      for (const int variant : {0, 1}) {
        EXPECT_EQ(isLess(loaders[variant][a], loaders[1 - variant][b]), a < b);
        EXPECT_EQ(isLess(loaders[variant][a], identity(b, 1 - variant)), a < b);
      }
    }
  }
}

}  // namespace
