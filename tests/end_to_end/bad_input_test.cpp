// SPDX-License-Identifier: MIT
// Paths that name no plug-in: one failure line, one line of reason on standard error, never a crash.
#include <csignal>
#include <cstring>
#include <fstream>
#include <functional>
#include <iterator>

#include <gmock/gmock.h>
#include <link.h>
#include <sys/stat.h>
#include <unistd.h>

#include "tests/shared/program_run.h"
#include "tests/shared/protocol_lines.h"
#include "tests/shared/sanitizer.h"
#include "tests/shared/temporary_directory.h"

using testing::AllOf;
using testing::EndsWith;
using testing::HasSubstr;
using testing::Lt;
using testing::StartsWith;

namespace {

std::string textOf(const std::string& path) {
  std::ifstream file(path, std::ios::binary);
  return {std::istreambuf_iterator<char>(file), {}};
}

void writeFile(const std::filesystem::path& path, const std::string& text) {
  std::ofstream(path, std::ios::binary) << text;
}

/// The sample as if it were made for the other of the two x86 architectures: class and machine of its header.
std::string forTheOtherArchitecture(std::string library) {
  const bool is64Bit = library[4] == 2;
  library[4] = is64Bit ? 1 : 2;
  library[18] = is64Bit ? 3 : 62;
  return library;
}

/// The same as if it were made for a machine of 64 bits in big-endian order.
std::string forS390x(std::string library) {
  library[4] = 2;
  library[5] = 2;
  library[18] = 0;
  library[19] = 22;
  return library;
}

#if defined(__x86_64__)
constexpr const char* kBothArchitectures = "is for i386, this program is for x86_64";
#elif defined(__i386__)
constexpr const char* kBothArchitectures = "is for x86_64, this program is for i386";
#endif

struct BadInput {
  std::string name;
  std::string reason;  ///< Part of the line on standard error.
  /// Makes the thing in a folder and returns the path to try.
  std::function<std::string(const std::filesystem::path&)> make;
};

std::string madeOf(const std::filesystem::path& folder, const std::string& content) {
  writeFile(folder / "file.so", content);
  return (folder / "file.so").string();
}

const BadInput kBadInputs[] = {
    {"MissingFile", "/none.so: No such file",
     [](const auto& folder) { return (folder / "none.so").string(); }},
    {"MissingFolder", "No such file", [](const auto& folder) { return (folder / "a/b/none.so").string(); }},
    {"MissingRelativeFile", "none.so", [](const auto&) { return std::string("none.so"); }},
    {"FileAsFolder", "Not a directory",
     [](const auto& folder) { return madeOf(folder, "text") + "/inner.so"; }},
    {"TextFile", "file too short", [](const auto& folder) { return madeOf(folder, "some text\n"); }},
    {"LongTextFile", "invalid ELF header",
     [](const auto& folder) { return madeOf(folder, std::string(100000, 'x')); }},
    {"EmptyFile", "file too short", [](const auto& folder) { return madeOf(folder, ""); }},
    {"FolderWithoutExecutable", "has no executable",
     [](const auto& folder) {
       std::filesystem::create_directories(folder / "Empty.vst/Contents/MacOS");
       return (folder / "Empty.vst").string();
     }},
    {"OtherArchitecture", kBothArchitectures,
     [](const auto& folder) {
       return madeOf(folder, forTheOtherArchitecture(textOf(samplePlugin("well_behaved_effect"))));
     }},
    {"OtherArchitectureInFolder", "is for s390x, this program is for ",
     [](const auto& folder) {
       std::filesystem::create_directories(folder / "Odd.vst/Contents/Linux");
       writeFile(folder / "Odd.vst/Contents/Linux/Odd.so",
                 forS390x(textOf(samplePlugin("well_behaved_effect"))));
       return (folder / "Odd.vst").string();
     }},
    {"OtherArchitectureBehindLink", kBothArchitectures,
     [](const auto& folder) {
       const std::string file =
           madeOf(folder, forTheOtherArchitecture(textOf(samplePlugin("well_behaved_effect"))));
       std::filesystem::create_directory(folder / "Odd.vst");
       std::filesystem::create_symlink(file, folder / "Odd.vst/Odd.so");
       return (folder / "Odd.vst").string();
     }},
    {"ModuleForMacOS", "is a module for macOS, not a shared object for Linux",
     [](const auto& folder) { return madeOf(folder, "\xCF\xFA\xED\xFE" + std::string(1000, '\1')); }},
    {"ModuleForWindows", "is a module for Windows, not a shared object for Linux",
     [](const auto& folder) { return madeOf(folder, "MZ" + std::string(1000, '\1')); }},
    {"StaticLibrary", "is a static library, not a shared object for Linux",
     [](const auto& folder) { return madeOf(folder, "!<arch>\n" + std::string(1000, '\1')); }},
    {"Script", "is a script, not a shared object for Linux",
     [](const auto& folder) { return madeOf(folder, "#!/bin/sh\necho total, 64\n"); }},
    {"Program", "executable", [](const auto&) { return std::string(VSTTORTURE_PROGRAM); }},
    {"UndefinedSymbol", "numberThatNobodyDefines",
     [](const auto&) { return samplePlugin("undefined_symbol"); }},
    {"InvalidUtf8", "\\xff\\xfe", [](const auto&) { return std::string("/x/\xff\xfe.so"); }},
    {"EmptyPath", "empty", [](const auto&) { return std::string(); }},
    {"LongPath", "too long", [](const auto&) { return '/' + std::string(4999, 'x'); }},
    {"LongPathOfShortNames", "too long",
     [](const auto&) {
       std::string path;
       while (path.size() < 5000) path += "/folder_of_a_name";
       return path;
     }},
    {"LineEndInPath", "a b", [](const auto& folder) { return (folder / "a\nb").string(); }},
    {"Fifo", "neither a file nor a directory",
     [](const auto& folder) {
       EXPECT_EQ(mkfifo((folder / "fifo").c_str(), 0600), 0);
       return (folder / "fifo").string();
     }},
    {"Device", "neither a file nor a directory", [](const auto&) { return std::string("/dev/null"); }},
    {"LinkToItself", "symbolic links",
     [](const auto& folder) {
       std::filesystem::create_symlink("loop", folder / "loop");
       return (folder / "loop").string();
     }},
    {"LinkToNothing", "No such file",
     [](const auto& folder) {
       std::filesystem::create_symlink("nothing", folder / "link.so");
       return (folder / "link.so").string();
     }},
};

void expectOneFailureAndOneReason(const ProgramRun& run, const std::string& reason) {
  EXPECT_EQ(run.standardOutput, "!create and initialize failed -1\n");
  EXPECT_EQ(run.end, "exit status 3");
  ASSERT_EQ(lines(run.standardError).size(), 1u) << run.standardError;
  EXPECT_THAT(run.standardError, AllOf(StartsWith("vsttorture: "), HasSubstr(reason), EndsWith("\n")));
  EXPECT_THAT(run.elapsedSeconds, Lt(kEndLimitInSeconds));
}

class BadInputs : public testing::TestWithParam<BadInput> {};

TEST_P(BadInputs, GiveOneFailureLineAndOneReason) {
  const TemporaryDirectory folder;
  expectOneFailureAndOneReason(runVstTorture({GetParam().make(folder.path())}), GetParam().reason);
}

INSTANTIATE_TEST_SUITE_P(Paths, BadInputs, testing::ValuesIn(kBadInputs),
                         [](const auto& instance) { return instance.param.name; });

/// The superuser may enter every folder, unless the capabilities for that are taken away.
TEST(FolderWithoutPermission, GivesOneFailureLineAndOneReason) {
  const TemporaryDirectory folder;
  const std::filesystem::path closed = folder.path() / "Closed.vst";
  std::filesystem::create_directory(closed);
  std::filesystem::copy_file(samplePlugin("well_behaved_effect"), closed / "Closed.so");
  ASSERT_EQ(chmod(closed.c_str(), 0), 0);
  ProgramRun run;
  if (geteuid() == 0) {
    ProgramCall call;
    call.arguments = {"--bounding-set", "-dac_override,-dac_read_search", VSTTORTURE_PROGRAM,
                      closed.string()};
    run = runProgram("/usr/bin/setpriv", call);
  } else {
    run = runVstTorture({closed.string()});
  }
  chmod(closed.c_str(), 0700);
  expectOneFailureAndOneReason(run, "Closed.vst");
}

/// How far the loader reads into the file.
std::size_t sizeOfLoadedPart(const std::string& library) {
  ElfW(Ehdr) header;
  std::memcpy(&header, library.data(), sizeof header);
  std::size_t size = 0;
  for (unsigned i = 0; i < header.e_phnum; ++i) {
    ElfW(Phdr) segment;
    std::memcpy(&segment, library.data() + header.e_phoff + i * sizeof segment, sizeof segment);
    if (segment.p_type == PT_LOAD) size = segment.p_offset + segment.p_filesz;
  }
  return size;
}

/// The end of a run, whatever the plug-in is, as a host may count on it. The loader itself gives up on some
/// damaged files: 127, with its reason on standard error. The address sanitizer ends what it finds with 1.
/// After the run's end nobody handles SIGILL and its like any more.
void expectAKnownEnd(const ProgramRun& run) {
  const std::vector<std::string> printed = lines(run.standardOutput);
  if (run.end == "exit status 0") {
    EXPECT_EQ(printed.size(), 66u);
    EXPECT_THAT(run.standardOutput, StartsWith(beginningOfRun(15)));
  } else if (run.end == "exit status 3") {
    ASSERT_FALSE(printed.empty());
    EXPECT_THAT(printed.back(), StartsWith("!"));
  } else if (run.end == "exit status 7") {
    EXPECT_THAT(run.standardOutput,
                testing::AnyOf(EndsWith("unexpected exit"), StartsWith(beginningOfRun(15))));
  } else if (kWithAddressSanitizer && run.end == "exit status 1") {
    EXPECT_THAT(run.standardError, HasSubstr("Sanitizer"));
  } else if (run.end == "signal 4" || run.end == "signal 8") {
    EXPECT_EQ(printed.size(), 66u);
  } else {
    EXPECT_EQ(run.end, "exit status 127");
    EXPECT_THAT(run.standardError, HasSubstr("detected by ld.so"));
  }
}

/// A host that loses patience: a damaged plug-in may also hang.
ProgramRun runWithPatience(const std::string& path) {
  ProgramCall call;
  call.arguments = {path};
  call.interruption.signals = {SIGTERM};
  call.interruption.afterSeconds = 1;
  return runVstTorture(call);
}

TEST(TruncatedPlugin, FailsToLoadOrEndsInTheGuard) {
  const TemporaryDirectory folder;
  const std::string whole = textOf(samplePlugin("well_behaved_effect"));
  const std::size_t loaded = sizeOfLoadedPart(whole);
  for (const std::size_t length :
       {std::size_t{1}, std::size_t{4}, std::size_t{20}, std::size_t{51}, std::size_t{52}, std::size_t{64},
        std::size_t{100}, std::size_t{500}, loaded / 8, loaded / 4, loaded / 3, loaded / 2, loaded * 3 / 4}) {
    const ProgramRun run = runWithPatience(madeOf(folder.path(), whole.substr(0, length)));
    SCOPED_TRACE(length);
    if (run.end == "exit status 3") {
      expectOneFailureAndOneReason(run, "file.so");
    } else {
      EXPECT_EQ(run.standardOutput, "unexpected exit");
      EXPECT_EQ(run.end, "exit status 7");
    }
    EXPECT_EQ(run.secondsSinceInterruption, 0) << "it hung";
  }
}

TEST(DamagedPlugin, ComesToAKnownEnd) {
  const TemporaryDirectory folder;
  const std::string whole = textOf(samplePlugin("well_behaved_effect"));
  const std::size_t loaded = sizeOfLoadedPart(whole);
  for (const char garbage : {'\xFF', '\x00', 'G'}) {
    for (const std::size_t part : {1u, 2u, 3u, 4u, 5u, 6u, 7u}) {
      SCOPED_TRACE(part);
      std::string damaged = whole;
      damaged.replace(loaded * part / 8, 64, 64, garbage);
      expectAKnownEnd(runWithPatience(madeOf(folder.path(), damaged)));
    }
  }
}

}  // namespace
