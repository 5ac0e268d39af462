// SPDX-License-Identifier: MIT
// A wrapper around the recording instance, for tests that save and load its state.
//
//   open();
//   EXPECT_EQ(inHex(save(kProgram)), inHex(hex("43636E4B 00000000 ...")));
//   EXPECT_EQ(requests(), inOrder({asksName(), readsParameters(2)}));
#pragma once

#include <memory>
#include <string>
#include <vector>

#include "gmock/gmock.h"
#include "gtest/gtest.h"
#include "host/vst_wrapper.h"
#include "tests/host/preset_bytes.h"
#include "tests/shared/in_process_plugin.h"
#include "tests/shared/recording_core_foundation.h"
#include "tests/shared/recording_effect.h"

namespace preset_tests {

using Requests = std::vector<doubles::Request>;

/// One conversation after another.
Requests inOrder(const std::vector<Requests>& parts);

/// effGetProgram (3)
Requests asksProgram();
/// getCurrentProgramName()
Requests asksName();
/// setCurrentProgram(index) where another program is current, and where this one is.
Requests selects(VstIntPtr index);
Requests finds();
/// changeProgramName(current program, name) to another name, and to the name that it has.
Requests renames(const std::string& sent);
Requests keepsName();
/// getParameter(i) for each parameter.
Requests readsParameters(VstInt32 count);
/// setParameter(i) to another value.
Requests sets(VstInt32 parameter, float value);

constexpr bool kBank = true;
constexpr bool kProgram = false;

class PresetTest : public testing::Test {
 protected:
  /// A plug-in 'Demo' of version 1.
  PresetTest();
  ~PresetTest() override;

  /// Creates the wrapper and forgets what was asked on the way.
  void open();
  void openWithChunks();

  /// What saveToFXBData() writes. Fails the test where it does not answer true.
  std::string save(bool asBank);
  /// loadFromFXBData() of these bytes. The memory goes on behind them for `slack` bytes 0xEE, since some
  /// fields are read without a look at the size.
  bool load(const std::string& bytes, std::size_t slack = 512);
  /// The same with a size of the test's own.
  bool loadAs(const std::string& bytes, int size);

  Requests requests() const { return effect.requests(); }

  doubles::RecordingCoreFoundation core_foundation;
  doubles::InProcessPlugin plugin{core_foundation};
  doubles::RecordingEffect effect;
  std::unique_ptr<VSTWrapper> wrapper;
};

}  // namespace preset_tests
