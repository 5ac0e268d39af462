// SPDX-License-Identifier: MIT
// One request that a host made of a plug-in instance, as a value: compared with ==, printed by GoogleTest.
//
// RecordingEffect records them; tests make the expected ones:
//   EXPECT_THAT(effect.requests(), ElementsAre(connectInput(1), connectInput(0), canDo("offline")));
// A failing expectation prints them as effConnectInput(index 1, value 1), effCanDo("offline").
#pragma once

#include <cstddef>
#include <iosfwd>
#include <string>

#include "vst2/basic_types.h"
#include "vst2/effect_opcodes.h"

namespace doubles {

/// What a request's pointer pointed at when the request came in.
struct Pointee {
  enum class Kind {
    kNull,     ///< The pointer was null.
    kText,     ///< A text for the plug-in to read (opcodes 4, 27, 51), without its zero byte.
    kBytes,    ///< Data for the plug-in to read (opcode 24); the request's value is the size.
    kRoom,     ///< Memory for the plug-in to fill: a text buffer, a record, a pointer to a chunk.
    kAddress,  ///< Anything else; only the address is known.
  };
  Kind kind = Kind::kNull;
  std::string content;        ///< kText, kBytes.
  std::size_t roomSize = 0;   ///< kRoom: the size in bytes, known from the opcode.
  std::size_t zeroBytes = 0;  ///< kRoom: how many of these bytes were zero.
  /// The pointer itself, valid during the request. Compared only for kAddress.
  void* address = nullptr;

  bool operator==(const Pointee& other) const;
};

/// A call of the dispatcher, or of one of the two parameter functions.
struct Request {
  enum class Kind { kDispatch, kGetParameter, kSetParameter };
  Kind kind = Kind::kDispatch;
  VstInt32 opcode = 0;  ///< VstEffectOpcode; 0 for the parameter functions.
  VstInt32 index = 0;
  VstIntPtr value = 0;
  Pointee pointee = {};
  float opt = 0.0f;  ///< For setParameter: the value.

  /// Compares opt bit by bit: -0 differs from 0, and a NaN equals itself.
  bool operator==(const Request& other) const;
  bool operator!=(const Request& other) const { return !(*this == other); }

  /// This request with a room of which only `zeroBytes` bytes are zero: the host did not clear it.
  Request withZeroBytes(std::size_t zeroBytes) const;
};

void PrintTo(const Request& request, std::ostream* stream);

/// The request that a dispatcher call makes. Reads the whole room that `ptr` points to if the opcode has one:
/// 256 bytes for opcodes 5, 6, 7, 29; 500 for 8; 114 for 45, 47, 48, 70; 128 for 33, 34; 152 for 56; the size
/// of a pointer for 23.
Request receivedRequest(VstInt32 opcode, VstInt32 index, VstIntPtr value, void* ptr, float opt);

// ---- Expected requests ----

/// Any request without text or data. If the opcode has a room, all its bytes are expected to be zero.
Request request(VstEffectOpcode opcode, VstInt32 index = 0, VstIntPtr value = 0, float opt = 0.0f);

Request setProgram(VstIntPtr program);                  ///< effSetProgram (2)
Request setProgramName(const std::string& name);        ///< effSetProgramName (4)
Request programNameIndexed(VstInt32 program);           ///< effGetProgramNameIndexed (29), value -1
Request connectInput(VstInt32 pin, VstIntPtr on = 1);   ///< effConnectInput (31)
Request canDo(const std::string& capability);           ///< effCanDo (51)
Request canParameterBeSetFromText(VstInt32 parameter);  ///< effString2Parameter (27) with a null text
Request setParameterFromText(VstInt32 parameter, const std::string& text);  ///< effString2Parameter (27)
Request getChunk(VstInt32 index);                            ///< effGetChunk (23): 0 bank, 1 program
Request setChunk(VstInt32 index, const std::string& bytes);  ///< effSetChunk (24): 0 bank, 1 program
/// effGetSpeakerArrangement (69): `input` is the request's value, `output` its pointer.
Request speakerArrangement(const void* input, const void* output);
Request getParameterOf(VstInt32 parameter);               ///< The instance's getParameter function.
Request setParameterTo(VstInt32 parameter, float value);  ///< The instance's setParameter function.

}  // namespace doubles
