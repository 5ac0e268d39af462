// SPDX-License-Identifier: MIT
// The host side of one plug-in instance.
//
// VSTWrapper owns an instance from its creation through the module's entry point until effClose (1). It turns
// the requests that the rest of the program makes into plain member functions. Nothing else talks to a
// plug-in, except for the few requests that the driver and the description send through `effect` themselves.
//
// Ownership: created only by New(), held by one owner, not copied. Keeps its module loaded.
// Failures:  New() returns null. An exception that a plug-in throws out of a request passes to the caller;
//            exceptions from the instance's getParameter and setParameter functions are swallowed. A failed
//            allocation throws the int -1.
// Counts:    numParams and numPrograms are read from the instance at each use, unless a comment says
//            otherwise.
// Threads:   the wrapper is used from one thread; only getParameter and setParameter may be called from
//            others. The plug-in may call masterCallback from any thread.
#pragma once

#include <cstdint>
#include <string>
#include <vector>

#include "loader/module_loader.h"
#include "loader/plugin_identity.h"
#include "support/auto_buffer.h"
#include "support/counted_handle.h"
#include "support/recursive_mutex.h"
#include "vst2/aeffect.h"
#include "vst2/preset_data.h"
#include "vst2/properties.h"
#include "vst2/speakers.h"

class KelVSTSupportEffect;

class VSTWrapper {
 public:
  // ---- Lifecycle ------------------------------------------------------------------------------------------

  /// Creates and opens an instance of `child` in `module`: 44100 Hz, blocks of 512 frames, program 0, all
  /// pins connected, switched off. The caller owns the wrapper and deletes it to close the instance.
  /// `support` is only stored and may be null. Returns null when there is no entry point, when the entry
  /// point returns null, or when anything is thrown; never throws.
  static VSTWrapper* New(NiduCOM::i_ptr<VSTPluginLoader> module, const VST_ChildSpec& child,
                         KelVSTSupportEffect* support);

  /// Switches the instance off (effMainsChanged, 12) if `mainsOn` is set, and closes it (effClose, 1). Lets
  /// exceptions from the plug-in pass, or swallows them while another exception is propagating.
  ~VSTWrapper() noexcept(false);

  VSTWrapper(const VSTWrapper&) = delete;
  VSTWrapper& operator=(const VSTWrapper&) = delete;

  // ---- Host callback --------------------------------------------------------------------------------------

  /// The function that every plug-in calls to reach this host (an audioMasterCallback). Opcodes:
  /// VstHostOpcode, and 'NIDU' for the host's own service. Answers 0 to any other opcode. Looks only at
  /// `opcode` and `ptr`.
  static VstIntPtr masterCallback(AEffect* effect, VstInt32 opcode, VstInt32 index, VstIntPtr value,
                                  void* ptr, float opt);

  /// The function that the host's own service returns: the track's sample position, always 0.0.
  static double trackSamplePosThunk(AEffect* effect);

  // ---- Basic queries and settings -------------------------------------------------------------------------

  /// The plug-in's category (effGetPlugCategory, 35), a VstPlugCategory value.
  VstInt32 getEffectCategory() const;

  /// Sets the sample rate in hertz (effSetSampleRate, 10); the plug-in receives a 32-bit float. Returns the
  /// plug-in's answer.
  VstInt32 setSampleRate(double rate);

  /// Sets the block size in sample frames (effSetBlockSize, 11). Returns the plug-in's answer.
  VstInt32 setBufferSize(int frames);

  /// Offers two arrangements, which the caller keeps owning; true when the plug-in's answer is not 0.
  /// On purpose: sends effGetSpeakerArrangement (69) and not effSetSpeakerArrangement (42), with the
  /// addresses of the records themselves. A plug-in may overwrite the records, so read nothing from them
  /// afterwards.
  bool setSpeakerArrangement(VstSpeakerArrangement* input, VstSpeakerArrangement* output);

  /// Asks for a pin's properties (effGetInputProperties, 33; effGetOutputProperties, 34); true when the
  /// plug-in's answer is not 0. The record is passed on as it is: clear it first. `index` is not checked.
  bool getInputProperties(int index, VstPinProperties& props);
  bool getOutputProperties(int index, VstPinProperties& props);

