// SPDX-License-Identifier: MIT
// The stream form of the four identity records: order of values, and the state after a failure at every
// single operation.
#include <cstdint>
#include <cstring>
#include <string>
#include <type_traits>
#include <vector>

#include "gmock/gmock.h"
#include "gtest/gtest.h"
#include "tests/loader/identity_samples.h"
#include "tests/loader/virtual_slot.h"
#include "tests/shared/recording_stream.h"

namespace {

using doubles::RecordingStream;
using doubles::StreamBroke;
using testing::ElementsAre;
using testing::IsEmpty;

TEST(INiduStream, IsAnInterfaceWithItsOperationsInOrder) {
  EXPECT_TRUE(std::is_abstract_v<INiduStream>);
  const std::size_t first = virtualSlot(&INiduStream::writeString);
  EXPECT_EQ(virtualSlot(&INiduStream::writeBool), first + 1);
  EXPECT_EQ(virtualSlot(&INiduStream::writeInt32), first + 2);
  EXPECT_EQ(virtualSlot(&INiduStream::readString), first + 3);
  EXPECT_EQ(virtualSlot(&INiduStream::readBool), first + 4);
  EXPECT_EQ(virtualSlot(&INiduStream::readInt32), first + 5);
}

template <class Record>
void read(Record& record, INiduStream* stream) {
  record.getFrom(stream);
}
void read(VST_Class_Spec& record, INiduStream* stream) { record.getFrom(stream, 3); }

NiduException failureOf(int operation) {
  NiduException failure{};
  std::strcpy(failure.textA, "cannot");
  failure.errorCode = -100 - operation;
  failure.spare = 9;
  return failure;
}

Texts firstOf(const Texts& all, int count) { return {all.begin(), all.begin() + count}; }

template <class Record>
class IdentityStream : public testing::Test {
 protected:
  using Tested = Sample<Record>;

  // Runs `action` and returns the number of the operation that it failed or broke at: the n-th fails with
  // failureOf(n), or the stream throws. 0 when nothing is thrown.
  template <typename Action>
  static int brokenAt(Action action) {
    try {
      action();
    } catch (const NiduException& thrown) {
      const int operation = -100 - thrown.errorCode;
      const NiduException expected = failureOf(operation);
      EXPECT_EQ(std::memcmp(&thrown, &expected, sizeof thrown), 0);
      return operation;
    } catch (const StreamBroke& thrown) {
      return thrown.operation;
    }
    return 0;
  }

