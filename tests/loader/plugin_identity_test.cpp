// SPDX-License-Identifier: MIT
// The records that name a plug-in: how they are made, their order, their names.
#include <climits>
#include <cstddef>
#include <functional>
#include <string>
#include <type_traits>
#include <utility>
#include <vector>

#include "gmock/gmock.h"
#include "gtest/gtest.h"
#include "loader/plugin_identity.h"
#include "support/sorted_vector_set.h"
#include "tests/loader/identity_samples.h"
#include "tests/loader/virtual_slot.h"

namespace {

using testing::ElementsAre;

TEST(VSTLoadID, IsAByteAndANumberAndBeginsAChildSpec) {
  EXPECT_EQ(sizeof(VST_loadID), 8u);
  EXPECT_EQ(offsetof(VST_loadID, hasChildID), 0u);
  EXPECT_EQ(sizeof(VST_loadID::hasChildID), 1u);
  EXPECT_EQ(offsetof(VST_loadID, childID), 4u);
  const VST_ChildSpec spec;
  EXPECT_EQ(static_cast<const void*>(static_cast<const VST_loadID*>(&spec)), static_cast<const void*>(&spec));
  EXPECT_EQ(reinterpret_cast<const char*>(&spec.childName) - reinterpret_cast<const char*>(&spec), 8);
}

TEST(VSTChildSpec, AsksForNoChildAnIdentifierOrWhatALoadIDAsksForWithoutAName) {
  EXPECT_THAT(fieldsOf(VST_ChildSpec()), ElementsAre("false", "0", "\"\""));
  EXPECT_THAT(fieldsOf(VST_ChildSpec(0)), ElementsAre("true", "0", "\"\""));
  EXPECT_THAT(fieldsOf(VST_ChildSpec(-1)), ElementsAre("true", "-1", "\"\""));
  EXPECT_THAT(fieldsOf(VST_ChildSpec(VST_loadID{true, 9})), ElementsAre("true", "9", "\"\""));
  const VST_loadID& loadID = childSpec(false, 9, "Compressor");
  EXPECT_THAT(fieldsOf(VST_ChildSpec(loadID)), ElementsAre("false", "9", "\"\""));
}

TEST(VSTChildSpec, IsOrderedByChildWithNoChildFirstAndWithoutTheName) {
  // In ascending order; the specs of one row are equivalent.
  const std::vector<std::vector<VST_ChildSpec>> rows = {
      {VST_ChildSpec(), childSpec(false, 7, "Z"), childSpec(false, INT_MIN, "A")},
      {VST_ChildSpec(INT_MIN)},
      {VST_ChildSpec(-1)},
      {childSpec(true, 0, "Z")},
      {childSpec(true, 5, "B"), childSpec(true, 5, "A")},
      {childSpec(true, INT_MAX, "A")}};
  for (std::size_t a = 0; a < rows.size(); ++a)
    for (std::size_t b = 0; b < rows.size(); ++b)
      for (const VST_ChildSpec& left : rows[a])
        for (const VST_ChildSpec& right : rows[b]) EXPECT_EQ(left < right, a < b) << a << " and " << b;
}

TEST(VSTChildSpec, ASetKeepsTheFirstNameOfEachChildAndOneEntryWithoutAChild) {
  sorted_vector_set<VST_ChildSpec, std::less<VST_ChildSpec>> children;
  for (const VST_ChildSpec& child :
       {childSpec(true, 5, "first"), childSpec(true, 5, "second"), childSpec(false, 8, "none"),
        childSpec(false, 9, "none either"), childSpec(true, 0, "zero"), childSpec(true, -1, "minus one")})
    children.insert(child);
  Texts names;
  for (const VST_ChildSpec& child : children) names.push_back(child.childName);
  EXPECT_THAT(names, ElementsAre("none", "minus one", "zero", "first"));
}

TEST(VSTDLLInfo, NamesABundleWithTagZeroAndKeepsItsFieldsInOrder) {
  std::string path = "/Library/b.vst";
  char name[] = "test";
  const VST_DLL_Info info(path, name);
  path[0] = 'X';
  name[0] = 'X';
  EXPECT_THAT(fieldsOf(info), ElementsAre("\"/Library/b.vst\"", "\"test\"", "0"));
  EXPECT_LT(static_cast<const void*>(&info.path), static_cast<const void*>(&info.dllTag));
  EXPECT_LT(static_cast<const void*>(&info.dllTag), static_cast<const void*>(&info.effectName));
  EXPECT_EQ(sizeof info.dllTag, 8u);
}

TEST(VSTDLLInfo, HasTwoVirtualOperationsAndAPlainDestructor) {
  EXPECT_FALSE(std::has_virtual_destructor_v<VST_DLL_Info>);
  EXPECT_EQ(virtualSlot(&VST_DLL_Info::putTo), 0u);
  EXPECT_EQ(virtualSlot(&VST_DLL_Info::getFrom), 1u);
}

TEST(VSTClassSpec, AddsOneVirtualOperation) {
  using ReadBundle = void (VST_Class_Spec::*)(INiduStream*);
  using ReadBoth = void (VST_Class_Spec::*)(INiduStream*, int);
  EXPECT_FALSE(std::has_virtual_destructor_v<VST_Class_Spec>);
  EXPECT_EQ(virtualSlot(&VST_Class_Spec::putTo), 0u);
  EXPECT_EQ(virtualSlot(static_cast<ReadBundle>(&VST_Class_Spec::getFrom)), 1u);
  EXPECT_EQ(virtualSlot(static_cast<ReadBoth>(&VST_Class_Spec::getFrom)), 2u);
}

TEST(VSTClassSpec, JoinsCopiesOfABundleAndAChild) {
  VST_DLL_Info bundle = dllInfo("/b.vst", "test", 0x100000007);
  VST_ChildSpec child = childSpec(true, 5, "Gate");
  const VST_Class_Spec spec(bundle, child);
  const VST_Class_Spec copy(spec);
  bundle.path = "/gone.vst";
  child.childName = "gone";
  EXPECT_THAT(fieldsOf(spec), ElementsAre("\"/b.vst\"", "\"test\"", "4294967303", "true", "5", "\"Gate\""));
  EXPECT_EQ(fieldsOf(copy), fieldsOf(spec));
}

TEST(VSTClassSpec, ItsEffectNameIsAReferenceToTheChildsWhenOneIsNamedElseToTheBundles) {
  VST_Class_Spec spec(VST_DLL_Info("/b.vst", "test"), childSpec(true, 0, ""));
  EXPECT_EQ(&spec.getEffectName(), &spec.child.childName);
  spec.child = childSpec(false, 5, "Gate");
  EXPECT_EQ(&spec.getEffectName(), &spec.effectName);
}

}  // namespace
