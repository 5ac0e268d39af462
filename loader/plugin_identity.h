// SPDX-License-Identifier: MIT
// The records that name a plug-in: its bundle, and the child when the bundle is a shell with several
// plug-ins.
//
// Plain values, copied freely; each owns its strings. putTo writes a record to an INiduStream and getFrom
// reads it. When the stream fails, its NiduException reaches the caller; fields that were read before the
// failure have their new values, the others their old ones.
#pragma once

#include <cstdint>
#include <string>

class INiduStream;

/// Which plug-in inside a bundle is wanted.
struct VST_loadID {
  /// Order of values: bool hasChildID, int32 childID.
  void putTo(INiduStream* stream) const;
  void getFrom(INiduStream* stream);

  bool hasChildID = false;   ///< True when one child of a shell is wanted.
  std::int32_t childID = 0;  ///< Meaningful only with hasChildID.
};

/// A VST_loadID with a name to show. Ordered by child, with "no child" first (see operator<).
struct VST_ChildSpec : VST_loadID {
  VST_ChildSpec() = default;
  /// The child with this identifier; 0 is one like any other.
  explicit VST_ChildSpec(int id) : VST_loadID{true, id} {}
  explicit VST_ChildSpec(const VST_loadID& loadID) : VST_loadID(loadID) {}

  /// Order of values: the VST_loadID, string childName.
  void putTo(INiduStream* stream) const;
  void getFrom(INiduStream* stream);

  std::string childName;  ///< Empty until the children of the shell are enumerated.
};

/// Orders by signed child identifier; a spec without a child comes before every spec with one.
/// On purpose: the name is not compared, so a set holds one entry for each child and one without a child.
bool operator<(const VST_ChildSpec& a, const VST_ChildSpec& b);

/// One bundle on disk.
/// On purpose: the destructor is not virtual; objects are always destroyed through their own type.
class VST_DLL_Info {
 public:
  VST_DLL_Info(std::string bundlePath, const char* name);

  /// Order of values: string path, string effectName, int32 of dllTag's low 32 bits.
  /// On purpose: the 64-bit dllTag is written as 32 bits and read back sign-extended.
  virtual void putTo(INiduStream* stream) const;
  virtual void getFrom(INiduStream* stream);

  std::string path;         ///< UTF-8, as given on the command line.
  std::int64_t dllTag = 0;  ///< Copied and streamed, never interpreted.
  std::string effectName;   ///< The driver passes "test".
};

/// One plug-in that can be instantiated: a bundle and a child.
class VST_Class_Spec : public VST_DLL_Info {
 public:
  VST_Class_Spec(const VST_DLL_Info& bundle, const VST_ChildSpec& childSpec);

  /// Order of values: the bundle part, the child part.
  void putTo(INiduStream* stream) const override;
  /// On purpose: the inherited overload reads the bundle part only and leaves the child part unchanged.
  using VST_DLL_Info::getFrom;
  /// Reads both parts. The version is ignored.
  virtual void getFrom(INiduStream* stream, int version);

  /// The child's name when a child is named, else the bundle's. A reference into this record.
  [[nodiscard]] const std::string& getEffectName() const;

  VST_ChildSpec child;
};
