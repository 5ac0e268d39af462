// SPDX-License-Identifier: MIT
// The host side of one plug-in instance.
//
// VSTWrapper owns an instance from its creation through the module's entry point to effClose (1), and turns
// the requests that the rest of the program makes into plain member functions. Nothing else talks to a
// plug-in, but for the few requests that the driver and the description dispatch through `effect`.
//
// Ownership: made only by New(), held by one owner, not copied. Keeps its module loaded.
// Failures:  New() returns null. An exception that a plug-in throws out of a request passes to the caller,
//            but for getParameter and setParameter, which swallow it. Memory that cannot be had is the int
//            -1.
// Threads:   one. The plug-in may call masterCallback from threads of its own.
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
  /// pins connected, switched off. The caller owns it and deletes it to close the instance. Null when there
  /// is no entry point, when it yields no instance, or when anything is thrown on the way; never throws.
  static VSTWrapper* New(NiduCOM::i_ptr<VSTPluginLoader> module, const VST_ChildSpec& child,
                         KelVSTSupportEffect* support);

  /// Switches the instance off if it is on, and closes it. What the plug-in throws passes, unless another
  /// exception is under way.
  ~VSTWrapper() noexcept(false);

  VSTWrapper(const VSTWrapper&) = delete;
  VSTWrapper& operator=(const VSTWrapper&) = delete;

  // ---- Host callback --------------------------------------------------------------------------------------

  /// What every plug-in calls to reach this host (an audioMasterCallback). Opcodes: VstHostOpcode, and 'NIDU'
  /// for the vendor's own service. Answers 0 to what it does not know.
  static VstIntPtr masterCallback(AEffect* effect, VstInt32 opcode, VstInt32 index, VstIntPtr value,
                                  void* ptr, float opt);

  /// The function that the vendor's service hands out: the track's sample position, always 0.0.
  static double trackSamplePosThunk(AEffect* effect);

  // ---- Basic queries and settings -------------------------------------------------------------------------

  /// The plug-in's category (effGetPlugCategory, 35), a VstPlugCategory value.
  VstInt32 getEffectCategory() const;

  /// Sets the sample rate in hertz (effSetSampleRate, 10); the plug-in receives a 32-bit float. Returns its
  /// answer.
  VstInt32 setSampleRate(double rate);

  /// Sets the block size in sample frames (effSetBlockSize, 11). Returns the plug-in's answer.
  VstInt32 setBufferSize(int frames);

  /// Offers two arrangements, which stay the caller's; true when the answer is not 0.
  /// On purpose: sends effGetSpeakerArrangement (69), with the records themselves. A plug-in may write over
  /// them, so read nothing from them afterwards.
  bool setSpeakerArrangement(VstSpeakerArrangement* input, VstSpeakerArrangement* output);

  /// Asks for a pin's properties (effGetInputProperties, 33; effGetOutputProperties, 34); true when the
  /// answer is not 0. Clear the record before.
  bool getInputProperties(int index, VstPinProperties& props);
  bool getOutputProperties(int index, VstPinProperties& props);

  /// The plug-in's name: its effect name (effGetEffectName, 45), else its product string
  /// (effGetProductString, 48), else the child's name for a shell child, else the bundle's.
  std::string getEffectName();

  /// The maker's name (effGetVendorString, 47), or "unknown".
  std::string getManufacturerName();

  /// Asks a shell for its next child (effShellGetNextPlugin, 70) and fills `child` in, whatever the answer.
  /// False when there is none left.
  bool getNextShellPlugin(VST_ChildSpec& child);

  // ---- Parameters -----------------------------------------------------------------------------------------

  /// A parameter's value, through the instance's own function and under the lock. 0.0 for an index outside 0
  /// to numParams - 1 (nothing is asked), and when the plug-in throws.
  float getParameter(int index);

  /// Sets a parameter under the lock, if it does not hold exactly this value already. An index outside 0 to
  /// numParams - 1 does nothing; what the plug-in throws is swallowed.
  void setParameter(int index, float value);

  /// A parameter's name (effGetParamName, 8), unit (effGetParamLabel, 6) and value as text
  /// (effGetParamDisplay, 7), whatever the plug-in answers. The index is passed on unchecked.
  std::string getParameterName(int index);
  std::string getParameterLabel(int index) const;
  std::string getParameterCurValueAsText(int index);

  /// Sets a parameter from a text (effString2Parameter, 27). Asks first, with no text, whether the plug-in
  /// can; returns its answer, 0 when it cannot.
  VstIntPtr setParameterCurValueFromText(int index, const char* text);

  /// Whether the host may automate the parameter (effCanBeAutomated, 26).
  bool isParameterAutomatable(int index) const;

  /// Asks for a parameter's properties (effGetParameterProperties, 56); true when the answer is not 0. Clear
  /// the record before.
  bool getParameterProps(int index, VstParameterProperties& props);

  // ---- Programs -------------------------------------------------------------------------------------------

  /// Selects a program (effSetProgram, 2), clamped to 0 to numPrograms - 1. Sends nothing when `index` is the
  /// current program already, or when there are no programs.
  void setCurrentProgram(int index);

  /// The current program's name (effGetProgramName, 5). Remembers it in storedProgramNames, if no name is
  /// stored for that program yet.
  std::string getCurrentProgramName();

  /// A program's name without selecting it: the current one's as above, another's by effGetProgramNameIndexed
  /// (29), else the stored name, else "".
  /// On purpose: `index` is clamped to 0 to numPrograms, one past the last program.
  std::string getProgramName(int index);

  /// Renames the current program (effSetProgramName, 4; at most 24 characters are sent). Does nothing when
  /// `index` is another program, or when it has this name already.
  void changeProgramName(int index, const std::string& name);

  /// Visits every program and stores its name, where the plug-in cannot name programs by index. The current
  /// program, its name and its parameter values are as before afterwards.
  void updateStoredProgramNames();

  /// Saves the current program's name (64 bytes, zero-terminated) and every parameter value (32-bit floats in
  /// the machine's byte order) in `store`.
  void createTempParameterStore(AutoBuffer<char>& store);

  /// Puts a store back: name, then as many values as it holds and the plug-in takes.
  /// On purpose: a store of another number of parameters is not refused.
  void restoreFromTempParameterStore(const AutoBuffer<char>& store);

  // ---- Preset and bank data -------------------------------------------------------------------------------

  /// Writes the state into `out` in the layout of fxp (one program) or fxb (bank) data: as a chunk if the
  /// plug-in has effFlagsProgramChunks, else as parameter values. Always true. The counts are read once, at
  /// the start; a parameter that no longer exists when its turn comes is saved as 0.0.
  /// On purpose: a negative numParams is not corrected. It is used in computing sizes and written in the
  /// count field of a program. A negative size is a failed allocation (the int -1); a size smaller than the
  /// header (56 bytes for a program, 156 for a bank) becomes that of the header. Where the programs of a bank
  /// get less than 56 bytes each, only the beginning of each one is written.
  /// On purpose: a negative numParams is not corrected. From -16 on there are just the 64 bytes of the name,
  /// below that the size is negative, which is a failed allocation (the int -1).
  bool saveToFXBData(AutoBuffer<char>& out, bool asBank);

  /// Checks fxp or fxb data of `size` bytes and gives it to the plug-in. False for what is refused; a bank
  /// that is refused half-way leaves the programs loaded so far.
  bool loadFromFXBData(const void* data, int size);

  /// Copies the plug-in's chunk (effGetChunk, 23) into `out`: the program's with `isPreset`, else the bank's.
  /// Leaves `out` as it is if the plug-in has no effFlagsProgramChunks. Throws the int -1 for a size that is
  /// negative or more than an int holds.
  /// On purpose: a null chunk with a size crashes, like any other bad pointer from the plug-in.
  void getChunkData(AutoBuffer<char>& out, bool isPreset) const;

  /// Hands a chunk of `size` bytes to the plug-in (effSetChunk, 24), if it has chunks and `size` is at
  /// least 1.
  void setChunkData(const char* data, int size, bool isPreset);

  /// Fills one 'FxCk' block from the current program. `block` has room for 56 + 4 x numParams bytes.
  void setParamsInProgramBlock(fxProgram* block);

  /// Puts one 'FxCk' block into the current program. False when it is no such block.
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
  AEffect* effect = nullptr;           ///< The instance; null only during construction.
  NiduCoreRecursiveMutex lock;         ///< Held around the instance's getParameter and setParameter.
  VstInt32 paramBeingSet = -1;         ///< The parameter that setParameter is passing on, -1 when none.
  bool bypassed = false;               ///< Set and cleared by the state test.
  bool mainsOn = false;                ///< Set and cleared by the state test; read by the destructor.
  bool hasCockosExtensions = false;    ///< The plug-in knows the extension of that name.
  bool auxFlag = false;                ///< Set by nothing; the description copies it.
  std::vector<std::string> storedProgramNames;  ///< By program index; an entry is written while it is empty.

  /// The child identifier that a shell is to become, while New() runs; 0 at all other times.
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
