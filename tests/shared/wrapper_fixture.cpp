// SPDX-License-Identifier: MIT
// The fixture of the wrapper tests.
#include "tests/shared/wrapper_fixture.h"

#include <stdexcept>

namespace host_tests {
namespace {

struct NotAnException {
  int code;
};

}  // namespace

const std::vector<Thrown>& everyThrown() {
  static const std::vector<Thrown> all = {
      {"AnInt", [] { throw 7; }},
      {"AStdException", [] { throw std::runtime_error("from the plug-in"); }},
      {"AStruct", [] { throw NotAnException{7}; }},
      {"AText", [] { throw "from the plug-in"; }},
  };
  return all;
}

WrapperTest::WrapperTest() {
  const VST_DLL_Info identity("/test.vst", "The Module");
  module.reset(new VSTPluginLoader(identity), NiduCOM::AddRef::kAdopt);
}

WrapperTest::~WrapperTest() {
  // The hook refers to variables of the test, which no longer exist; closing is a request too.
  effect.onRequest = nullptr;
}

std::unique_ptr<VSTWrapper> WrapperTest::create(const VST_ChildSpec& child, KelVSTSupportEffect* support) {
  return std::unique_ptr<VSTWrapper>(VSTWrapper::New(module, child, support));
}

VSTWrapper* WrapperTest::open(const VST_ChildSpec& child) {
  plugin.willCreate(effect);
  wrapper = create(child);
  EXPECT_NE(wrapper, nullptr);
  effect.forget();
  return wrapper.get();
}

void WrapperTest::close() { delete wrapper.release(); }

void WrapperTest::throwAt(VstEffectOpcode opcode) {
  effect.onRequest = [opcode](const doubles::Request& request) {
    if (request.kind == doubles::Request::Kind::kDispatch && request.opcode == opcode) throw 7;
  };
}

}  // namespace host_tests
