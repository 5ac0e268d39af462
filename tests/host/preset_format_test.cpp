// SPDX-License-Identifier: MIT
// The fields of preset and bank data: byte order, texts, what a form magic says.
#include <cstdint>
#include <cstring>
#include <string>

#include "gtest/gtest.h"
#include "host/preset_format.h"
#include "host/vst_wrapper.h"
#include "tests/host/preset_bytes.h"

namespace {

using preset_bytes::header;
using preset_bytes::hex;
using preset_bytes::inHex;

float floatOfBits(std::uint32_t bits) {
  float number = 0.0f;
  std::memcpy(&number, &bits, sizeof number);
  return number;
}

TEST(VstSwap, ReversesTheFourBytes) {
  EXPECT_EQ(vst_swap(0x01020304), 0x04030201);
  EXPECT_EQ(vst_swap(0x000000FF), -16777216);
  EXPECT_EQ(vst_swap(-2), -16777217);
  EXPECT_EQ(vst_swap(0), 0);
}

TEST(VstSwap, TwiceGivesTheValueBack) { EXPECT_EQ(vst_swap(vst_swap(-123456789)), -123456789); }

TEST(VstSwapFloat, ReversesTheFourBytes) {
  EXPECT_EQ(vst_swapFloat(1.0f), 0x0000803F);
  EXPECT_EQ(vst_swapFloat(-2.0f), 0x000000C0);
  EXPECT_EQ(vst_swapFloat(-0.0f), 0x00000080);
}

TEST(VstSwapFloat, KeepsAReversedPatternThatIsASignallingNaN) {
  // 0x0100A07F reversed is 0x7FA00001.
  EXPECT_EQ(vst_swapFloat(floatOfBits(0x0100A07F)), 0x7FA00001);
}

TEST(ReadWord, TakesTheMostSignificantByteFirst) {
  EXPECT_EQ(readWord(hex("01020304").data()), 0x01020304);
  EXPECT_EQ(readWord(hex("FFFFFFFE").data()), -2);
}

TEST(ReadWord, NeedsNoAlignment) {
  const std::string bytes = hex("AA 7FFFFFFF 80000000");
  EXPECT_EQ(readWord(bytes.data() + 1), 2147483647);
  EXPECT_EQ(readWord(bytes.data() + 5), -2147483647 - 1);
}

TEST(WriteWord, PutsTheMostSignificantByteFirst) {
  std::string bytes(6, '\xAA');
  writeWord(&bytes[1], 0x43636E4B);
  EXPECT_EQ(inHex(bytes), "AA43636E 4BAA");
}

TEST(ReadFloat, TakesTheMostSignificantByteFirst) {
  EXPECT_EQ(readFloat(hex("3F800000").data()), 1.0f);
  EXPECT_EQ(readFloat(hex("C0000000").data()), -2.0f);
}

TEST(WriteFloat, PutsTheMostSignificantByteFirst) {
  std::string bytes(6, '\xAA');
  writeFloat(&bytes[1], 0.5f);
  EXPECT_EQ(inHex(bytes), "AA3F0000 00AA");
}

TEST(ReadProgramName, EndsAtTheFirstZeroByte) {
  EXPECT_EQ(readProgramName((std::string(28, '#') + "Init" + std::string(24, '\0')).data()), "Init");
  EXPECT_EQ(readProgramName((std::string(28, '#') + std::string(28, '\0')).data()), "");
}

TEST(ReadProgramName, StaysInItsFieldWithoutAZeroByte) {
  const std::string exactly(56, 'n');
  EXPECT_EQ(readProgramName(exactly.data()), std::string(28, 'n'));
}

struct NameInItsField {
  std::string name;
  std::string written;
  std::string expected;
};

class WriteProgramName : public testing::TestWithParam<NameInItsField> {};

TEST_P(WriteProgramName, Writes28BytesAndNoMore) {
  std::string block(60, '#');
  writeProgramName(&block[0], GetParam().written);
  EXPECT_EQ(block, std::string(28, '#') + GetParam().expected + "####");
}

const std::string kAlphabet = "abcdefghijklmnopqrstuvwxyz0123456789ABCD";

INSTANTIATE_TEST_SUITE_P(
    Names, WriteProgramName,
    testing::Values(
        NameInItsField{"Empty", "", std::string(28, '\0')},
        NameInItsField{"Of4", "Init", "Init" + std::string(24, '\0')},
        NameInItsField{"Of26", kAlphabet.substr(0, 26), "abcdefghijklmnopqrstuvwxyz" + std::string(2, '\0')},
        NameInItsField{"Of27", kAlphabet.substr(0, 27), "abcdefghijklmnopqrstuvwxyz0" + std::string(1, '\0')},
        NameInItsField{"Of28", kAlphabet.substr(0, 28), "abcdefghijklmnopqrstuvwxyz0" + std::string(1, '\0')},
        NameInItsField{"Of40", kAlphabet, "abcdefghijklmnopqrstuvwxyz0" + std::string(1, '\0')}),
    [](const auto& instance) { return instance.param.name; });

struct FormMagic {
  std::string magic;
  bool isBank;
};

class PresetDataIsBankFormat : public testing::TestWithParam<FormMagic> {};

TEST_P(PresetDataIsBankFormat, KnowsTheBankFormsInBothByteOrders) {
  // Only the first 12 bytes are there to be read.
  const std::string data = header(GetParam().magic, 0).substr(0, 12);
  EXPECT_EQ(VSTWrapper::presetDataIsBankFormat(data.data()), GetParam().isBank);
}

INSTANTIATE_TEST_SUITE_P(Magics, PresetDataIsBankFormat,
                         testing::Values(FormMagic{"FxBk", true}, FormMagic{"kBxF", true},
                                         FormMagic{"FBCh", true}, FormMagic{"hCBF", true},
                                         FormMagic{"FxCk", false}, FormMagic{"kCxF", false},
                                         FormMagic{"FPCh", false}, FormMagic{"hCPF", false},
                                         FormMagic{"CcnK", false}, FormMagic{"fxbk", false}),
                         [](const auto& instance) { return instance.param.magic; });

TEST(PresetDataIsBankFormat, LooksAtNothingButTheFormMagic) {
  EXPECT_TRUE(VSTWrapper::presetDataIsBankFormat(hex("00000000 FFFFFFFF 4678426B").data()));
}

TEST(GetEffectIDFromPresetData, IsTheNumberAtOffset16) {
  EXPECT_EQ(
      VSTWrapper::getEffectIDFromPresetData(hex("00 01020304 05060708 090A0B0C 0D0E0F 44656D6F").data()),
      0x44656D6F);
  EXPECT_EQ(VSTWrapper::getEffectIDFromPresetData(hex("00000000 00000000 00000000 00000000 FFFFFFFE").data()),
            -2);
}

}  // namespace