  /// The plug-in's name: its effect name (effGetEffectName, 45) if the answer is not 0, else its product
  /// string (effGetProductString, 48) if the answer is not 0, else the child's name for a shell child, else
  /// the name of the bundle.
  std::string getEffectName();

  /// The maker's name (effGetVendorString, 47), or "unknown" when the answer is 0.
  /// On purpose: a maker "Play" whose plug-in is called "Play" too becomes "EastWest".
  std::string getManufacturerName();

  /// Asks a shell for its next child (effShellGetNextPlugin, 70) and fills in `child`, whatever the answer.
  /// False when no child is left (the answer is 0).
  bool getNextShellPlugin(VST_ChildSpec& child);

  // ---- Parameters -----------------------------------------------------------------------------------------

  /// A parameter's value, read through the instance's getParameter function under the lock. Returns 0.0 for
  /// an index outside 0 to numParams - 1 (the plug-in is not called, no lock is taken), and when the plug-in
  /// throws.
  float getParameter(int index);

  /// Sets a parameter under the lock: reads the present value, and calls the instance's setParameter function
  /// only if it differs (0.0 and -0.0 are equal; a NaN always differs). An index outside 0 to numParams - 1
  /// does nothing. Exceptions from the plug-in are swallowed.
  void setParameter(int index, float value);

  /// A parameter's name (effGetParamName, 8), unit (effGetParamLabel, 6) and value as text
  /// (effGetParamDisplay, 7), whatever the plug-in answers. The index is passed on unchecked.
  std::string getParameterName(int index);
  std::string getParameterLabel(int index) const;
  std::string getParameterCurValueAsText(int index);

  /// Sets a parameter from text (effString2Parameter, 27). First asks with a null text whether the plug-in
  /// can do that; returns 0 if it answers 0, else its answer to the text.
  VstIntPtr setParameterCurValueFromText(int index, const char* text);

  /// Whether the host may automate the parameter (effCanBeAutomated, 26).
  bool isParameterAutomatable(int index) const;

  /// Asks for a parameter's properties (effGetParameterProperties, 56); true when the plug-in's answer is not
  /// 0. The record is passed on as it is: clear it first.
  bool getParameterProps(int index, VstParameterProperties& props);

  // ---- Programs -------------------------------------------------------------------------------------------

  /// Selects a program (effSetProgram, 2), clamped to 0 to numPrograms - 1. Sends nothing when there are no
  /// programs, or when `index`, before it is clamped, is what the plug-in answers to effGetProgram (3).
  void setCurrentProgram(int index);

  /// The current program's name (effGetProgramName, 5). Remembers it in storedProgramNames if no name is
  /// stored for that program yet.
  std::string getCurrentProgramName();

  /// A program's name, without selecting the program: for the current program as above; for another one from
  /// effGetProgramNameIndexed (29) if the answer is not 0, else the stored name, else "".
  /// On purpose: `index` is clamped to 0 to numPrograms, one past the last program.
  std::string getProgramName(int index);

  /// Renames the current program (effSetProgramName, 4; at most 24 characters are sent). Does nothing when
  /// `index` is another program, when the program already has this name, or when there are no programs.
  void changeProgramName(int index, const std::string& name);

  /// If the plug-in cannot name programs by index, selects every program in turn and stores its name. Then
  /// selects the program that was current and restores its name and parameter values.
  void updateStoredProgramNames();

  /// Saves the current program's name (64 bytes, zero-terminated) and every parameter value (32-bit floats in
  /// the machine's byte order) in `store`.
  /// On purpose: a negative numParams is not corrected. From -16 on there are just the 64 bytes of the name,
  /// below that the size is negative, which is a failed allocation (the int -1).
  void createTempParameterStore(AutoBuffer<char>& store);

  /// Restores name and values from a store, as many values as both the store and the plug-in have.
  /// On purpose: a store with another number of parameters is not refused.
  void restoreFromTempParameterStore(const AutoBuffer<char>& store);

  // ---- Preset and bank data -------------------------------------------------------------------------------

