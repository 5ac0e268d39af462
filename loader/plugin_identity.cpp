// SPDX-License-Identifier: MIT
#include "loader/plugin_identity.h"

#include <utility>

bool operator<(const VST_ChildSpec& a, const VST_ChildSpec& b) {
  if (a.hasChildID && b.hasChildID) return a.childID < b.childID;
  return !a.hasChildID && b.hasChildID;
}

VST_DLL_Info::VST_DLL_Info(std::string bundlePath, const char* name)
    : path(std::move(bundlePath)), effectName(name) {}

VST_Class_Spec::VST_Class_Spec(const VST_DLL_Info& bundle, const VST_ChildSpec& childSpec)
    : VST_DLL_Info(bundle), child(childSpec) {}

const std::string& VST_Class_Spec::getEffectName() const {
  return child.hasChildID ? child.childName : effectName;
}
