// SPDX-License-Identifier: MIT
// The stream form of the four identity records: order of values, and what stands after a failure at every
// single operation.
#include <algorithm>
#include <cstdint>
#include <cstring>
#include <string>
#include <vector>

#include "gmock/gmock.h"
#include "gtest/gtest.h"
#include "tests/loader/identity_samples.h"
#include "tests/shared/recording_stream.h"

namespace {

using doubles::RecordingStream;
using doubles::StreamBroke;
using testing::ElementsAre;
using testing::IsEmpty;

// A failure with its own code for each operation.
NiduException failureOf(int operation) {
  NiduException failure{};
  std::strcpy(failure.textA, "cannot");
  std::strcpy(failure.textB, "store");
  std::strcpy(failure.textC, "this");
  failure.errorCode = -100 - operation;
  failure.mode = 8;
  failure.spare = 9;
  return failure;
}

Texts firstOf(const Texts& all, int count) { return {all.begin(), all.begin() + count}; }

// The first fields of one record and the rest of another.
Texts joined(const Texts& first, int count, const Texts& rest) {
  Texts all = firstOf(first, count);
  all.insert(all.end(), rest.begin() + count, rest.end());
  return all;
}

// Runs an action that must end with this very failure.
template <typename Action>
void expectFailure(int operation, Action action) {
  const NiduException expected = failureOf(operation);
  try {
    action();
    ADD_FAILURE() << "operation " << operation << " failed and nothing was thrown";
  } catch (const NiduException& thrown) {
    EXPECT_STREQ(thrown.textA, "cannot");
    EXPECT_STREQ(thrown.textB, "store");
    EXPECT_STREQ(thrown.textC, "this");
    EXPECT_EQ(thrown.errorCode, -100 - operation);
    EXPECT_EQ(std::memcmp(&thrown, &expected, sizeof thrown), 0);
  }
}

template <class Record>
class IdentityStream : public testing::Test {
 protected:
  using Tested = Sample<Record>;
  static int operationCount() { return static_cast<int>(Tested::writes().size()); }
  static Texts oldFields() { return fieldsOf(Tested::oldRecord()); }
  static Texts newFields() { return fieldsOf(Tested::newRecord()); }
  void fill() {
    Tested::newRecord().putTo(&stream);
    stream.forgetOperations();
  }
  RecordingStream stream;
};

struct NameOfRecord {
  template <class Record>
  static std::string GetName(int) {
    return Sample<Record>::name;
  }
};
using Records = testing::Types<VST_loadID, VST_ChildSpec, VST_DLL_Info, VST_Class_Spec>;
TYPED_TEST_SUITE(IdentityStream, Records, NameOfRecord);

TYPED_TEST(IdentityStream, WritesItsFieldsInOrder) {
  Sample<TypeParam>::newRecord().putTo(&this->stream);
  EXPECT_EQ(this->stream.operations(), Sample<TypeParam>::writes());
}

TYPED_TEST(IdentityStream, ReadsBackWhatWasWritten) {
  this->fill();
  TypeParam record = Sample<TypeParam>::oldRecord();
  Sample<TypeParam>::read(record, &this->stream);
  EXPECT_EQ(this->stream.operations(), Sample<TypeParam>::reads());
  EXPECT_EQ(fieldsOf(record), this->newFields());
  EXPECT_EQ(this->stream.valuesLeft(), 0u);
}

TYPED_TEST(IdentityStream, EveryOperationGetsASlotOfItsOwn) {
  this->fill();
  TypeParam record = Sample<TypeParam>::oldRecord();
  Sample<TypeParam>::read(record, &this->stream);
  EXPECT_THAT(this->stream.usedSlots(), IsEmpty());
}

TYPED_TEST(IdentityStream, AFailedWriteStopsThere) {
  for (int n = 1; n <= this->operationCount(); ++n) {
    SCOPED_TRACE(n);
    RecordingStream failing;
    failing.failAt(n, failureOf(n));
    expectFailure(n, [&] { Sample<TypeParam>::newRecord().putTo(&failing); });
    EXPECT_EQ(failing.operations(), firstOf(Sample<TypeParam>::writes(), n));
    EXPECT_EQ(failing.valuesLeft(), static_cast<std::size_t>(n - 1));
  }
}

TYPED_TEST(IdentityStream, AFailedReadKeepsNewFieldsBeforeItAndOldOnesFromItOn) {
  for (int n = 1; n <= this->operationCount(); ++n) {
    SCOPED_TRACE(n);
    RecordingStream failing;
    Sample<TypeParam>::newRecord().putTo(&failing);
    failing.forgetOperations();
    failing.failAt(n, failureOf(n));
    TypeParam record = Sample<TypeParam>::oldRecord();
    expectFailure(n, [&] { Sample<TypeParam>::read(record, &failing); });
    EXPECT_EQ(failing.operations(), firstOf(Sample<TypeParam>::reads(), n));
    EXPECT_EQ(fieldsOf(record), joined(this->newFields(), n - 1, this->oldFields()));
  }
}

TYPED_TEST(IdentityStream, WhatTheStreamThrowsOnWritingPassesAlsoFromAFailedSlot) {
  for (int n = 1; n <= this->operationCount(); ++n) {
    SCOPED_TRACE(n);
    RecordingStream throwing;
    throwing.throwAt(n);
    try {
      Sample<TypeParam>::newRecord().putTo(&throwing);
      ADD_FAILURE() << "nothing was thrown";
    } catch (const StreamBroke& thrown) {
      EXPECT_EQ(thrown.operation, n);
    }
    EXPECT_EQ(throwing.operations(), firstOf(Sample<TypeParam>::writes(), n));
  }
}

TYPED_TEST(IdentityStream, WhatTheStreamThrowsOnReadingPassesAlsoFromAFailedSlot) {
  for (int n = 1; n <= this->operationCount(); ++n) {
    SCOPED_TRACE(n);
    RecordingStream throwing;
    Sample<TypeParam>::newRecord().putTo(&throwing);
    throwing.forgetOperations();
    throwing.throwAt(n);
    TypeParam record = Sample<TypeParam>::oldRecord();
    try {
      Sample<TypeParam>::read(record, &throwing);
      ADD_FAILURE() << "nothing was thrown";
    } catch (const StreamBroke& thrown) {
      EXPECT_EQ(thrown.operation, n);
    }
    EXPECT_EQ(throwing.operations(), firstOf(Sample<TypeParam>::reads(), n));
    EXPECT_EQ(fieldsOf(record), joined(this->newFields(), n - 1, this->oldFields()));
  }
}

TEST(VSTDLLInfoStream, AFailureAtTheSecondStringLeavesOnlyThePathNew) {
  RecordingStream stream;
  VST_DLL_Info("/new.vst", "new").putTo(&stream);
  stream.failAt(2, failureOf(2));
  VST_DLL_Info record("/old.vst", "old");
  record.dllTag = 77;
  EXPECT_THROW(record.getFrom(&stream), NiduException);
  EXPECT_EQ(record.path, "/new.vst");
  EXPECT_EQ(record.effectName, "old");
  EXPECT_EQ(record.dllTag, 77);
}

struct Tag {
  const char* name;
  std::int64_t kept;
  std::int32_t written;
  std::int64_t readBack;
};

class VSTDLLInfoTag : public testing::TestWithParam<Tag> {};

TEST_P(VSTDLLInfoTag, TravelsAsItsLowHalf) {
  RecordingStream stream;
  VST_DLL_Info record("/b.vst", "test");
  record.dllTag = GetParam().kept;
  record.putTo(&stream);
  EXPECT_EQ(stream.operations().back(), "write int32 " + std::to_string(GetParam().written));
  VST_DLL_Info read("", "");
  read.dllTag = 0x7777777777777777;
  read.getFrom(&stream);
  EXPECT_EQ(read.dllTag, GetParam().readBack);
}

INSTANTIATE_TEST_SUITE_P(Values, VSTDLLInfoTag,
                         testing::Values(Tag{"Zero", 0, 0, 0}, Tag{"MinusOne", -1, -1, -1},
                                         Tag{"Largest32Bit", 2147483647, 2147483647, 2147483647},
                                         Tag{"Smallest32Bit", -2147483648LL, INT32_MIN, -2147483648LL},
                                         Tag{"TwoToThe31", 2147483648LL, INT32_MIN, -2147483648LL},
                                         Tag{"TwoToThe32", 4294967296LL, 0, 0},
                                         Tag{"FiveAboveTwoToThe32", 4294967301LL, 5, 5},
                                         Tag{"TwoToThe32LessOne", 4294967295LL, -1, -1},
                                         Tag{"Smallest64Bit", INT64_MIN, 0, 0},
                                         Tag{"Largest64Bit", INT64_MAX, -1, -1}),
                         [](const auto& tested) { return std::string(tested.param.name); });

TEST(VSTLoadIDStream, AnyByteButZeroIsTrue) {
  for (const int byte : {1, 2, 127, -128, -1, 0}) {
    RecordingStream stream;
    stream.addBool(static_cast<char>(byte));
    stream.addInt32(4);
    VST_loadID record{byte == 0, 0};
    record.getFrom(&stream);
    EXPECT_EQ(record.hasChildID, byte != 0) << byte;
    unsigned char stored = 0;
    std::memcpy(&stored, &record.hasChildID, 1);
    EXPECT_EQ(stored, byte == 0 ? 0 : 1) << byte;
  }
}

TEST(VSTChildSpecStream, ANewNameReplacesALongerOne) {
  VST_ChildSpec record(2);
  record.childName = "a name that is longer than the new one";
  RecordingStream stream;
  VST_ChildSpec(3).putTo(&stream);
  record.getFrom(&stream);
  EXPECT_EQ(record.childID, 3);
  EXPECT_EQ(record.childName, "");
}

TEST(VSTDLLInfoStream, ATextOf499CharactersFits) {
  const std::string longest(499, 'x');
  RecordingStream stream;
  VST_DLL_Info("/" + longest.substr(1), longest.c_str()).putTo(&stream);
  VST_DLL_Info record("", "");
  record.getFrom(&stream);
  EXPECT_EQ(record.path, "/" + longest.substr(1));
  EXPECT_EQ(record.effectName, longest);
}

TEST(VSTDLLInfoStream, ATextIsWrittenUpToItsFirstZeroByteInUnchangedBytes) {
  RecordingStream stream;
  VST_DLL_Info(std::string("/\xC3\xA9\xFF\0.vst", 9), "").putTo(&stream);
  EXPECT_THAT(stream.operations(),
              ElementsAre("write string \"/\xC3\xA9\xFF\"", "write string \"\"", "write int32 0"));
}

// Leaves the destination of its second string as it is.
class ForgetfulStream : public RecordingStream {
 public:
  void readString(AutoNiduException* error, char* buffer, int maxLength) override {
    if (++stringsRead != 2) RecordingStream::readString(error, buffer, maxLength);
  }