  /// Writes the state into `out` in the layout of fxp (one program) or fxb (bank) data: as a chunk if the
  /// plug-in has effFlagsProgramChunks, else as parameter values. Always true. The counts are read once, at
  /// the start; a parameter that no longer exists when its turn comes is saved as 0.0.
  /// On purpose: a negative numParams is not corrected. It is used in computing sizes and written in the
  /// count field of a program. A negative size is a failed allocation (the int -1); a size smaller than the
  /// header (56 bytes for a program, 156 for a bank) becomes that of the header. Where the programs of a bank
  /// get less than 56 bytes each, only the beginning of each one is written.
  bool saveToFXBData(AutoBuffer<char>& out, bool asBank);

  /// Checks fxp or fxb data of `size` bytes and passes it to the plug-in. False for data that is refused; if
  /// a bank is refused half-way, the programs loaded so far stay loaded.
  /// On purpose: sizes, counts and values inside the data may be read beyond `size`.
  bool loadFromFXBData(const void* data, int size);

  /// Copies the plug-in's chunk (effGetChunk, 23) into `out`: the program's with `isPreset`, else the bank's.
  /// Leaves `out` as it is if the plug-in has no effFlagsProgramChunks. Throws the int -1 for a size that is
  /// negative or more than an int holds.
  /// On purpose: a null chunk with a size crashes, like any other bad pointer from the plug-in.
  void getChunkData(AutoBuffer<char>& out, bool isPreset) const;

  /// Passes a chunk of `size` bytes to the plug-in (effSetChunk, 24) if it has effFlagsProgramChunks and
  /// `size` is at least 1. After a bank's chunk (not `isPreset`) runs updateStoredProgramNames().
  void setChunkData(const char* data, int size, bool isPreset);

  /// Fills one 'FxCk' block from the current program. `block` has room for 56 + 4 x numParams bytes, or for
  /// 56 if numParams is negative.
  void setParamsInProgramBlock(fxProgram* block);

  /// Loads one 'FxCk' block into the current program: name, then values. False if it is not such a block.
  /// On purpose: the block's count is not checked against the memory behind it.
  bool restoreProgramSettings(const fxProgram* block);

  /// Whether the form magic, in either byte order, is a bank's. Reads the first 12 bytes.
  static bool presetDataIsBankFormat(const char* data);

  /// The plug-in identifier in preset or bank data. Reads the first 20 bytes.
  static VstInt32 getEffectIDFromPresetData(const char* data);

  // ---- State ----------------------------------------------------------------------------------------------

  NiduCOM::i_ptr<VSTPluginLoader> loader;
  VST_ChildSpec childSpec;             ///< Which plug-in of the module this is.
  KelVSTSupportEffect* supportEffect;  ///< Stored for the caller; not owned, not used here.
  AEffect* effect = nullptr;           ///< The instance, owned by the plug-in; null only during construction.
  NiduCoreRecursiveMutex lock;         ///< Held around the instance's getParameter and setParameter.
  VstInt32 paramBeingSet = -1;         ///< Parameter that setParameter is passing to the plug-in; -1: none.
  bool bypassed = false;               ///< Set and cleared by the state test.
  bool mainsOn = false;                ///< Set and cleared by the state test; read by the destructor.
  bool hasCockosExtensions = false;    ///< The upper half of the answer to that effCanDo (51) was 0xBEEF.
  bool auxFlag = false;                ///< Never set; the description copies it.
  std::vector<std::string> storedProgramNames;  ///< By program index; an entry is written while it is empty.

  /// The identifier of the child that a shell is to create while New() runs; 0 at all other times.
  static VstInt32 gCurrentLoadID;

 private:
  VSTWrapper(const NiduCOM::i_ptr<VSTPluginLoader>& module, const VST_ChildSpec& child,
             KelVSTSupportEffect* support);

  void connectAllPins();
  [[nodiscard]] VstInt32 currentProgram() const;
  [[nodiscard]] VstInt32 parameterCount() const { return effect == nullptr ? 0 : effect->numParams; }
  [[nodiscard]] VstInt32 programCount() const;
  [[nodiscard]] bool hasChunks() const;

  void saveChunk(AutoBuffer<char>& out, bool asBank);
  void saveParameterBank(AutoBuffer<char>& out);
  void writeProgramBlock(char* block, VstInt32 parameters);
  bool loadParameterBank(const char* data, int size);
  void loadProgramValues(const char* block);
};
