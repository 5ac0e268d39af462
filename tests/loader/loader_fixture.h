// SPDX-License-Identifier: MIT
// What the tests of the module loader start from: a recorded CoreFoundation and an empty cache.
#pragma once

#include <cstring>
#include <string>
#include <utility>
#include <vector>

#include "gtest/gtest.h"
#include "loader/module_loader.h"
#include "tests/shared/recording_core_foundation.h"

using LoaderHandle = NiduCOM::i_ptr<VSTPluginLoader>;

/// Forgets every loader in the cache. They live on, as the reference of their construction stays out.
inline void emptyTheCache() { VSTPluginLoader::fLoadedDLLs = decltype(VSTPluginLoader::fLoadedDLLs)(); }

/// The paths in the cache, in its order.
inline std::vector<std::string> cachedPaths() {
  std::vector<std::string> paths;
  for (const LoaderHandle& loader : VSTPluginLoader::fLoadedDLLs) paths.push_back(loader->info.path);
  return paths;
}

/// A bundle under the name that the driver gives all of them.
inline VST_DLL_Info test(const std::string& path) { return {path, "test"}; }

/// What `action` throws as an int; 0 where it returns.
template <typename Action>
int intThrownBy(Action action) {
  try {
    action();
  } catch (int thrown) {
    return thrown;
  }
  return 0;
}

class LoaderFixture : public testing::Test {
 protected:
  void SetUp() override { emptyTheCache(); }
  void TearDown() override { emptyTheCache(); }
  doubles::RecordingCoreFoundation core_foundation;
};
