// SPDX-License-Identifier: MIT
// A plug-in instance inside the test program: records every request, and answers as the test told it to.
//
//   RecordingEffect effect;
//   effect.aeffect.numInputs = 2;
//   effect.setPrograms({{"Soft", {0.1f, 0.2f}}, {"Loud", {0.8f, 0.9f}}});
//   effect.setText(effGetVendorString, "Play");
//   ... code under test makes requests of &effect.aeffect ...
//   EXPECT_THAT(effect.requestsOf(effConnectInput), ElementsAre(connectInput(1), connectInput(0)));
//
// For each request, in this order: it is recorded; onRequest runs, and what it throws reaches the host; the
// text, record, program or chunk for it takes effect. The answer is the scripted number if there is one,
// otherwise the one that belongs to the effect, otherwise 0.
//
// Ownership: the test owns the instance, also after effClose (1); later requests are still recorded. The
//            processing functions are null: the program never calls them.
// Threads:   requests may come from several threads; everything else is for one thread.
#pragma once

#include <deque>
#include <functional>
#include <initializer_list>
#include <map>
#include <mutex>
#include <optional>
#include <set>
#include <string>
#include <utility>
#include <vector>

#include "tests/shared/request.h"
#include "vst2/aeffect.h"
#include "vst2/effect_opcodes.h"
#include "vst2/properties.h"

namespace doubles {

/// One of the instance's programs: its name and the values of its parameters (0 for those beyond the vector).
struct Program {
  std::string name;
  std::vector<float> parameters;
};

/// One of the plug-ins that a shell lists.
struct ShellChild {
  VstInt32 id;
  std::string name;
};

class RecordingEffect {
 public:
  RecordingEffect();
  RecordingEffect(const RecordingEffect&) = delete;
  RecordingEffect& operator=(const RecordingEffect&) = delete;

  /// What the host gets. Tests set its counts, flags, uniqueID and version.
  AEffect aeffect{};

  // ---- What was asked ----

  /// Everything asked since the start or the last forget(), in order.
  std::vector<Request> requests() const;
  /// Only the dispatcher calls with one of these opcodes.
  std::vector<Request> requestsOf(VstEffectOpcode opcode) const { return requestsOf({opcode}); }
  std::vector<Request> requestsOf(std::initializer_list<VstEffectOpcode> opcodes) const;
  /// Only the calls of getParameter, or of setParameter.
  std::vector<Request> parameterReads() const;
  std::vector<Request> parameterWrites() const;
  /// Clears the list of requests. Everything else stays.
  void forget();
  /// The number of effClose (1) requests; forget() does not reset it.
  int timesClosed() const { return closings; }
  bool closed() const { return closings > 0; }

  /// Runs in every request after recording and before the answer is chosen. It may throw, script answers,
  /// change aeffect, make further requests, or write to request.pointee.address.
  std::function<void(const Request&)> onRequest;

  // ---- Scripted answers ----

  /// The number to answer to an opcode, for any index or for one. Texts and records are still written.
  void answer(VstEffectOpcode opcode, VstIntPtr number) { answers[{opcode, std::nullopt}] = number; }
  void answerAt(VstEffectOpcode opcode, VstInt32 index, VstIntPtr number) {
    answers[{opcode, index}] = number;
  }
  /// The numbers to answer to the next requests with this opcode; they take precedence over the ones above.
  void answerNext(VstEffectOpcode opcode, std::initializer_list<VstIntPtr> numbers);

  /// The text to write for an opcode, for any index or for one; the answer is 1.
  void setText(VstEffectOpcode opcode, const std::string& text) {
    written[{opcode, std::nullopt}] = text + '\0';
  }
  void setTextAt(VstEffectOpcode opcode, VstInt32 index, const std::string& text) {
    written[{opcode, index}] = text + '\0';
  }
  /// Writes `size` bytes `fill` without a zero byte, whatever the size of the host's buffer.
  void setUnterminatedText(VstEffectOpcode opcode, std::size_t size, char fill = 'x') {
    written[{opcode, std::nullopt}] = std::string(size, fill);
  }

