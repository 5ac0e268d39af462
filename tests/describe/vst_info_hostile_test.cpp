// SPDX-License-Identifier: MIT
// Descriptions of plug-ins that throw, or that state counts which cannot be true.
#include <climits>
#include <stdexcept>
#include <string>
#include <vector>

#include "describe/vst_info.h"
#include "gmock/gmock.h"
#include "tests/describe/described_plugin.h"

namespace {

using namespace doubles;
using KelVSTInfoCache::VSTInfo;
using testing::IsEmpty;

VST_Class_Spec bundleSpec() { return {VST_DLL_Info("/described.vst", "bundle"), VST_ChildSpec()}; }

class HostilePlugin : public DescribedPlugin {
 protected:
  int intThrownByDescribing() {
    try {
      const VSTInfo info(open(), bundleSpec());
    } catch (int thrown) {
      return thrown;
    }
    return 0;
  }
};

TEST_F(HostilePlugin, OfANegativeParameterCountHasNone) {
  effect.aeffect.numParams = -3;
  EXPECT_THAT(VSTInfo(open(), bundleSpec()).params, IsEmpty());
  effect.aeffect.numParams = INT_MIN;
  EXPECT_THAT(VSTInfo(open(), bundleSpec()).params, IsEmpty());
}

TEST_F(HostilePlugin, OfMoreParametersThanMemoryHoldsIsMinusOneBeforeTheFirstIsAsked) {
  effect.aeffect.numParams = INT_MAX;
  EXPECT_EQ(intThrownByDescribing(), -1);
  EXPECT_THAT(effect.parameterReads(), IsEmpty());
}

struct ThrowingCase {
  const char* name;
  VstEffectOpcode opcode;
};

void PrintTo(const ThrowingCase& throwing, std::ostream* stream) { *stream << throwing.name; }

class ThrowingPlugin : public HostilePlugin, public testing::WithParamInterface<ThrowingCase> {
 protected:
  void openWithTwoParameters() {
    effect.setParameters({0.5F, 0.25F});
    open();
  }
};

TEST_P(ThrowingPlugin, PassesItsIntOn) {
  openWithTwoParameters();
  effect.onRequest = [](const Request& received) {
    if (received.kind == Request::Kind::kDispatch && received.opcode == GetParam().opcode) throw 42;
  };
  try {
    const VSTInfo info(wrapper.get(), bundleSpec());
    ADD_FAILURE() << "nothing was thrown";
  } catch (int thrown) {
    EXPECT_EQ(thrown, 42);
  }
  EXPECT_EQ(effect.requestsOf(GetParam().opcode).size(), 1U);
}

TEST_P(ThrowingPlugin, PassesItsExceptionOn) {
  openWithTwoParameters();
  effect.onRequest = [](const Request& received) {
    if (received.kind == Request::Kind::kDispatch && received.opcode == GetParam().opcode) {
      throw std::runtime_error("from the plug-in");
    }
  };
  EXPECT_THROW(VSTInfo(wrapper.get(), bundleSpec()), std::runtime_error);
}

INSTANTIATE_TEST_SUITE_P(Questions, ThrowingPlugin,
                         testing::ValuesIn(std::vector<ThrowingCase>{
                             {"EffectName", effGetEffectName},
                             {"VendorString", effGetVendorString},
                             {"VstVersion", effGetVstVersion},
                             {"PlugCategory", effGetPlugCategory},
                             {"CanDo", effCanDo},
                             {"ParamName", effGetParamName},
                             {"ParamLabel", effGetParamLabel},
                             {"CanBeAutomated", effCanBeAutomated},
                             {"ParameterProperties", effGetParameterProperties},
                         }),
                         [](const auto& tested) { return tested.param.name; });

}  // namespace
