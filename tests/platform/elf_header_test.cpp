// SPDX-License-Identifier: MIT
// Architectures in ELF headers, byte by byte.
#include <optional>
#include <string>

#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include "platform/linux/elf_header.h"
#include "tests/platform/temporary_folder.h"

namespace {

// The first 20 bytes of a shared object. `elfClass` is 1 for 32 bits and 2 for 64; `byteOrder` 1 for little
// endian and 2 for big; the machine's two bytes stand in file order.
std::string header(char elfClass, char byteOrder, char machineFirst, char machineSecond) {
  std::string bytes =
      "\x7F"
      "ELF";
  bytes += elfClass;
  bytes += byteOrder;
  bytes += '\x01';
  bytes.resize(16, '\0');
  bytes += byteOrder == 1 ? std::string("\x03\0", 2) : std::string("\0\x03", 2);
  bytes += machineFirst;
  bytes += machineSecond;
  return bytes;
}

struct ElfCase {
  const char* name;
  std::string beginning;
  std::optional<std::string> architecture;
};
class ArchitectureOfElf : public testing::TestWithParam<ElfCase> {};

TEST_P(ArchitectureOfElf, IsNamed) {
  EXPECT_EQ(core_foundation::architectureOfElf(GetParam().beginning), GetParam().architecture);
}

INSTANTIATE_TEST_SUITE_P(
    Table, ArchitectureOfElf,
    testing::Values(
        ElfCase{"I386", header(1, 1, 3, 0), "i386"}, ElfCase{"X8664", header(2, 1, 62, 0), "x86_64"},
        ElfCase{"X32", header(1, 1, 62, 0), "x32"}, ElfCase{"Arm", header(1, 1, 40, 0), "arm"},
        ElfCase{"Aarch64", header(2, 1, '\xB7', 0), "aarch64"},
        ElfCase{"Loongarch64", header(2, 1, 2, 1), "loongarch64"},
        ElfCase{"Mips", header(1, 2, 0, 8), "mips"}, ElfCase{"Mipsel", header(1, 1, 8, 0), "mipsel"},
        ElfCase{"Mips64el", header(2, 1, 8, 0), "mips64el"},
        ElfCase{"Powerpc", header(1, 2, 0, 20), "powerpc"},
        ElfCase{"Powerpc64", header(2, 2, 0, 21), "powerpc64"},
        ElfCase{"Powerpc64le", header(2, 1, 21, 0), "powerpc64le"},
        ElfCase{"Riscv64", header(2, 1, '\xF3', 0), "riscv64"}, ElfCase{"S390", header(1, 2, 0, 22), "s390"},
        ElfCase{"S390x", header(2, 2, 0, 22), "s390x"},
        ElfCase{"X8664InTheOtherByteOrder", header(2, 2, 0, 62), "machine 62"},
        ElfCase{"I386With64Bits", header(2, 1, 3, 0), "machine 3"},
        ElfCase{"Unknown", header(2, 1, 3, 2), "machine 515"},
        ElfCase{"UnknownBigEndian", header(2, 2, 2, 1), "machine 513"},
        ElfCase{"TooShort", header(2, 1, 62, 0).substr(0, 19), std::nullopt},
        ElfCase{"Empty", "", std::nullopt}, ElfCase{"NotElf", "#!/bin/sh\necho 1234567890\n", std::nullopt}),
    [](const auto& test) { return test.param.name; });

TEST(ArchitectureMismatch, NamesBothArchitectures) {
  const TemporaryFolder folder;
  const std::string path = folder.write("a.so", header(2, 1, '\xB7', 0));
  EXPECT_EQ(core_foundation::architectureMismatch(path),
            path + " is for aarch64, this program is for " + (sizeof(void*) == 8 ? "x86_64" : "i386"));
}

TEST(ArchitectureMismatch, IsSilentAboutThisProgramsOwn) {
  EXPECT_EQ(core_foundation::architectureMismatch("/proc/self/exe"), std::nullopt);
}

TEST(ArchitectureMismatch, IsSilentAboutOtherFiles) {
  const TemporaryFolder folder;
  EXPECT_EQ(core_foundation::architectureMismatch(folder.write("text", "text")), std::nullopt);
  EXPECT_EQ(core_foundation::architectureMismatch(folder.path("missing")), std::nullopt);
  EXPECT_EQ(core_foundation::architectureMismatch(folder.makeFolder("folder")), std::nullopt);
}

}  // namespace