  // Calls `test` for every operation, with a stream that fails there and with one that throws there. With
  // `filled`, the new record is on the stream.
  template <typename Test>
  static void forEachTrouble(bool filled, Test test) {
    for (int n = 1; n <= static_cast<int>(Tested::writes().size()); ++n) {
      for (const bool throws : {false, true}) {
        SCOPED_TRACE((throws ? "throwing at " : "failing at ") + std::to_string(n));
        RecordingStream stream;
        if (filled) Tested::newRecord().putTo(&stream);
        stream.forgetOperations();
        throws ? stream.throwAt(n) : stream.failAt(n, failureOf(n));
        test(stream, n);
      }
    }
  }
};

using Records = testing::Types<VST_loadID, VST_ChildSpec, VST_DLL_Info, VST_Class_Spec>;
TYPED_TEST_SUITE(IdentityStream, Records);

TYPED_TEST(IdentityStream, WritesAndReadsItsFieldsInOrderEachWithAFreshErrorSlot) {
  RecordingStream stream;
  Sample<TypeParam>::newRecord().putTo(&stream);
  EXPECT_EQ(stream.operations(), Sample<TypeParam>::writes());
  stream.forgetOperations();

  TypeParam record = Sample<TypeParam>::oldRecord();
  read(record, &stream);
  EXPECT_EQ(stream.operations(), Sample<TypeParam>::reads());
  EXPECT_EQ(fieldsOf(record), fieldsOf(Sample<TypeParam>::newRecord()));
  EXPECT_EQ(stream.valuesLeft(), 0u);
  EXPECT_THAT(stream.usedSlots(), IsEmpty());
}

TYPED_TEST(IdentityStream, AFailedWriteStopsThere) {
  this->forEachTrouble(false, [&](RecordingStream& stream, int n) {
    EXPECT_EQ(this->brokenAt([&] { Sample<TypeParam>::newRecord().putTo(&stream); }), n);
    EXPECT_EQ(stream.operations(), firstOf(Sample<TypeParam>::writes(), n));
  });
}

TYPED_TEST(IdentityStream, AFailedReadLeavesNewFieldsBeforeItAndOldOnesFromItOn) {
  this->forEachTrouble(true, [&](RecordingStream& stream, int n) {
    TypeParam record = Sample<TypeParam>::oldRecord();
    Texts expected = fieldsOf(record);
    const Texts newFields = fieldsOf(Sample<TypeParam>::newRecord());
    std::copy_n(newFields.begin(), n - 1, expected.begin());

    EXPECT_EQ(this->brokenAt([&] { read(record, &stream); }), n);
    EXPECT_EQ(stream.operations(), firstOf(Sample<TypeParam>::reads(), n));
    EXPECT_EQ(fieldsOf(record), expected);
  });
}

TEST(VSTDLLInfoStream, TheTagIsWrittenAsItsLowHalfAndReadSignExtended) {
  struct Tag {
    std::int64_t kept;
    std::int32_t written;
  };
  for (const auto& [kept, written] :
       {Tag{0, 0}, Tag{-1, -1}, Tag{INT32_MAX, INT32_MAX}, Tag{INT32_MIN, INT32_MIN},
        Tag{2147483648LL, INT32_MIN}, Tag{4294967296LL, 0}, Tag{4294967301LL, 5}, Tag{4294967295LL, -1},
        Tag{INT64_MIN, 0}, Tag{INT64_MAX, -1}}) {
    RecordingStream stream;
    dllInfo("/b.vst", "test", kept).putTo(&stream);
    EXPECT_EQ(stream.operations().back(), "write int32 " + std::to_string(written));
    VST_DLL_Info readBack = dllInfo("", "", 0x7777777777777777);
    readBack.getFrom(&stream);
    EXPECT_EQ(readBack.dllTag, written);
  }
}

TEST(VSTLoadIDStream, AnyByteButZeroIsTrue) {
  for (const int byte : {1, 2, 127, -128, -1, 0}) {
    RecordingStream stream;
    stream.addBool(static_cast<char>(byte));
    stream.addInt32(4);
    VST_loadID record{byte == 0, 0};
    record.getFrom(&stream);
    unsigned char stored = 0;
    std::memcpy(&stored, &record.hasChildID, 1);
    EXPECT_EQ(stored, byte == 0 ? 0 : 1) << byte;
  }
}

TEST(VSTDLLInfoStream, ATextOf499CharactersFits) {
  const std::string longest(499, 'x');
  RecordingStream stream;
  VST_DLL_Info(longest, longest.c_str()).putTo(&stream);
  VST_DLL_Info record("", "");
  record.getFrom(&stream);
  EXPECT_EQ(record.path, longest);
  EXPECT_EQ(record.effectName, longest);
}

TEST(VSTDLLInfoStream, ATextIsWrittenUpToItsFirstZeroByteInUnchangedBytes) {
  RecordingStream stream;
  VST_DLL_Info(std::string("/\xC3\xA9\xFF\0.vst", 9), "").putTo(&stream);
  EXPECT_EQ(stream.operations().front(), "write string \"/\xC3\xA9\xFF\"");
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

TEST(VSTDLLInfoStream, BothStringsAreReadIntoOneBuffer) {
  ForgetfulStream stream;
  stream.addString("/b.vst");
  stream.addInt32(0);
  VST_DLL_Info record("/old.vst", "old");
  record.getFrom(&stream);
  EXPECT_EQ(record.effectName, "/b.vst");
}

TEST(VSTClassSpecStream, ThroughItsBaseItWritesAllAndReadsTheBundlePartOnly) {
  RecordingStream stream;
  VST_Class_Spec record = Sample<VST_Class_Spec>::newRecord();
  VST_DLL_Info& base = record;
  base.putTo(&stream);
  EXPECT_EQ(stream.operations(), Sample<VST_Class_Spec>::writes());
  record = Sample<VST_Class_Spec>::oldRecord();
  record.getFrom(&stream);
  EXPECT_EQ(fieldsOf(record), joined(fieldsOf(Sample<VST_DLL_Info>::newRecord()),
                                     fieldsOf(Sample<VST_ChildSpec>::oldRecord())));
  EXPECT_EQ(stream.valuesLeft(), 3u);
}

TEST(VSTClassSpecStream, TheVersionIsIgnored) {
  for (const int version : {INT32_MIN, 0, 1, INT32_MAX}) {
    RecordingStream stream;
    Sample<VST_Class_Spec>::newRecord().putTo(&stream);
    VST_Class_Spec record = Sample<VST_Class_Spec>::oldRecord();
    record.getFrom(&stream, version);
    EXPECT_EQ(fieldsOf(record), fieldsOf(Sample<VST_Class_Spec>::newRecord())) << version;
  }
}

}  // namespace
