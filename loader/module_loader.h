// SPDX-License-Identifier: MIT
// Loads plug-in bundles and shares them.
//
// Ask for a bundle with VSTPluginLoader::demandLoadedPlugin(); asking twice for the same path gives the same
// loader. The wrapper takes the entry point from it and creates instances.
//
// Ownership: loaders are counted. The reference taken at construction is never given back, so plug-in code
//            stays loaded until the process ends.
// Failures:  a bundle that cannot be loaded throws the int -1; nothing is cached then.
// Threads:   main thread only. Counts are plain integers.
#pragma once

#include <cstdint>

#include "loader/plugin_identity.h"
#include "platform/core_foundation.h"
#include "support/counted_handle.h"
#include "support/sorted_vector_set.h"

class VSTPluginLoader;

/// Orders loaders by their paths, byte by byte as C strings.
struct compareVSTLoaderRefs {
  bool operator()(const NiduCOM::i_ptr<VSTPluginLoader>& a, const NiduCOM::i_ptr<VSTPluginLoader>& b) const;
  bool operator()(const NiduCOM::i_ptr<VSTPluginLoader>& a, const VST_DLL_Info& info) const;
};

class VSTPluginLoader {
 public:
  /// Loads the bundle at the identity's path. Throws the int -1 when that fails.
  explicit VSTPluginLoader(const VST_DLL_Info& identity);
  /// Unloads the bundle. Never runs in this program, because the constructor's reference is never given back.
  ~VSTPluginLoader();
  VSTPluginLoader(const VSTPluginLoader&) = delete;
  VSTPluginLoader& operator=(const VSTPluginLoader&) = delete;

  /// The function that creates instances: "VSTPluginMain", else "main_macho", else systemEntryPointName().
  /// Null when the module exports none of them.
  void* getMainEntry();

  /// Searches the cache. On a hit it assigns the loader to `out`; on a miss `out` is unchanged.
  /// On purpose: the search finds the first loader whose path is not less than the identity's, and then
  /// compares only the names. So the loader of a later path is a hit when its name is the same.
  static bool findLoadedDLL(const VST_DLL_Info& identity, NiduCOM::i_ptr<VSTPluginLoader>& out);

  /// The loader for this bundle: from the cache, else newly made and cached. Throws the int -1 when the
  /// bundle does not load.
  static NiduCOM::i_ptr<VSTPluginLoader> demandLoadedPlugin(const VST_DLL_Info& identity);

  CFBundleRef bundle = nullptr;  ///< Owned: one reference.
  VST_DLL_Info info;             ///< The identity that this loader was made for.
  std::uint32_t refCount = 1;    ///< See support/counted_handle.h.

  /// Every bundle loaded so far. Empty before main runs.
  static sorted_vector_set<NiduCOM::i_ptr<VSTPluginLoader>, compareVSTLoaderRefs> fLoadedDLLs;
};
