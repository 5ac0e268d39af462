// SPDX-License-Identifier: MIT
// A wrapper around the recording instance, for tests that save and load its state, and the requests that its operations
// consist of.
//
//   open();
//   EXPECT_EQ(inHex(save(kProgram)), inHex(hex("43636E4B 00000000 ...")));
//   EXPECT_EQ(requests(), inOrder({asksName(), readsParameters(2)}));
#pragma once

#include <cstdint>
#include <string>
#include <vector>

#include "tests/host/preset_bytes.h"
#include "tests/shared/wrapper_fixture.h"

namespace preset_tests {

using Requests = std::vector<doubles::Request>;

/// Several lists of requests as one.
Requests inOrder(const std::vector<Requests>& parts);

Requests asksProgram();                     ///< effGetProgram (3)
Requests asksName();                        ///< getCurrentProgramName()
Requests selects(VstIntPtr index);          ///< setCurrentProgram(index), where another program is current
Requests renames(const std::string& sent);  ///< changeProgramName(current program, another name)
Requests keepsName();                       ///< changeProgramName(current program, its name)
Requests readsParameters(VstInt32 count);   ///< getParameter(i) for each of so many parameters
Requests sets(VstInt32 parameter, float value);  ///< setParameter(parameter, another value)

constexpr bool kBank = true;
constexpr bool kProgram = false;

/// The bits of some floats.
constexpr std::uint32_t kHalf = 0x3F000000;
constexpr std::uint32_t kOne = 0x3F800000;
constexpr std::uint32_t kMinusTwo = 0xC0000000;

class PresetTest : public host_tests::WrapperTest {
 protected:
  /// A plug-in 'Demo' of version 1.
  PresetTest();

  /// open() with effFlagsProgramChunks set.
  void openWithChunks();

  /// The data that saveToFXBData() writes. Fails the test if the result is not true.
  std::string save(bool asBank);
  /// loadFromFXBData() of these bytes. `slack` bytes 0xEE follow them in memory, since some fields are read
  /// without checking the size.
  bool load(const std::string& bytes, std::size_t slack = 512);
  /// The same with another size than that of the bytes.
  bool loadAs(const std::string& bytes, int size);

  Requests requests() const { return effect.requests(); }
};

}  // namespace preset_tests
