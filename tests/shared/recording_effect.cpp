// SPDX-License-Identifier: MIT
// How the recording instance records and answers, and keeps its programs and chunks.
#include "tests/shared/recording_effect.h"

#include <algorithm>
#include <cstring>
#include <iterator>
#include <utility>

namespace doubles {
namespace {

RecordingEffect& ownerOf(AEffect* effect) { return *static_cast<RecordingEffect*>(effect->object); }

VstIntPtr write(const std::string& bytes, void* ptr) {
  if (ptr == nullptr) return 0;
  std::memcpy(ptr, bytes.data(), bytes.size());
  return 1;
}

template <typename Map>
const typename Map::mapped_type* findByIndex(const Map& map, VstInt32 opcode, VstInt32 index) {
  auto found = map.find({opcode, index});
  if (found == map.end()) found = map.find({opcode, std::nullopt});
  return found == map.end() ? nullptr : &found->second;
}

}  // namespace

RecordingEffect::RecordingEffect() {
  aeffect.magic = kEffectMagic;
  aeffect.object = this;
  aeffect.dispatcher = [](AEffect* effect, VstInt32 opcode, VstInt32 index, VstIntPtr value, void* ptr,
                          float opt) { return ownerOf(effect).dispatched(opcode, index, value, ptr, opt); };
  aeffect.getParameter = [](AEffect* effect, VstInt32 index) { return ownerOf(effect).parameterRead(index); };
  aeffect.setParameter = [](AEffect* effect, VstInt32 index, float value) {
    ownerOf(effect).parameterWritten(index, value);
  };
}

// ---- Requests coming in ----

VstIntPtr RecordingEffect::dispatched(VstInt32 opcode, VstInt32 index, VstIntPtr value, void* ptr,
                                      float opt) {
  if (opcode == effClose) ++closings;
  received(receivedRequest(opcode, index, value, ptr, opt));
  const VstIntPtr result = ignored.count(opcode) > 0 ? 0 : perform(opcode, index, value, ptr);
  return scriptedAnswer(opcode, index).value_or(result);
}

float RecordingEffect::parameterRead(VstInt32 index) {
  received(getParameterOf(index));
  const std::vector<float> values = program(currentProgram).parameters;
  const auto position = static_cast<std::size_t>(index);
  return position < values.size() ? values[position] : 0.0f;
}

void RecordingEffect::parameterWritten(VstInt32 index, float value) {
  received(setParameterTo(index, value));
  if (index < 0 || index >= aeffect.numParams) return;
  const auto position = static_cast<std::size_t>(index);
  std::vector<float>& values = programs[currentProgram].parameters;
  if (position >= values.size()) values.resize(position + 1);
  values[position] = value;
}

void RecordingEffect::received(const Request& request) {
  {
    const std::lock_guard<std::mutex> guard(recording);
    recorded.push_back(request);
  }
  const auto hook = onRequest;  // A copy: the hook may replace itself.
  if (hook) hook(request);
}

VstIntPtr RecordingEffect::perform(VstInt32 opcode, VstInt32 index, VstIntPtr value, void* ptr) {
  if (const std::string* bytes = findByIndex(written, opcode, index)) return write(*bytes, ptr);
  switch (opcode) {
    case effClose:
      lentChunk = {};
      return 0;
    case effCanDo: {
      const auto found = capabilities.find(ptr == nullptr ? "" : static_cast<const char*>(ptr));
      return found == capabilities.end() ? 0 : found->second;
    }
    case effGetChunk:
      return lendChunk(index, ptr);
    case effSetChunk:
      return takeChunk(index, value, ptr);
    case effShellGetNextPlugin:
      return nextShellChild(ptr);
    default:
      return performOnPrograms(opcode, index, value, ptr);
  }
}

VstIntPtr RecordingEffect::performOnPrograms(VstInt32 opcode, VstInt32 index, VstIntPtr value, void* ptr) {
  switch (opcode) {
    case effSetProgram:
      if (value >= 0 && value < aeffect.numPrograms) currentProgram = static_cast<VstInt32>(value);
      return 0;
    case effGetProgram:
      return currentProgram;
    case effSetProgramName:
      if (ptr != nullptr) programs[currentProgram].name = static_cast<const char*>(ptr);
      return 0;
    case effGetProgramName:
      return write(program(currentProgram).name + '\0', ptr);
    case effGetProgramNameIndexed:
      if (!namesProgramsByIndex || index < 0 || index >= aeffect.numPrograms) return 0;
      return write(program(index).name + '\0', ptr);
    default:
      return 0;
  }
}

VstIntPtr RecordingEffect::nextShellChild(void* ptr) {
  if (nextChild == children.size()) {
    nextChild = 0;
    return 0;
  }
  const ShellChild& child = children[nextChild++];
  write(child.name + '\0', ptr);
  return child.id;
}

VstIntPtr RecordingEffect::lendChunk(VstInt32 index, void* ptr) {
  if ((aeffect.flags & effFlagsProgramChunks) == 0 || ptr == nullptr) return 0;
  const std::string& chunk = index == 0 ? bankChunk : programChunk;
  lentChunk = std::vector<char>(chunk.begin(), chunk.end());
  void* const start = lentChunk.data();
  std::memcpy(ptr, &start, sizeof start);
  return static_cast<VstIntPtr>(chunk.size());
}

VstIntPtr RecordingEffect::takeChunk(VstInt32 index, VstIntPtr size, const void* ptr) {
  if ((aeffect.flags & effFlagsProgramChunks) == 0 || ptr == nullptr || size < 0) return 0;
  (index == 0 ? bankChunk : programChunk)
      .assign(static_cast<const char*>(ptr), static_cast<std::size_t>(size));
  return 1;
}

std::optional<VstIntPtr> RecordingEffect::scriptedAnswer(VstInt32 opcode, VstInt32 index) {
  std::deque<VstIntPtr>& queue = nextAnswers[opcode];
  if (!queue.empty()) {
    const VstIntPtr number = queue.front();
    queue.pop_front();
    return number;
  }
  if (const VstIntPtr* number = findByIndex(answers, opcode, index)) return *number;
  return std::nullopt;
}

// ---- What was asked ----

std::vector<Request> RecordingEffect::requests() const {
  const std::lock_guard<std::mutex> guard(recording);
  return recorded;
}

std::vector<Request> RecordingEffect::requestsOf(std::initializer_list<VstEffectOpcode> opcodes) const {
  std::vector<Request> chosen;
  for (const Request& request : requestsOf(Request::Kind::kDispatch)) {
    if (std::find(opcodes.begin(), opcodes.end(), request.opcode) != opcodes.end()) chosen.push_back(request);
  }
  return chosen;
}

std::vector<Request> RecordingEffect::parameterReads() const {
  return requestsOf(Request::Kind::kGetParameter);
}

std::vector<Request> RecordingEffect::parameterWrites() const {
  return requestsOf(Request::Kind::kSetParameter);
}

std::vector<Request> RecordingEffect::requestsOf(Request::Kind kind) const {
  const std::vector<Request> all = requests();
  std::vector<Request> chosen;
  std::copy_if(all.begin(), all.end(), std::back_inserter(chosen),
               [kind](const Request& request) { return request.kind == kind; });
  return chosen;
}

void RecordingEffect::forget() {
  const std::lock_guard<std::mutex> guard(recording);
  recorded.clear();
}

// ---- What the test sets ----

void RecordingEffect::answerNext(VstEffectOpcode opcode, std::initializer_list<VstIntPtr> numbers) {
  std::deque<VstIntPtr>& queue = nextAnswers[opcode];
  queue.insert(queue.end(), numbers);
}

void RecordingEffect::setShellChildren(std::vector<ShellChild> offered) {
  children = std::move(offered);
  nextChild = 0;
}

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
