// SPDX-License-Identifier: MIT
// The architecture in an ELF header, and the first bytes of other formats.
#include "platform/linux/file_kind.h"

#include <cstddef>
#include <cstdio>
#include <memory>
#include <string_view>

#include <elf.h>

namespace core_foundation {
namespace {

// Class, byte order and machine have the same offsets in ELF headers of both classes.
constexpr std::size_t kMachineOffset = 18;
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

struct Format {
  std::string_view firstBytes;
  const char* name;
};
// Modules for macOS come in both word sizes, each in both byte orders, and several of them in one file.
constexpr Format kOtherFormats[] = {
    {"\xCE\xFA\xED\xFE", "a module for macOS"},
    {"\xCF\xFA\xED\xFE", "a module for macOS"},
    {"\xFE\xED\xFA\xCE", "a module for macOS"},
    {"\xFE\xED\xFA\xCF", "a module for macOS"},
    {"\xCA\xFE\xBA\xBE", "a module for macOS"},
    {"\xCA\xFE\xBA\xBF", "a module for macOS"},
    {"MZ", "a module for Windows"},
    {"!<arch>\n", "a static library"},
    {"#!", "a script"},
};

// The first bytes of the file at `path`, at most kNeededInBytes; empty when it cannot be read.
std::string beginningOf(const std::string& path) {
  const std::unique_ptr<std::FILE, int (*)(std::FILE*)> file(std::fopen(path.c_str(), "rbe"), &std::fclose);
  char bytes[kNeededInBytes];
  return file ? std::string(bytes, std::fread(bytes, 1, sizeof bytes, file.get())) : std::string();
}

bool beginsWith(std::string_view text, std::string_view beginning) {
  return text.substr(0, beginning.size()) == beginning;
}

// The name of the architecture in an ELF header; "machine N" for one that the table does not have.
std::string architectureOf(std::string_view elfHeader) {
  const auto byteAt = [&](std::size_t i) -> unsigned { return static_cast<unsigned char>(elfHeader[i]); };
  const bool bigEndian = byteAt(EI_DATA) == ELFDATA2MSB;
  const unsigned low = byteAt(kMachineOffset + (bigEndian ? 1 : 0));
  const unsigned high = byteAt(kMachineOffset + (bigEndian ? 0 : 1));
  const unsigned machine = low | high << 8U;
  for (const Architecture& known : kArchitectures)
    if (known.machine == machine && known.elfClass == byteAt(EI_CLASS) && known.byteOrder == byteAt(EI_DATA))
      return known.name;
  return "machine " + std::to_string(machine);
}

}  // namespace

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
#error "Add this architecture, with its name from the table above."
#endif
}

std::optional<std::string> whyNotForThisProgram(const std::string& path) {
  const std::string beginning = beginningOf(path);
  if (beginning.size() == kNeededInBytes && beginsWith(beginning, {ELFMAG, SELFMAG})) {
    const std::string architecture = architectureOf(beginning);
    if (architecture == architectureOfProgram()) return std::nullopt;
    return path + " is for " + architecture + ", this program is for " + architectureOfProgram();
  }
  for (const Format& format : kOtherFormats)
    if (beginsWith(beginning, format.firstBytes))
      return path + " is " + format.name + ", not a shared object for Linux";
  return std::nullopt;
}

}  // namespace core_foundation