 private:
  int stringsRead = 0;
};

TEST(VSTDLLInfoStream, OneBufferServesBothStrings) {
  ForgetfulStream stream;
  stream.addString("/b.vst");
  stream.addInt32(0);
  VST_DLL_Info record("/old.vst", "old");
  record.getFrom(&stream);
  EXPECT_EQ(record.path, "/b.vst");
  EXPECT_EQ(record.effectName, "/b.vst");
}

TEST(VSTClassSpecStream, TheInheritedReadTakesTheBundlePartOnly) {
  RecordingStream stream;
  Sample<VST_Class_Spec>::newRecord().putTo(&stream);
  stream.forgetOperations();
  VST_Class_Spec record = Sample<VST_Class_Spec>::oldRecord();
  record.getFrom(&stream);
  EXPECT_THAT(stream.operations(), ElementsAre("read string 499", "read string 499", "read int32"));
  EXPECT_THAT(fieldsOf(record), ElementsAre("\"/b.vst\"", "\"test\"", "-2", "false", "1", "\"old child\""));
  EXPECT_EQ(stream.valuesLeft(), 3u);
}

TEST(VSTClassSpecStream, ThroughItsBaseItWritesAllAndReadsTheBundlePartOnly) {
  RecordingStream stream;
  VST_Class_Spec record = Sample<VST_Class_Spec>::newRecord();
  VST_DLL_Info& base = record;
  base.putTo(&stream);
  EXPECT_EQ(stream.operations(), Sample<VST_Class_Spec>::writes());
  record = Sample<VST_Class_Spec>::oldRecord();
  base.getFrom(&stream);
  EXPECT_THAT(fieldsOf(record), ElementsAre("\"/b.vst\"", "\"test\"", "-2", "false", "1", "\"old child\""));
}

TEST(VSTClassSpecStream, TheVersionIsIgnored) {
  for (const int version : {INT32_MIN, -1, 0, 1, 7, INT32_MAX}) {
    RecordingStream stream;
    Sample<VST_Class_Spec>::newRecord().putTo(&stream);
    VST_Class_Spec record = Sample<VST_Class_Spec>::oldRecord();
    record.getFrom(&stream, version);
    EXPECT_EQ(fieldsOf(record), fieldsOf(Sample<VST_Class_Spec>::newRecord())) << version;
  }
}

TEST(VSTClassSpecStream, RecordsFollowEachOtherWithoutAGap) {
  RecordingStream stream;
  Sample<VST_Class_Spec>::newRecord().putTo(&stream);
  Sample<VST_Class_Spec>::oldRecord().putTo(&stream);
  VST_Class_Spec first = Sample<VST_Class_Spec>::oldRecord();
  VST_Class_Spec second = Sample<VST_Class_Spec>::newRecord();
  first.getFrom(&stream, 0);
  second.getFrom(&stream, 0);
  EXPECT_EQ(first.path, "/b.vst");
  EXPECT_EQ(second.path, "/old.vst");
  EXPECT_EQ(second.child.childName, "old child");
  EXPECT_EQ(stream.valuesLeft(), 0u);
}

}  // namespace
