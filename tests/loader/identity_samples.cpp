// SPDX-License-Identifier: MIT
#include "tests/loader/identity_samples.h"

namespace {

std::string quoted(const std::string& text) { return '"' + text + '"'; }

}  // namespace

Texts fieldsOf(const VST_loadID& record) {
  return {record.hasChildID ? "true" : "false", std::to_string(record.childID)};
}

Texts fieldsOf(const VST_ChildSpec& record) {
  return {record.hasChildID ? "true" : "false", std::to_string(record.childID), quoted(record.childName)};
}

Texts fieldsOf(const VST_DLL_Info& record) {
  return {quoted(record.path), quoted(record.effectName), std::to_string(record.dllTag)};
}

Texts fieldsOf(const VST_Class_Spec& record) {
  Texts fields = fieldsOf(static_cast<const VST_DLL_Info&>(record));
  for (const std::string& field : fieldsOf(record.child)) fields.push_back(field);
  return fields;
}

VST_ChildSpec Sample<VST_ChildSpec>::oldRecord() {
  VST_ChildSpec record;
  record.childID = 1;
  record.childName = "old child";
  return record;
}

VST_ChildSpec Sample<VST_ChildSpec>::newRecord() {
  VST_ChildSpec record(5);
  record.childName = "Compressor";
  return record;
}

VST_DLL_Info Sample<VST_DLL_Info>::oldRecord() {
  VST_DLL_Info record("/old.vst", "old effect");
  record.dllTag = 0x123456789ABCDEF0;
  return record;
}

VST_DLL_Info Sample<VST_DLL_Info>::newRecord() {
  VST_DLL_Info record("/b.vst", "test");
  record.dllTag = -2;
  return record;
}

VST_Class_Spec Sample<VST_Class_Spec>::oldRecord() {
  return {Sample<VST_DLL_Info>::oldRecord(), Sample<VST_ChildSpec>::oldRecord()};
}

VST_Class_Spec Sample<VST_Class_Spec>::newRecord() {
  return {Sample<VST_DLL_Info>::newRecord(), Sample<VST_ChildSpec>::newRecord()};
}
