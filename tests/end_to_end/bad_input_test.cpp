// SPDX-License-Identifier: MIT
// Paths that name no plug-in: one failure line, one line with the reason on standard error, never a crash.
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
#include "tests/shared/protocol.h"
#include "tests/shared/sanitizer.h"
#include "tests/shared/temporary_directory.h"

using testing::AllOf;
using testing::EndsWith;
using testing::HasSubstr;
using testing::Lt;
using testing::StartsWith;

namespace {

namespace fs = std::filesystem;

/// Makes the bad input in a folder and returns the path to try.
using Maker = std::function<std::string(const fs::path&)>;

Maker path(const std::string& text) {
  return [=](const fs::path&) { return text; };
}

Maker inFolder(const std::string& relative) {
  return [=](const fs::path& folder) { return (folder / relative).string(); };
}

Maker file(const std::string& content, const std::string& relative = "file.so") {
  return [=](const fs::path& folder) {
    fs::create_directories((folder / relative).parent_path());
    std::ofstream(folder / relative, std::ios::binary) << content;
    return (folder / relative).string();
  };
}

Maker linkTo(const std::string& target) {
  return [=](const fs::path& folder) {
    fs::create_symlink(target, folder / "link.so");
    return (folder / "link.so").string();
  };
}

std::string wellBehavedEffect() {
  std::ifstream stream(samplePlugin("well_behaved_effect"), std::ios::binary);
  return {std::istreambuf_iterator<char>(stream), {}};
}

/// The sample as if it were made for the other of the two x86 architectures: class and machine of its header.
std::string forTheOtherArchitecture() {
  std::string library = wellBehavedEffect();
  const bool is64Bit = library[4] == 2;
  library[4] = is64Bit ? 1 : 2;
  library[18] = is64Bit ? 3 : 62;
  return library;
}

#if defined(__x86_64__)
constexpr const char* kBothArchitectures = "is for i386, this program is for x86_64";
#elif defined(__i386__)
constexpr const char* kBothArchitectures = "is for x86_64, this program is for i386";
#endif

std::string otherArchitecture(const fs::path& folder) { return file(forTheOtherArchitecture())(folder); }

std::string folderWithoutExecutable(const fs::path& folder) {
  fs::create_directories(folder / "Empty.vst/Contents/MacOS");
  return (folder / "Empty.vst").string();
}

std::string fifo(const fs::path& folder) {
  EXPECT_EQ(mkfifo((folder / "fifo").c_str(), 0600), 0);
  return (folder / "fifo").string();
}

struct BadInput {
  std::string name;
  std::string reason;  ///< The end of the line on standard error; "%" stands for the path.
  Maker make;
};

// Architectures and formats of files are in tests/platform.
const BadInput kBadInputs[] = {
    {"MissingFile", "vsttorture: %: No such file or directory", inFolder("none.so")},
    {"MissingFileWithANameThatTheLoaderKnows", "/libm.so.6: No such file or directory", path("libm.so.6")},
    {"LinkToItself", "vsttorture: %: Too many levels of symbolic links", linkTo("link.so")},
    {"LinkToNothing", "vsttorture: %: No such file or directory", linkTo("nothing")},
    {"EmptyPath", "vsttorture: the path is empty", path("")},
    {"LongPath", "vsttorture: %: File name too long", path('/' + std::string(4999, 'x'))},
    {"InvalidUtf8", "vsttorture: not valid UTF-8: /x/\\xff\\xfe.so", path("/x/\xff\xfe.so")},
    {"ControlCharactersInPath", "/a b .so: No such file or directory", inFolder("a\nb\x7F.so")},
    {"FileAsFolder", "vsttorture: %: Not a directory",
     [](const fs::path& folder) { return file("text")(folder) + "/inner.so"; }},
    {"FolderWithoutExecutable", "Contents/Linux, Contents and the folder itself", folderWithoutExecutable},
    {"Fifo", "vsttorture: % is neither a file nor a directory", fifo},
    {"Device", "vsttorture: % is neither a file nor a directory", path("/dev/zero")},
    {"EmptyFile", "vsttorture: %: file too short", file("")},
    {"LongTextFile", "vsttorture: %: invalid ELF header", file(std::string(100000, 'x'))},
    {"Script", "vsttorture: % is a script, not a shared object for Linux",
     file("#!/bin/sh\necho total, 64\n")},
    {"Program", "executable", path(VSTTORTURE_PROGRAM)},
    {"UndefinedSymbol", "vsttorture: %: undefined symbol: _Z23numberThatNobodyDefinesv",
     path(samplePlugin("undefined_symbol"))},
    {"OtherArchitecture", kBothArchitectures, otherArchitecture},
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
  const std::string path = GetParam().make(folder.path());
  std::string reason = GetParam().reason;
  if (const auto at = reason.find('%'); at != std::string::npos) reason.replace(at, 1, path);
  expectOneFailureAndOneReason(runVstTorture({path}), reason + '\n');
}

INSTANTIATE_TEST_SUITE_P(Paths, BadInputs, testing::ValuesIn(kBadInputs),
                         [](const auto& instance) { return instance.param.name; });

// The superuser can enter every folder, so the program then runs without the capabilities for that. A copy of it does,
// since the folders that the program is in may be closed to it, too.
TEST(FolderWithoutPermission, GivesOneFailureLineAndOneReason) {
  const TemporaryDirectory folder;
  const fs::path closed = folder.path() / "Closed.vst";
  fs::create_directory(closed);
  fs::copy_file(samplePlugin("well_behaved_effect"), closed / "Closed.so");
  ASSERT_EQ(chmod(closed.c_str(), 0), 0);
  ProgramRun run;
  if (geteuid() == 0) {
    const fs::path program = folder.path() / "vsttorture";
    fs::copy_file(VSTTORTURE_PROGRAM, program);
    ProgramCall call;
    call.arguments = {"--bounding-set", "-dac_override,-dac_read_search", program.string(), closed.string()};
    run = runProgram("/usr/bin/setpriv", call);
  } else {
    run = runVstTorture({closed.string()});
  }
  chmod(closed.c_str(), 0700);
  expectOneFailureAndOneReason(run, "Closed.vst");
}

/// The size in bytes of the part of the file that the loader maps.
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

/// Every end that a run with a damaged plug-in can have. The system's loader ends the process itself on some
/// damaged files, with status 127 and its reason on standard error; the address sanitizer does so with status
/// 1. SIGILL and SIGFPE end a process that crashes after the run.
void expectOneOfTheKnownEnds(const ProgramRun& run) {
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

/// Sends SIGTERM after ten seconds, so long also where the machine is busy: a damaged plug-in may also hang.
ProgramRun runForTenSeconds(const std::string& path) {
  ProgramCall call;
  call.arguments = {path};
  call.interruption.signals = {SIGTERM};
  call.interruption.afterSeconds = 10;
  return runVstTorture(call);
}

TEST(TruncatedPlugin, FailsToLoadOrCrashes) {
  const TemporaryDirectory folder;
  const std::string whole = wellBehavedEffect();
  const std::size_t loaded = sizeOfLoadedPart(whole);
  for (const std::size_t length :
       {std::size_t{1}, std::size_t{4}, std::size_t{20}, std::size_t{51}, std::size_t{52}, std::size_t{64},
        std::size_t{100}, std::size_t{500}, loaded / 8, loaded / 4, loaded / 3, loaded / 2, loaded * 3 / 4}) {
    const ProgramRun run = runForTenSeconds(file(whole.substr(0, length))(folder.path()));
    SCOPED_TRACE(length);
    if (run.end == "exit status 3") {
      expectOneFailureAndOneReason(run, "file.so");
    } else {
      EXPECT_EQ(run.standardOutput, "unexpected exit");
      EXPECT_EQ(run.end, "exit status 7");
    }
    EXPECT_EQ(run.secondsSinceInterruption, 0) << "the run hung";
  }
}

TEST(DamagedPlugin, EndsInOneOfTheKnownWays) {
  const TemporaryDirectory folder;
  const std::string whole = wellBehavedEffect();
  const std::size_t loaded = sizeOfLoadedPart(whole);
  for (const char garbage : {'\xFF', '\x00', 'G'}) {
    for (const std::size_t part : {1u, 2u, 3u, 4u, 5u, 6u, 7u}) {
      SCOPED_TRACE(part);
      std::string damaged = whole;
      damaged.replace(loaded * part / 8, 64, 64, garbage);
      expectOneOfTheKnownEnds(runForTenSeconds(file(damaged)(folder.path())));
    }
  }
}

}  // namespace
