// SPDX-License-Identifier: MIT
// The fixture of the preset tests, and the requests that saving and loading consist of.
#include "tests/host/preset_fixture.h"

namespace preset_tests {

using doubles::getParameterOf;
using doubles::request;

Requests inOrder(const std::vector<Requests>& parts) {
  Requests whole;
  for (const Requests& part : parts) whole.insert(whole.end(), part.begin(), part.end());
  return whole;
}

Requests asksProgram() { return {request(effGetProgram)}; }
Requests asksName() { return {request(effGetProgramName), request(effGetProgram)}; }
Requests selects(VstIntPtr index) { return {request(effGetProgram), doubles::setProgram(index)}; }
Requests renames(const std::string& sent) { return inOrder({keepsName(), {doubles::setProgramName(sent)}}); }
Requests keepsName() { return inOrder({asksProgram(), asksProgram(), asksName()}); }

Requests readsParameters(VstInt32 count) {
  Requests reads;
  for (VstInt32 i = 0; i < count; ++i) reads.push_back(getParameterOf(i));
  return reads;
}

Requests sets(VstInt32 parameter, float value) {
  return {getParameterOf(parameter), doubles::setParameterTo(parameter, value)};
}

PresetTest::PresetTest() {
  effect.aeffect.uniqueID = 0x44656D6F;
  effect.aeffect.version = 1;
}

void PresetTest::openWithChunks() {
  effect.aeffect.flags |= 32;
  open();
}

std::string PresetTest::save(bool asBank) {
  AutoBuffer<char> out;
  EXPECT_TRUE(wrapper->saveToFXBData(out, asBank));
  return std::string(out.data(), static_cast<std::size_t>(out.size()));
}

bool PresetTest::load(const std::string& bytes, std::size_t slack) {
  const std::string memory = bytes + std::string(slack, '\xEE');
  return wrapper->loadFromFXBData(memory.data(), static_cast<int>(bytes.size()));
}

bool PresetTest::loadAs(const std::string& bytes, int size) {
  const std::string memory = bytes + std::string(512, '\xEE');
  return wrapper->loadFromFXBData(memory.data(), size);
}

}  // namespace preset_tests
