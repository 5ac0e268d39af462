// SPDX-License-Identifier: MIT
// The bytes of small module files of several systems: just enough of each format for a reader that looks for
// an exported entry point.
#pragma once

#include <cstdint>
#include <string>
#include <vector>

struct ElfForm {
  bool is64Bit = true;
  bool isBigEndian = false;
  std::uint16_t machine = 62;  ///< x86-64
  bool hasGnuHash = true;      ///< Otherwise the older hash table.
  std::string symbol = "VSTPluginMain";
  bool isDefined = true;
  unsigned symbolType = 2;      ///< A function; 1 is an object.
  std::uint16_t fileType = 3;   ///< A shared object; 2 is a program.
  bool hasInterpreter = false;  ///< As programs have that are position-independent.
};
std::string elfBytes(const ElfForm& form);

struct MachForm {
  bool is64Bit = true;
  bool isBigEndian = false;
  std::uint32_t processor = 0x01000007;  ///< x86-64
  std::uint32_t fileType = 8;            ///< A bundle; 2 is a program.
  std::string symbol = "_VSTPluginMain";
  unsigned symbolFlags = 0x0F;  ///< Defined in a section, external; 0x01 is one that is only asked for.
};
std::string machBytes(const MachForm& form);

/// One file with several images, with the 32-bit table of contents or the 64-bit one.
std::string fatMachBytes(const std::vector<std::string>& images, bool is64Bit);

struct PeForm {
  bool is64Bit = true;
  std::uint16_t machine = 0x8664;
  bool isLibrary = true;
  std::string symbol = "VSTPluginMain";
};
std::string peBytes(const PeForm& form);
