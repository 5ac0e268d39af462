// SPDX-License-Identifier: MIT
// VSTWrapper::masterCallback: the answer to every request that a plug-in can make.
#include <climits>
#include <cstdint>
#include <string>
#include <thread>
#include <vector>

#include "gmock/gmock.h"
#include "gtest/gtest.h"
#include "host/vst_wrapper.h"
#include "tests/shared/recording_core_foundation.h"

namespace {

using testing::IsEmpty;

constexpr VstInt32 kNidu = 1313424469;  // 'NIDU'

VstIntPtr ask(VstInt32 opcode, void* ptr = nullptr) {
  return VSTWrapper::masterCallback(nullptr, opcode, 0, 0, ptr, 0.0f);
}

class VSTWrapperMasterCallback : public testing::Test {
 protected:
  doubles::RecordingCoreFoundation core_foundation;
};

struct AnswerCase {
  VstInt32 opcode;
  VstIntPtr answer;
};

const AnswerCase kAnswers[] = {
    {0, 0},          {1, 2400},    {2, 0},       {3, 0},     {4, 0},         {5, 0},         {6, 0},
    {7, 0},          {8, 0},       {9, 0},       {10, 0},    {11, 0},        {12, 0},        {13, 0},
    {14, 0},         {15, 0},      {16, 0},      {17, 0},    {18, 0},        {19, 0},        {20, 0},
    {21, 0},         {22, 0},      {23, 0},      {24, 0},    {25, 0},        {26, 0},        {27, 0},
    {28, 0},         {29, 0},      {30, 0},      {31, 0},    {32, 0},        {33, 0},        {34, 134217728},
    {35, 0},         {36, 0},      {37, 0},      {38, 1},    {39, 0},        {40, 0},        {41, 0},
    {42, 0},         {43, 0},      {44, 0},      {45, 0},    {46, 0},        {47, 0},        {48, 0},
    {49, 0},         {50, 0},      {51, 0},      {52, 0},    {53, 0},        {54, 0},        {55, 0},
    {56, 0},         {57, 0},      {58, 0},      {59, 0},    {60, 0},        {61, 0},        {70, 0},
    {99, 0},         {256, 0},     {257, 0},     {1000, 0},  {2400, 0},      {-1, 0},        {-2, 0},
    {-37, 0},        {INT_MIN, 0}, {INT_MAX, 0}, {kNidu, 0}, {kNidu - 1, 0}, {kNidu + 1, 0}, {-kNidu, 0},
    {0x5544494E, 0},  // 'UDIN'
};

TEST_F(VSTWrapperMasterCallback, AnswersEachRequestInThisWay) {
  for (const AnswerCase& row : kAnswers) {
    char text[64] = {};
    EXPECT_EQ(ask(row.opcode, text), row.answer) << "opcode " << row.opcode;
  }
}

TEST_F(VSTWrapperMasterCallback, LooksAtNothingButOpcodeAndPointer) {
  auto* const garbage = reinterpret_cast<AEffect*>(std::uintptr_t{1});
  for (const AnswerCase& row : kAnswers) {
    char text[64] = {};
    EXPECT_EQ(VSTWrapper::masterCallback(garbage, row.opcode, -1, -1, text, -1.0f), row.answer)
        << "opcode " << row.opcode;
    EXPECT_EQ(VSTWrapper::masterCallback(nullptr, row.opcode, INT_MAX, 4711, text, 1e30f), row.answer)
        << "opcode " << row.opcode;
  }
}

TEST_F(VSTWrapperMasterCallback, NeedsThePointerInFourTextRequestsAndTheServiceOnly) {
  for (const AnswerCase& row : kAnswers) {
    if (row.opcode == 32 || row.opcode == 33 || row.opcode == 37 || row.opcode == kNidu) continue;
    EXPECT_EQ(ask(row.opcode, nullptr), row.answer) << "opcode " << row.opcode;
  }
}

TEST_F(VSTWrapperMasterCallback, WritesNothingButTheTwoNames) {
  for (const AnswerCase& row : kAnswers) {
    if (row.opcode == 32 || row.opcode == 33) continue;
    std::string text(80, 'z');
    ask(row.opcode, text.data());
    EXPECT_EQ(text, std::string(80, 'z')) << "opcode " << row.opcode;
  }
}

TEST_F(VSTWrapperMasterCallback, AsksTheSystemForTheLanguageOnly) {
  for (const AnswerCase& row : kAnswers) {
    if (row.opcode == 38) continue;
    char text[64] = {};
    ask(row.opcode, text);
  }
  EXPECT_THAT(core_foundation.calls(), IsEmpty());
}

TEST_F(VSTWrapperMasterCallback, AnswersTheSameOnAnotherThread) {
  std::thread other([] {
    EXPECT_EQ(ask(1), 2400);
    EXPECT_EQ(ask(34), 134217728);
    EXPECT_EQ(ask(2), 0);
  });
  other.join();
}

// ---- Names ----

// On purpose: answered with 0 although the text is there.
TEST_F(VSTWrapperMasterCallback, WritesTheVendorWithItsZeroByteAndAnswersZero) {
  std::string text(80, 'z');
  EXPECT_EQ(ask(32, text.data()), 0);
  EXPECT_EQ(text, std::string("NIDU\0", 5) + std::string(75, 'z'));
}

// On purpose: answered with 0 although the text is there.
TEST_F(VSTWrapperMasterCallback, WritesTheProductInto64BytesZeroPaddedAndAnswersZero) {
  std::string text(80, 'z');
  EXPECT_EQ(ask(33, text.data()), 0);
  EXPECT_EQ(text, "com.nidu.kel" + std::string(52, '\0') + std::string(16, 'z'));
}

TEST_F(VSTWrapperMasterCallback, HasVersionEight) { EXPECT_EQ(ask(34), 0x08000000); }

// ---- The vendor's own service ----

TEST_F(VSTWrapperMasterCallback, HandsOutTheTrackSampleService) {
  char name[] = "niduGetTrackSampleForCurBlock";
  const VstIntPtr answer = ask(kNidu, name);
  ASSERT_NE(answer, 0);
  const auto service = reinterpret_cast<double (*)(AEffect*)>(answer);
  // The whole pointer arrives, wherever the program lies in memory.
  ASSERT_EQ(service, &VSTWrapper::trackSamplePosThunk);
  EXPECT_EQ(service(nullptr), 0.0);
  EXPECT_EQ(service(reinterpret_cast<AEffect*>(std::uintptr_t{1})), 0.0);
}

TEST_F(VSTWrapperMasterCallback, KnowsNoOtherService) {
  for (const char* name :
       {"", "n", "niduGetTrackSampleForCurBloc", "niduGetTrackSampleForCurBlock ",
        " niduGetTrackSampleForCurBlock", "niduGetTrackSampleForCurBlocks", "NIDUGetTrackSampleForCurBlock",
        "niduGetTrackSampleForCurblock", "nidugettracksampleforcurblock", "sendVstEvents"}) {
    std::string text = name;
    EXPECT_EQ(ask(kNidu, text.data()), 0) << name;
  }
}

// On purpose: the service has an opcode of its own.
TEST_F(VSTWrapperMasterCallback, HandsOutNothingThroughVendorSpecific) {
  char name[] = "niduGetTrackSampleForCurBlock";
  EXPECT_EQ(ask(35, name), 0);
  EXPECT_EQ(VSTWrapper::masterCallback(nullptr, 35, kNidu, kNidu, name, 0.0f), 0);
}

}  // namespace
