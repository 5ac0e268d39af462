// SPDX-License-Identifier: MIT
// The reason that the first bytes of a file give for not loading it.
#include <optional>
#include <string>

#include <gtest/gtest.h>

#include "platform/linux/file_kind.h"
#include "tests/platform/bundle_files.h"

namespace {

const std::string kOurMachine = sizeof(void*) == 8 ? "x86_64" : "i386";

// The first 20 bytes of a shared object. `elfClass` is 1 for 32 bits and 2 for 64; `byteOrder` 1 for little
// endian and 2 for big; the machine's two bytes stand in file order.
std::string elf(char elfClass, char byteOrder, char machineFirst, char machineSecond) {
  std::string bytes = std::string("\177ELF") + elfClass + byteOrder + '\1';
  bytes.resize(18, '\0');
  return bytes + machineFirst + machineSecond;
}

struct FileKind {
  const char* name;
  std::string content;
  std::string reason;  // Behind the path; "" for none.
};
class WhyNotForThisProgram : public testing::TestWithParam<FileKind> {};

TEST_P(WhyNotForThisProgram, NamesWhatTheFileWasMadeFor) {
  const BundleFiles files;
  const std::string path = files.write("a.so", GetParam().content);
  const std::optional<std::string> reason = core_foundation::whyNotForThisProgram(path);
  EXPECT_EQ(reason.value_or(path), path + GetParam().reason);
}

FileKind architecture(const char* name, const std::string& header, const std::string& shownName) {
  const bool isOurs = shownName == kOurMachine;
  return {name, header, isOurs ? "" : " is for " + shownName + ", this program is for " + kOurMachine};
}

INSTANTIATE_TEST_SUITE_P(
    Architectures, WhyNotForThisProgram,
    testing::Values(
        architecture("I386", elf(1, 1, 3, 0), "i386"), architecture("X8664", elf(2, 1, 62, 0), "x86_64"),
        architecture("X32", elf(1, 1, 62, 0), "x32"), architecture("Arm", elf(1, 1, 40, 0), "arm"),
        architecture("Aarch64", elf(2, 1, '\xB7', 0), "aarch64"),
        architecture("Loongarch64", elf(2, 1, 2, 1), "loongarch64"),
        architecture("Mips", elf(1, 2, 0, 8), "mips"), architecture("Mipsel", elf(1, 1, 8, 0), "mipsel"),
        architecture("Mips64el", elf(2, 1, 8, 0), "mips64el"),
        architecture("Powerpc", elf(1, 2, 0, 20), "powerpc"),
        architecture("Powerpc64", elf(2, 2, 0, 21), "powerpc64"),
        architecture("Powerpc64le", elf(2, 1, 21, 0), "powerpc64le"),
        architecture("Riscv64", elf(2, 1, '\xF3', 0), "riscv64"),
        architecture("S390", elf(1, 2, 0, 22), "s390"), architecture("S390x", elf(2, 2, 0, 22), "s390x"),
        architecture("X8664InTheOtherByteOrder", elf(2, 2, 0, 62), "machine 62"),
        architecture("I386With64Bits", elf(2, 1, 3, 0), "machine 3"),
        architecture("Unknown", elf(2, 1, 3, 2), "machine 515"),
        architecture("UnknownBigEndian", elf(2, 2, 2, 1), "machine 513")),
    [](const auto& test) { return test.param.name; });

FileKind format(const char* name, const std::string& content, const std::string& shownName) {
  return {name, content, " is " + shownName + ", not a shared object for Linux"};
}

INSTANTIATE_TEST_SUITE_P(
    Formats, WhyNotForThisProgram,
    testing::Values(format("MacOS32", "\xCE\xFA\xED\xFE...", "a module for macOS"),
                    format("MacOS64", "\xCF\xFA\xED\xFE...", "a module for macOS"),
                    format("MacOSPowerpc", "\xFE\xED\xFA\xCE...", "a module for macOS"),
                    format("MacOSPowerpc64", "\xFE\xED\xFA\xCF...", "a module for macOS"),
                    format("MacOSUniversal", "\xCA\xFE\xBA\xBE...", "a module for macOS"),
                    format("MacOSUniversal64", "\xCA\xFE\xBA\xBF...", "a module for macOS"),
                    format("Windows", "MZ" + std::string(1000, '\1'), "a module for Windows"),
                    format("StaticLibrary", "!<arch>\n", "a static library"),
                    format("Script", "#!/bin/sh\n", "a script"),
                    FileKind{"LikeAStaticLibrary", "!<arch>" + std::string(1000, '\1'), ""},
                    FileKind{"ShortElf", elf(2, 1, '\xB7', 0).substr(0, 19), ""}, FileKind{"Empty", "", ""},
                    FileKind{"Text", "some text, longer than an ELF header's part", ""}),
    [](const auto& test) { return test.param.name; });

}  // namespace
