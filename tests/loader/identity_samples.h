// SPDX-License-Identifier: MIT
// The four identity records for the tests of their stream form: an old and a new value of each, and the
// fields of any as texts.
#pragma once

#include <string>
#include <vector>

#include "loader/plugin_identity.h"

using Texts = std::vector<std::string>;

inline Texts joined(Texts first, const Texts& second) {
  first.insert(first.end(), second.begin(), second.end());
  return first;
}

/// The fields in the order in which they are streamed: strings in quotes, numbers as they are.
inline Texts fieldsOf(const VST_loadID& record) {
  return {record.hasChildID ? "true" : "false", std::to_string(record.childID)};
}
inline Texts fieldsOf(const VST_ChildSpec& record) {
  return joined(fieldsOf(static_cast<const VST_loadID&>(record)), {'"' + record.childName + '"'});
}
inline Texts fieldsOf(const VST_DLL_Info& record) {
  return {'"' + record.path + '"', '"' + record.effectName + '"', std::to_string(record.dllTag)};
}
inline Texts fieldsOf(const VST_Class_Spec& record) {
  return joined(fieldsOf(static_cast<const VST_DLL_Info&>(record)), fieldsOf(record.child));
}

inline VST_ChildSpec childSpec(bool hasChildID, int id, const char* name) {
  VST_ChildSpec spec(VST_loadID{hasChildID, id});
  spec.childName = name;
  return spec;
}

inline VST_DLL_Info dllInfo(const char* path, const char* name, std::int64_t tag) {
  VST_DLL_Info info(path, name);
  info.dllTag = tag;
  return info;
}

/// An old and a new record that differ in every field, and the operations that stream the new one.
template <class Record>
struct Sample;

template <>
struct Sample<VST_loadID> {
  static VST_loadID oldRecord() { return {false, 1}; }
  static VST_loadID newRecord() { return {true, -7}; }
  static Texts writes() { return {"write bool true", "write int32 -7"}; }
  static Texts reads() { return {"read bool", "read int32"}; }
};

template <>
struct Sample<VST_ChildSpec> {
  static VST_ChildSpec oldRecord() { return childSpec(false, 1, "a child with a longer name"); }
  static VST_ChildSpec newRecord() { return childSpec(true, 5, "Compressor"); }
  static Texts writes() { return {"write bool true", "write int32 5", "write string \"Compressor\""}; }
  static Texts reads() { return {"read bool", "read int32", "read string 499"}; }
};

template <>
struct Sample<VST_DLL_Info> {
  static VST_DLL_Info oldRecord() { return dllInfo("/old.vst", "old effect", 0x123456789ABCDEF0); }
  static VST_DLL_Info newRecord() { return dllInfo("/b.vst", "test", -2); }
  static Texts writes() { return {"write string \"/b.vst\"", "write string \"test\"", "write int32 -2"}; }
  static Texts reads() { return {"read string 499", "read string 499", "read int32"}; }
};

template <>
struct Sample<VST_Class_Spec> {
  using Bundle = Sample<VST_DLL_Info>;
  using Child = Sample<VST_ChildSpec>;
  static VST_Class_Spec oldRecord() { return {Bundle::oldRecord(), Child::oldRecord()}; }
  static VST_Class_Spec newRecord() { return {Bundle::newRecord(), Child::newRecord()}; }
  static Texts writes() { return joined(Bundle::writes(), Child::writes()); }
  static Texts reads() { return joined(Bundle::reads(), Child::reads()); }
};
