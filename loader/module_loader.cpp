// SPDX-License-Identifier: MIT
#include "loader/module_loader.h"

#include <cstring>

#include "flight_recorder/flight_recorder.h"
#include "platform/entry_point_name.h"

sorted_vector_set<NiduCOM::i_ptr<VSTPluginLoader>, compareVSTLoaderRefs> VSTPluginLoader::fLoadedDLLs;

bool compareVSTLoaderRefs::operator()(const NiduCOM::i_ptr<VSTPluginLoader>& a,
                                      const NiduCOM::i_ptr<VSTPluginLoader>& b) const {
  return std::strcmp(a->info.path.c_str(), b->info.path.c_str()) < 0;
}

bool compareVSTLoaderRefs::operator()(const NiduCOM::i_ptr<VSTPluginLoader>& a,
                                      const VST_DLL_Info& info) const {
  return std::strcmp(a->info.path.c_str(), info.path.c_str()) < 0;
}

VSTPluginLoader::VSTPluginLoader(const VST_DLL_Info& identity) : info(identity) {
  CFStringRef path = CFStringCreateWithCString(kCFAllocatorDefault, info.path.c_str(), kCFStringEncodingUTF8);
  if (path == nullptr) throw -1;
  CFURLRef url = CFURLCreateWithFileSystemPath(kCFAllocatorDefault, path, kCFURLPOSIXPathStyle, false);
  CFRelease(path);
  if (url == nullptr) throw -1;
  bundle = CFBundleCreate(kCFAllocatorDefault, url);
  CFRelease(url);
  if (bundle == nullptr) throw -1;
  // On purpose: a bundle whose executable does not load is not released.
  RequestUnderWay request(kFlightLoad);
  const bool isLoaded = CFBundleLoadExecutable(bundle);
  request.returned();
  if (!isLoaded) throw -1;
}

VSTPluginLoader::~VSTPluginLoader() {
  if (bundle == nullptr) return;
  CFBundleUnloadExecutable(bundle);
  CFRelease(bundle);
}

void* VSTPluginLoader::getMainEntry() {
  if (void* entry = CFBundleGetFunctionPointerForName(bundle, CFSTR("VSTPluginMain"))) return entry;
  if (void* entry = CFBundleGetFunctionPointerForName(bundle, CFSTR("main_macho"))) return entry;
  CFStringRef systemName = systemEntryPointName();
  return systemName == nullptr ? nullptr : CFBundleGetFunctionPointerForName(bundle, systemName);
}

bool VSTPluginLoader::findLoadedDLL(const VST_DLL_Info& identity, NiduCOM::i_ptr<VSTPluginLoader>& out) {
  const auto p = fLoadedDLLs.lower_bound(identity);
  if (p == fLoadedDLLs.end() || (*p)->info.effectName != identity.effectName) return false;
  out = *p;
  return true;
}

NiduCOM::i_ptr<VSTPluginLoader> VSTPluginLoader::demandLoadedPlugin(const VST_DLL_Info& identity) {
  NiduCOM::i_ptr<VSTPluginLoader> result;
  if (findLoadedDLL(identity, result)) return result;
  // On purpose: takes a second reference, although the constructor's could be adopted. That one is never
  // given back, so the loader and its plug-in's code stay until the process ends.
  result.reset(new VSTPluginLoader(identity), NiduCOM::AddRef::kTake);
  fLoadedDLLs.insert(result);
  return result;
}
