// SPDX-License-Identifier: MIT
// For which architecture a shared object was made.
#include "platform/linux/elf_header.h"

#include <cstddef>

#include <elf.h>

#include "platform/linux/regular_file.h"

namespace core_foundation {
namespace {

// Class, byte order and machine stand at the same place in headers of both classes.
constexpr std::size_t kMachineOffsetInBytes = 18;
constexpr std::size_t kNeededInBytes = 20;

struct Architecture {
  unsigned machine;
  unsigned elfClass;
  unsigned byteOrder;
  const char* name;
};
constexpr Architecture kArchitectures[] = {
    {EM_X86_64, ELFCLASS64, ELFDATA2LSB, "x86_64"},   {EM_386, ELFCLASS32, ELFDATA2LSB, "i386"},
    {EM_X86_64, ELFCLASS32, ELFDATA2LSB, "x32"},      {EM_AARCH64, ELFCLASS64, ELFDATA2LSB, "aarch64"},
    {EM_ARM, ELFCLASS32, ELFDATA2LSB, "arm"},         {EM_LOONGARCH, ELFCLASS64, ELFDATA2LSB, "loongarch64"},
    {EM_MIPS, ELFCLASS32, ELFDATA2MSB, "mips"},       {EM_MIPS, ELFCLASS32, ELFDATA2LSB, "mipsel"},
    {EM_MIPS, ELFCLASS64, ELFDATA2LSB, "mips64el"},   {EM_PPC, ELFCLASS32, ELFDATA2MSB, "powerpc"},
    {EM_PPC64, ELFCLASS64, ELFDATA2MSB, "powerpc64"}, {EM_PPC64, ELFCLASS64, ELFDATA2LSB, "powerpc64le"},
    {EM_RISCV, ELFCLASS64, ELFDATA2LSB, "riscv64"},   {EM_S390, ELFCLASS32, ELFDATA2MSB, "s390"},
    {EM_S390, ELFCLASS64, ELFDATA2MSB, "s390x"},
};

}  // namespace

std::optional<std::string> architectureOfElf(std::string_view beginning) {
  if (beginning.size() < kNeededInBytes || beginning.substr(0, SELFMAG) != ELFMAG) return std::nullopt;
  const auto byteAt = [&](std::size_t i) -> unsigned { return static_cast<unsigned char>(beginning[i]); };
  const bool bigEndian = byteAt(EI_DATA) == ELFDATA2MSB;
  const unsigned low = byteAt(kMachineOffsetInBytes + (bigEndian ? 1 : 0));
  const unsigned high = byteAt(kMachineOffsetInBytes + (bigEndian ? 0 : 1));
  const unsigned machine = low | high << 8U;
  for (const Architecture& known : kArchitectures)
    if (known.machine == machine && known.elfClass == byteAt(EI_CLASS) && known.byteOrder == byteAt(EI_DATA))
      return known.name;
  return "machine " + std::to_string(machine);
}

const char* architectureOfProgram() {
#if defined(__x86_64__) && defined(__ILP32__)
  return "x32";
#elif defined(__x86_64__)
  return "x86_64";
#elif defined(__i386__)
  return "i386";
#elif defined(__aarch64__)
  return "aarch64";
#elif defined(__arm__)
  return "arm";
#elif defined(__riscv) && __riscv_xlen == 64
  return "riscv64";
#elif defined(__powerpc64__) && defined(__LITTLE_ENDIAN__)
  return "powerpc64le";
#elif defined(__powerpc64__)
  return "powerpc64";
#elif defined(__powerpc__)
  return "powerpc";
#else
#error "Name this architecture as its table row above does."
#endif
}

std::optional<std::string> architectureMismatch(const std::string& path) {
  const std::optional<std::string> beginning = beginningOfFile(path, kNeededInBytes);
  if (!beginning) return std::nullopt;
  const std::optional<std::string> architecture = architectureOfElf(*beginning);
  if (!architecture || *architecture == architectureOfProgram()) return std::nullopt;
  return path + " is for " + *architecture + ", this program is for " + architectureOfProgram();
}

}  // namespace core_foundation
