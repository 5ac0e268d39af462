// SPDX-License-Identifier: MIT
// Byte order and names of preset and bank data, and what can be told from the data alone.
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

TEST(VstSwap, ReversesTheFourBytes) {
  EXPECT_EQ(vst_swap(0x01020304), 0x04030201);
  EXPECT_EQ(vst_swap(-2), -16777217);
}

TEST(VstSwapFloat, ReversesTheFourBytesAlsoToASignallingNaN) {
  EXPECT_EQ(vst_swapFloat(1.0f), 0x0000803F);
  float number = 0.0f;
  const std::uint32_t bits = 0x0100A07F;
  std::memcpy(&number, &bits, sizeof number);
  EXPECT_EQ(vst_swapFloat(number), 0x7FA00001);
}

TEST(WriteProgramName, Writes28BytesWithAtMost27CharactersAndNoMore) {
  const std::string alphabet = "abcdefghijklmnopqrstuvwxyz0123456789ABCD";
  for (const std::size_t length : {0u, 4u, 26u, 27u, 28u, 40u}) {
    std::string block(60, '#');
    writeProgramName(&block[0], alphabet.substr(0, length));
    std::string field = alphabet.substr(0, std::min<std::size_t>(length, 27));
    field.resize(28);
    EXPECT_EQ(block, std::string(28, '#') + field + "####") << length;
  }
}

TEST(PresetDataIsBankFormat, IsTrueForTheBankFormsInBothByteOrders) {
  // Only the first 12 bytes are there to be read, and only the form magic counts.
  for (const std::string magic : {"FxBk", "kBxF", "FBCh", "hCBF"}) {
    EXPECT_TRUE(VSTWrapper::presetDataIsBankFormat((std::string(8, '#') + magic).data())) << magic;
  }
  for (const std::string magic : {"FxCk", "kCxF", "FPCh", "hCPF", "CcnK", "fxbk"}) {
    EXPECT_FALSE(VSTWrapper::presetDataIsBankFormat(header(magic, 0).substr(0, 12).data())) << magic;
  }
}

TEST(GetEffectIDFromPresetData, IsTheBigEndianNumberAtOffset16) {
  const std::string data = hex("01020304 05060708 090A0B0C 0D0E0F10 F4656D6F");
  EXPECT_EQ(VSTWrapper::getEffectIDFromPresetData(data.data()), -194679441);
}

}  // namespace
