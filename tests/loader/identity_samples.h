// SPDX-License-Identifier: MIT
// The four identity records as the tests of their stream form drive them: one old, one new, and the fields of
// any as texts.
#pragma once

#include <string>
#include <vector>

#include "loader/plugin_identity.h"

using Texts = std::vector<std::string>;

/// The fields in the order in which they travel: the names in quotes, the numbers as they are.
Texts fieldsOf(const VST_loadID& record);
Texts fieldsOf(const VST_ChildSpec& record);
Texts fieldsOf(const VST_DLL_Info& record);
Texts fieldsOf(const VST_Class_Spec& record);

/// An old and a new record that differ in every field, and what the new one is on a stream.
template <class Record>
struct Sample;

template <>
struct Sample<VST_loadID> {
  static constexpr const char* name = "VST_loadID";
  static VST_loadID oldRecord() { return {false, 1}; }
  static VST_loadID newRecord() { return {true, -7}; }
  static Texts writes() { return {"write bool true", "write int32 -7"}; }
  static Texts reads() { return {"read bool", "read int32"}; }
  static void read(VST_loadID& record, INiduStream* stream) { record.getFrom(stream); }
};

template <>
struct Sample<VST_ChildSpec> {
  static constexpr const char* name = "VST_ChildSpec";
  static VST_ChildSpec oldRecord();
  static VST_ChildSpec newRecord();
  static Texts writes() { return {"write bool true", "write int32 5", "write string \"Compressor\""}; }
  static Texts reads() { return {"read bool", "read int32", "read string 499"}; }
  static void read(VST_ChildSpec& record, INiduStream* stream) { record.getFrom(stream); }
};

template <>
struct Sample<VST_DLL_Info> {
  static constexpr const char* name = "VST_DLL_Info";
  static VST_DLL_Info oldRecord();
  static VST_DLL_Info newRecord();
  static Texts writes() { return {"write string \"/b.vst\"", "write string \"test\"", "write int32 -2"}; }
  static Texts reads() { return {"read string 499", "read string 499", "read int32"}; }
  static void read(VST_DLL_Info& record, INiduStream* stream) { record.getFrom(stream); }
};

template <>
struct Sample<VST_Class_Spec> {
  static constexpr const char* name = "VST_Class_Spec";
  static VST_Class_Spec oldRecord();
  static VST_Class_Spec newRecord();
  static Texts writes() {
    return {"write string \"/b.vst\"", "write string \"test\"", "write int32 -2",
            "write bool true",         "write int32 5",         "write string \"Compressor\""};
  }
  static Texts reads() {
    return {"read string 499", "read string 499", "read int32", "read bool", "read int32", "read string 499"};
  }
  static void read(VST_Class_Spec& record, INiduStream* stream) { record.getFrom(stream, 3); }
};
