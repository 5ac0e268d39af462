// SPDX-License-Identifier: MIT
// A wrapper around the recording instance, for tests of what it asks the plug-in.
//
//   effect.setParameters({0.25f});
//   open();
//   wrapper->setParameter(0, 0.5f);
//   EXPECT_THAT(effect.requests(), ElementsAre(getParameterOf(0), setParameterTo(0, 0.5f)));
#pragma once

#include <functional>
#include <memory>
#include <string>
#include <vector>

#include "gmock/gmock.h"
#include "gtest/gtest.h"
#include "host/vst_wrapper.h"
#include "tests/host/named_case.h"
#include "tests/shared/in_process_plugin.h"
#include "tests/shared/recording_core_foundation.h"
#include "tests/shared/recording_effect.h"

namespace host_tests {

/// A type of exception that a plug-in may throw.
struct Thrown {
  const char* name;
  void (*raise)();
};

/// An int, a std::exception, a struct, a text.
const std::vector<Thrown>& everyThrown();

constexpr auto isWrite = [](const doubles::Request& request) {
  return request.kind == doubles::Request::Kind::kSetParameter;
};

class WrapperTest : public testing::Test {
 protected:
  /// Loads the module that holds the plug-in.
  WrapperTest();
  ~WrapperTest() override;

  /// VSTWrapper::New() with this module.
  std::unique_ptr<VSTWrapper> create(const VST_ChildSpec& child = VST_ChildSpec(),
                                     KelVSTSupportEffect* support = nullptr);

  /// Creates the wrapper around `effect` and forgets the requests made meanwhile.
  VSTWrapper* open(const VST_ChildSpec& child = VST_ChildSpec());

  /// Deletes the wrapper, and not through the smart pointer, which lets no exception pass.
  void close();

  /// From now on: throws the int 7 out of every request with this opcode.
  void throwAt(VstEffectOpcode opcode);

  doubles::RecordingCoreFoundation core_foundation;
  doubles::InProcessPlugin plugin{core_foundation};
  doubles::RecordingEffect effect;
  NiduCOM::i_ptr<VSTPluginLoader> module;  ///< Named "The Module"; this is the one reference to it.
  std::unique_ptr<VSTWrapper> wrapper;
};

}  // namespace host_tests