  /// The answer to effCanDo (51) for one capability; 0 for all others.
  void setCapability(const std::string& capability, VstIntPtr number) { capabilities[capability] = number; }

  /// The records to write for opcodes 56, 33 and 34; the answer is 1. They are written even if the scripted
  /// answer is 0, as some plug-ins do.
  void setParameterProperties(VstInt32 parameter, const VstParameterProperties& properties) {
    written[{effGetParameterProperties, parameter}] = bytesOf(properties);
  }
  void setInputProperties(VstInt32 pin, const VstPinProperties& properties) {
    written[{effGetInputProperties, pin}] = bytesOf(properties);
  }
  void setOutputProperties(VstInt32 pin, const VstPinProperties& properties) {
    written[{effGetOutputProperties, pin}] = bytesOf(properties);
  }

  /// What effShellGetNextPlugin (70) answers: one child per call, then 0 without a text, then the first
  /// again.
  void setShellChildren(std::vector<ShellChild> offered);

  /// Requests with this opcode are recorded and answered, but change and write nothing.
  void ignore(VstEffectOpcode opcode) { ignored.insert(opcode); }

  // ---- Programs, parameters, chunks ----

  /// Replaces all programs, selects program 0, and sets aeffect.numPrograms and numParams. effSetProgram (2)
  /// selects if 0 <= value < numPrograms, effGetProgram (3) answers the selected one, effSetProgramName (4)
  /// renames it, effGetProgramName (5) writes its name. Without programs there are still one set of
  /// parameters and one name.
  void setPrograms(std::vector<Program> replacement);
  /// Replaces the values of the selected program, and sets aeffect.numParams.
  void setParameters(std::vector<float> values);
  /// The current state of a program; empty for a number that was never set.
  Program program(VstInt32 index) const;
  VstInt32 currentProgram = 0;
  /// Whether effGetProgramNameIndexed (29) writes names, for 0 <= index < numPrograms. It answers 0
  /// otherwise.
  bool namesProgramsByIndex = false;

  /// State for effGetChunk (23) and effSetChunk (24): index 0 is the bank, any other index the program.
  /// Without effFlagsProgramChunks both requests answer 0 and do nothing. The memory that effGetChunk
  /// returns is valid until the next effGetChunk or effClose.
  std::string bankChunk;
  std::string programChunk;

 private:
  // Values by opcode and index; an entry for one index takes precedence over the entry for any index.
  template <typename Value>
  using ByIndex = std::map<std::pair<VstInt32, std::optional<VstInt32>>, Value>;

  template <typename Record>
  static std::string bytesOf(const Record& record) {
    return {reinterpret_cast<const char*>(&record), sizeof record};
  }

  VstIntPtr dispatched(VstInt32 opcode, VstInt32 index, VstIntPtr value, void* ptr, float opt);
  float parameterRead(VstInt32 index);
  void parameterWritten(VstInt32 index, float value);

  void received(const Request& request);
  VstIntPtr perform(VstInt32 opcode, VstInt32 index, VstIntPtr value, void* ptr);
  VstIntPtr performOnPrograms(VstInt32 opcode, VstInt32 index, VstIntPtr value, void* ptr);
  VstIntPtr nextShellChild(void* ptr);
  VstIntPtr lendChunk(VstInt32 index, void* ptr);
  VstIntPtr takeChunk(VstInt32 index, VstIntPtr size, const void* ptr);
  std::optional<VstIntPtr> scriptedAnswer(VstInt32 opcode, VstInt32 index);
  std::vector<Request> requestsOf(Request::Kind kind) const;

  mutable std::mutex recording;
  std::vector<Request> recorded;
  int closings = 0;

  ByIndex<VstIntPtr> answers;
  std::map<VstInt32, std::deque<VstIntPtr>> nextAnswers;
  ByIndex<std::string> written;  // The bytes to write: texts with their zero byte, and records.
  std::map<std::string, VstIntPtr> capabilities;
  std::set<VstInt32> ignored;
  std::vector<ShellChild> children;
  std::size_t nextChild = 0;
  std::map<VstInt32, Program> programs;
  std::vector<char> lentChunk;
};

}  // namespace doubles
