// SPDX-License-Identifier: MIT
// The loader on real shared objects and the system's own bundle service.
#include <string>

#include "gmock/gmock.h"
#include "gtest/gtest.h"
#include "loader/module_loader.h"
#include "tests/shared/temporary_directory.h"
#include "tests/shared/thrown.h"

namespace {

using LoaderHandle = NiduCOM::i_ptr<VSTPluginLoader>;
using testing::HasSubstr;

void emptyTheCache() { VSTPluginLoader::fLoadedDLLs = decltype(VSTPluginLoader::fLoadedDLLs)(); }

struct Module {
  const char* name;
  const char* path;
  int entryAnswers;  // 0 when the module has no entry point.
};

class RealModule : public testing::TestWithParam<Module> {};

TEST_P(RealModule, IsLoadedOnceWithItsEntryAndStaysLoadedWhenEveryHandleIsGone) {
  emptyTheCache();
  void* entry = nullptr;
  {
    const LoaderHandle loader = VSTPluginLoader::demandLoadedPlugin({GetParam().path, "test"});
    entry = loader->getMainEntry();
    EXPECT_EQ(VSTPluginLoader::demandLoadedPlugin({GetParam().path, "test"}).get(), loader.get());
    EXPECT_EQ(VSTPluginLoader::fLoadedDLLs.size(), 1u);
  }
  emptyTheCache();
  EXPECT_EQ(entry == nullptr ? 0 : reinterpret_cast<int (*)()>(entry)(), GetParam().entryAnswers);
}

INSTANTIATE_TEST_SUITE_P(Files, RealModule,
                         testing::Values(Module{"All", ALL_ENTRIES, 1}, Module{"Newest", NEWEST_ENTRY, 1},
                                         Module{"MainMacho", MAIN_MACHO_ENTRY, 2},
                                         Module{"MainMachoAndMain", BOTH_OLDER_ENTRIES, 2},
                                         Module{"Main", MAIN_ENTRY, 3}, Module{"None", NO_ENTRY, 0}),
                         [](const auto& tested) { return tested.param.name; });

TEST(RealModules, APathThatDoesNotLoadThrowsMinusOneWithTheReasonOnStandardError) {
  struct Refusal {
    std::string path;
    std::string reason;
  };
  emptyTheCache();
  const TemporaryDirectory folder;
  for (const auto& [path, reason] :
       {Refusal{"/nowhere/at/all.vst", "/nowhere/at/all.vst"}, Refusal{"", "empty"},
        Refusal{"/\xFF.vst", "UTF-8"}, Refusal{folder.path().string(), "has no executable"},
        Refusal{"/proc/self/maps", "/proc/self/maps"}}) {
    testing::internal::CaptureStderr();
    EXPECT_EQ(thrownInt([p = path] { VSTPluginLoader::demandLoadedPlugin({p, "test"}); }), -1) << path;
    EXPECT_THAT(testing::internal::GetCapturedStderr(), HasSubstr(reason));
    EXPECT_EQ(VSTPluginLoader::fLoadedDLLs.size(), 0u);
  }
}

}  // namespace
