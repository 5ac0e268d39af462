// SPDX-License-Identifier: MIT
// The loader on real shared objects and the system's own bundle service.
#include <cstdio>
#include <fstream>
#include <string>

#include <unistd.h>

#include "gmock/gmock.h"
#include "gtest/gtest.h"
#include "loader/module_loader.h"

namespace {

using LoaderHandle = NiduCOM::i_ptr<VSTPluginLoader>;
using testing::HasSubstr;
using testing::IsEmpty;

class RealModules : public testing::Test {
 protected:
  void SetUp() override { emptyTheCache(); }
  void TearDown() override { emptyTheCache(); }
  static void emptyTheCache() { VSTPluginLoader::fLoadedDLLs = decltype(VSTPluginLoader::fLoadedDLLs)(); }
};

struct Module {
  const char* name;
  const char* path;
  int entryAnswers;  // 0 where the module has no entry point.
};

class RealModulesEntry : public RealModules, public testing::WithParamInterface<Module> {};

TEST_P(RealModulesEntry, IsTheFunctionThatTheModuleExports) {
  const LoaderHandle loader = VSTPluginLoader::demandLoadedPlugin({GetParam().path, "test"});
  void* const entry = loader->getMainEntry();
  const int answer = entry == nullptr ? 0 : reinterpret_cast<int (*)()>(entry)();
  EXPECT_EQ(answer, GetParam().entryAnswers);
  EXPECT_EQ(VSTPluginLoader::demandLoadedPlugin({GetParam().path, "test"}).get(), loader.get());
  EXPECT_EQ(VSTPluginLoader::fLoadedDLLs.size(), 1u);
}

INSTANTIATE_TEST_SUITE_P(Files, RealModulesEntry,
                         testing::Values(Module{"All", ALL_ENTRIES, 1}, Module{"Newest", NEWEST_ENTRY, 1},
                                         Module{"MainMacho", MAIN_MACHO_ENTRY, 2},
                                         Module{"MainMachoAndMain", BOTH_OLDER_ENTRIES, 2},
                                         Module{"Main", MAIN_ENTRY, 3}, Module{"None", NO_ENTRY, 0}),
                         [](const auto& tested) { return std::string(tested.param.name); });

// Demands a module that does not load. Answers the line that the system leaves on standard error.
std::string refusalOf(const std::string& path) {
  int thrown = 0;
  testing::internal::CaptureStderr();
  try {
    VSTPluginLoader::demandLoadedPlugin({path, "test"});
  } catch (int value) {
    thrown = value;
  }
  const std::string line = testing::internal::GetCapturedStderr();
  EXPECT_EQ(thrown, -1);
  EXPECT_EQ(VSTPluginLoader::fLoadedDLLs.size(), 0u);
  return line;
}

TEST_F(RealModules, APathWhereNothingIsThrowsMinusOne) {
  EXPECT_THAT(refusalOf("/nowhere/at/all.vst"), HasSubstr("/nowhere/at/all.vst"));
}

TEST_F(RealModules, AnEmptyPathThrowsMinusOne) { EXPECT_THAT(refusalOf(""), HasSubstr("empty")); }

TEST_F(RealModules, APathThatIsNotUtf8ThrowsMinusOne) {
  EXPECT_THAT(refusalOf("/\xFF.vst"), HasSubstr("UTF-8"));
}

TEST_F(RealModules, AFolderWithoutAnExecutableThrowsMinusOne) {
  EXPECT_THAT(refusalOf(testing::TempDir()), testing::Not(IsEmpty()));
}

TEST_F(RealModules, AFileThatIsNoModuleThrowsMinusOneAlsoFromTheConstructor) {
  const std::string path = testing::TempDir() + "vsttorture_no_module_" + std::to_string(getpid()) + ".so";
  std::ofstream(path) << "no module";
  EXPECT_THAT(refusalOf(path), HasSubstr(path));
  testing::internal::CaptureStderr();
  EXPECT_THROW(VSTPluginLoader({path, "test"}), int);
  EXPECT_THAT(testing::internal::GetCapturedStderr(), HasSubstr(path));
  std::remove(path.c_str());
}

TEST_F(RealModules, CodeStaysLoadedWhenEveryHandleIsGone) {
  void* entry = VSTPluginLoader::demandLoadedPlugin({NEWEST_ENTRY, "test"})->getMainEntry();
  emptyTheCache();
  ASSERT_NE(entry, nullptr);
  EXPECT_EQ(reinterpret_cast<int (*)()>(entry)(), 1);
}

}  // namespace
