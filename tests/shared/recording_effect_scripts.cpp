// SPDX-License-Identifier: MIT
// How a test tells the recording instance what to answer.
#include <algorithm>
#include <cstring>
#include <deque>
#include <optional>
#include <string>
#include <utility>

#include "tests/shared/recording_effect.h"

namespace doubles {
namespace {

std::string withTerminator(const std::string& text) { return text + '\0'; }

template <typename Record>
std::string bytesOf(const Record& record) {
  std::string bytes(sizeof record, '\0');
  std::memcpy(bytes.data(), &record, sizeof record);
  return bytes;
}

}  // namespace

void RecordingEffect::answer(VstEffectOpcode opcode, VstIntPtr number) {
  answers[{opcode, std::nullopt}] = number;
}

void RecordingEffect::answerAt(VstEffectOpcode opcode, VstInt32 index, VstIntPtr number) {
  answers[{opcode, index}] = number;
}

void RecordingEffect::answerNext(VstEffectOpcode opcode, std::initializer_list<VstIntPtr> numbers) {
  std::deque<VstIntPtr>& queue = nextAnswers[opcode];
  queue.insert(queue.end(), numbers);
}

void RecordingEffect::setText(VstEffectOpcode opcode, const std::string& text) {
  written[{opcode, std::nullopt}] = withTerminator(text);
}

void RecordingEffect::setTextAt(VstEffectOpcode opcode, VstInt32 index, const std::string& text) {
  written[{opcode, index}] = withTerminator(text);
}

void RecordingEffect::setUnterminatedText(VstEffectOpcode opcode, std::size_t size, char fill) {
  written[{opcode, std::nullopt}] = std::string(size, fill);
}

void RecordingEffect::setCapability(const std::string& capability, VstIntPtr number) {
  capabilities[capability] = number;
}

void RecordingEffect::setParameterProperties(VstInt32 parameter, const VstParameterProperties& properties) {
  written[{effGetParameterProperties, parameter}] = bytesOf(properties);
}

void RecordingEffect::setInputProperties(VstInt32 pin, const VstPinProperties& properties) {
  written[{effGetInputProperties, pin}] = bytesOf(properties);
}

void RecordingEffect::setOutputProperties(VstInt32 pin, const VstPinProperties& properties) {
  written[{effGetOutputProperties, pin}] = bytesOf(properties);
}

void RecordingEffect::setShellChildren(std::vector<ShellChild> offered) {
  children = std::move(offered);
  nextChild = 0;
}

void RecordingEffect::ignore(VstEffectOpcode opcode) { ignored.insert(opcode); }

void RecordingEffect::setPrograms(std::vector<Program> replacement) {
  programs.clear();
  std::size_t mostParameters = 0;
  for (std::size_t i = 0; i < replacement.size(); ++i) {
    mostParameters = std::max(mostParameters, replacement[i].parameters.size());
    programs[static_cast<VstInt32>(i)] = std::move(replacement[i]);
  }
  currentProgram = 0;
  aeffect.numPrograms = static_cast<VstInt32>(replacement.size());
  aeffect.numParams = static_cast<VstInt32>(mostParameters);
}

void RecordingEffect::setParameters(std::vector<float> values) {
  aeffect.numParams = static_cast<VstInt32>(values.size());
  programs[currentProgram].parameters = std::move(values);
}

Program RecordingEffect::program(VstInt32 index) const {
  const auto found = programs.find(index);
  return found == programs.end() ? Program{} : found->second;
}

}  // namespace doubles
