// SPDX-License-Identifier: MIT
// What the tests of the module loader start from: a recorded CoreFoundation and an empty cache.
#pragma once

#include <string>
#include <vector>

#include "gtest/gtest.h"
#include "loader/module_loader.h"
#include "tests/shared/recording_core_foundation.h"

using LoaderHandle = NiduCOM::i_ptr<VSTPluginLoader>;

class LoaderFixture : public testing::Test {
 protected:
  LoaderFixture() { emptyTheCache(); }
  ~LoaderFixture() override { emptyTheCache(); }

  /// Removes every loader from the cache. They live on, because their first reference is never given back.
  static void emptyTheCache() { VSTPluginLoader::fLoadedDLLs = decltype(VSTPluginLoader::fLoadedDLLs)(); }

  /// The paths in the cache, in its order.
  static std::vector<std::string> cachedPaths() {
    std::vector<std::string> paths;
    for (const LoaderHandle& loader : VSTPluginLoader::fLoadedDLLs) paths.push_back(loader->info.path);
    return paths;
  }

  static LoaderHandle demand(const std::string& path, const char* name = "test") {
    return VSTPluginLoader::demandLoadedPlugin(VST_DLL_Info(path, name));
  }

  doubles::RecordingCoreFoundation core_foundation;
};
