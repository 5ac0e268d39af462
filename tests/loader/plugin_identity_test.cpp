// SPDX-License-Identifier: MIT
// The records that name a plug-in: how they are made and copied, their order, their names.
#include <climits>
#include <cstddef>
#include <functional>
#include <string>
#include <type_traits>
#include <vector>

#include "gmock/gmock.h"
#include "gtest/gtest.h"
#include "loader/plugin_identity.h"
#include "support/sorted_vector_set.h"
#include "tests/loader/identity_samples.h"
#include "tests/loader/virtual_slot.h"

namespace {

using testing::ElementsAre;

VST_ChildSpec childNamed(int id, const char* name) {
  VST_ChildSpec spec(id);
  spec.childName = name;
  return spec;
}

// Without a child, yet with an identifier and a name.
VST_ChildSpec noChildNamed(int id, const char* name) {
  VST_ChildSpec spec = childNamed(id, name);
  spec.hasChildID = false;
  return spec;
}

TEST(VSTLoadID, IsAByteAndANumber) {
  EXPECT_EQ(sizeof(VST_loadID), 8u);
  EXPECT_EQ(offsetof(VST_loadID, hasChildID), 0u);
  EXPECT_EQ(sizeof(VST_loadID::hasChildID), 1u);
  EXPECT_EQ(offsetof(VST_loadID, childID), 4u);
  EXPECT_FALSE(std::is_polymorphic_v<VST_loadID>);
}

TEST(VSTChildSpec, BeginsWithItsLoadID) {
  const VST_ChildSpec spec;
  const VST_loadID& loadID = spec;
  EXPECT_EQ(static_cast<const void*>(&loadID), static_cast<const void*>(&spec));
  EXPECT_EQ(reinterpret_cast<const char*>(&spec.childName) - reinterpret_cast<const char*>(&spec), 8);
  EXPECT_FALSE(std::is_polymorphic_v<VST_ChildSpec>);
}

TEST(VSTChildSpec, AsksForNoChildByDefault) {
  EXPECT_THAT(fieldsOf(VST_ChildSpec()), ElementsAre("false", "0", "\"\""));
}

TEST(VSTChildSpec, AsksForAnyChildByItsIdentifierAlsoForZero) {
  EXPECT_THAT(fieldsOf(VST_ChildSpec(5)), ElementsAre("true", "5", "\"\""));
  EXPECT_THAT(fieldsOf(VST_ChildSpec(0)), ElementsAre("true", "0", "\"\""));
  EXPECT_THAT(fieldsOf(VST_ChildSpec(-1)), ElementsAre("true", "-1", "\"\""));
}

TEST(VSTChildSpec, TakesBothFieldsOfALoadID) {
  EXPECT_THAT(fieldsOf(VST_ChildSpec(VST_loadID{true, 9})), ElementsAre("true", "9", "\"\""));
  EXPECT_THAT(fieldsOf(VST_ChildSpec(VST_loadID{false, 9})), ElementsAre("false", "9", "\"\""));
  EXPECT_THAT(fieldsOf(VST_ChildSpec(VST_loadID())), ElementsAre("false", "0", "\"\""));
}

TEST(VSTChildSpec, FromTheLoadIDOfAnotherSpecLosesTheName) {
  const VST_ChildSpec named = childNamed(9, "Compressor");
  EXPECT_THAT(fieldsOf(VST_ChildSpec(static_cast<const VST_loadID&>(named))),
              ElementsAre("true", "9", "\"\""));
}

TEST(VSTChildSpec, CopiesAndAssignmentsAreDeep) {
  VST_ChildSpec original = childNamed(3, "Gate");
  const VST_ChildSpec copy(original);
  VST_ChildSpec assigned;
  assigned = original;
  original.childName[0] = 'X';
  original.childID = 4;
  original.hasChildID = false;
  EXPECT_THAT(fieldsOf(copy), ElementsAre("true", "3", "\"Gate\""));
  EXPECT_THAT(fieldsOf(assigned), ElementsAre("true", "3", "\"Gate\""));
}

struct Order {
  const char* name;
  VST_ChildSpec a;
  VST_ChildSpec b;
  bool aBeforeB;
  bool bBeforeA;
};

class VSTChildSpecOrder : public testing::TestWithParam<Order> {};

TEST_P(VSTChildSpecOrder, IsByChildOnly) {
  const auto& [name, a, b, aBeforeB, bBeforeA] = GetParam();
  EXPECT_EQ(a < b, aBeforeB);
  EXPECT_EQ(b < a, bBeforeA);
  EXPECT_EQ(std::less<VST_ChildSpec>()(a, b), aBeforeB);
  EXPECT_EQ(std::less<VST_ChildSpec>()(b, a), bBeforeA);
  EXPECT_FALSE(a < a);
}

INSTANTIATE_TEST_SUITE_P(
    Pairs, VSTChildSpecOrder,
    testing::Values(Order{"SameChildOtherName", childNamed(5, "A"), childNamed(5, "B"), false, false},
                    Order{"SmallerChildLaterName", childNamed(4, "Z"), childNamed(5, "A"), true, false},
                    Order{"NegativeBeforeZero", VST_ChildSpec(-1), VST_ChildSpec(0), true, false},
                    Order{"SmallestBeforeLargest", VST_ChildSpec(INT_MIN), VST_ChildSpec(INT_MAX), true,
                          false},
                    Order{"NoChildBeforeTheSmallest", VST_ChildSpec(), VST_ChildSpec(INT_MIN), true, false},
                    Order{"NoChildBeforeZero", VST_ChildSpec(), VST_ChildSpec(0), true, false},
                    Order{"NoChildWithALargerNumber", noChildNamed(7, "Z"), childNamed(5, "A"), true, false},
                    Order{"NoChildTwice", noChildNamed(1, "A"), noChildNamed(2, "B"), false, false}),
    [](const auto& tested) { return std::string(tested.param.name); });

using Children = sorted_vector_set<VST_ChildSpec, std::less<VST_ChildSpec>>;

Texts namesIn(const Children& children) {
  Texts names;
  for (const VST_ChildSpec& child : children) names.push_back(child.childName);
  return names;
}

TEST(VSTChildSpecSet, KeepsTheFirstNameOfAChild) {
  Children children;
  EXPECT_TRUE(children.insert(childNamed(5, "first")).second);
  const auto second = children.insert(childNamed(5, "second"));
  EXPECT_FALSE(second.second);
  EXPECT_EQ(second.first->childName, "first");
  EXPECT_THAT(namesIn(children), ElementsAre("first"));
}

TEST(VSTChildSpecSet, HoldsOneEntryWithoutAChildAtMost) {
  Children children;
  children.insert(noChildNamed(8, "none"));
  children.insert(noChildNamed(9, "none either"));
  children.insert(childNamed(0, "zero"));
  EXPECT_THAT(namesIn(children), ElementsAre("none", "zero"));
}

TEST(VSTChildSpecSet, IsInOrderOfSignedIdentifiers) {
  Children children;
  for (const int id : {300, -1, 0, INT_MIN, 2}) children.insert(childNamed(id, std::to_string(id).c_str()));
  children.insert(noChildNamed(0, "none"));
  EXPECT_THAT(namesIn(children), ElementsAre("none", "-2147483648", "-1", "0", "2", "300"));
}

TEST(VSTDLLInfo, NamesABundleWithTagZero) {
  std::string path = "/Library/b.vst";
  char name[] = "test";
  const VST_DLL_Info info(path, name);
  path[0] = 'X';
  name[0] = 'X';
  EXPECT_EQ(info.path, "/Library/b.vst");
  EXPECT_EQ(info.dllTag, 0);
  EXPECT_EQ(info.effectName, "test");
}

TEST(VSTDLLInfo, CopiesAreDeepAndKeepTheWholeTag) {
  VST_DLL_Info original("/b.vst", "test");
  original.dllTag = 0x123456789ABCDEF0;
  const VST_DLL_Info copy(original);
  original.path[1] = 'X';
  original.effectName[0] = 'X';
  original.dllTag = 1;
  EXPECT_EQ(copy.path, "/b.vst");
  EXPECT_EQ(copy.dllTag, 0x123456789ABCDEF0);
  EXPECT_EQ(copy.effectName, "test");
}

TEST(VSTDLLInfo, KeepsItsFieldsInOrder) {
  const VST_DLL_Info info("", "");
  EXPECT_LT(static_cast<const void*>(&info.path), static_cast<const void*>(&info.dllTag));
  EXPECT_LT(static_cast<const void*>(&info.dllTag), static_cast<const void*>(&info.effectName));
  EXPECT_EQ(sizeof info.dllTag, 8u);
}

TEST(VSTDLLInfo, HasTwoVirtualOperationsAndAPlainDestructor) {
  EXPECT_TRUE(std::is_polymorphic_v<VST_DLL_Info>);
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
  VST_DLL_Info bundle("/b.vst", "test");
  bundle.dllTag = 0x100000007;
  VST_ChildSpec child = childNamed(5, "Gate");
  const VST_Class_Spec spec(bundle, child);
  bundle.path = "/gone.vst";
  child.childName = "gone";
  EXPECT_THAT(fieldsOf(spec), ElementsAre("\"/b.vst\"", "\"test\"", "4294967303", "true", "5", "\"Gate\""));
  const VST_Class_Spec copy(spec);
  EXPECT_EQ(fieldsOf(copy), fieldsOf(spec));
}

TEST(VSTClassSpecEffectName, IsTheChildsWhenAChildIsNamed) {
  const VST_Class_Spec spec(VST_DLL_Info("/b.vst", "test"), childNamed(0, "Gate"));
  EXPECT_EQ(spec.getEffectName(), "Gate");
}

TEST(VSTClassSpecEffectName, IsEmptyForAChildWithoutAName) {
  const VST_Class_Spec spec(VST_DLL_Info("/b.vst", "test"), VST_ChildSpec(5));
  EXPECT_EQ(spec.getEffectName(), "");
}

TEST(VSTClassSpecEffectName, IsTheBundlesWithoutAChildWhateverTheChildsName) {
  const VST_Class_Spec spec(VST_DLL_Info("/b.vst", "test"), noChildNamed(5, "Gate"));
  EXPECT_EQ(spec.getEffectName(), "test");
}

TEST(VSTClassSpecEffectName, IsAReferenceIntoTheRecord) {
  VST_Class_Spec spec(VST_DLL_Info("/b.vst", "test"), childNamed(5, "Gate"));
  EXPECT_EQ(&spec.getEffectName(), &spec.child.childName);
  spec.child.hasChildID = false;
  EXPECT_EQ(&spec.getEffectName(), &spec.effectName);
}

}  // namespace
