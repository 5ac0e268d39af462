// SPDX-License-Identifier: MIT
#include "worker/command_line.h"

#include <cerrno>
#include <cstdio>
#include <cstring>
#include <limits>
#include <memory>
#include <string_view>

const char kWorkerHelp[] =
    "usage: vsttorture-worker [OPTION]... BUNDLE [CHILD_ID]\n"
    "\n"
    "The run of vsttorture with the same lines and statuses, observed.\n"
    "\n"
    "  --record FILE            keep what is under way in FILE, which outlives the run\n"
    "  --tests LIST             run these tests, as in 0,3,3,1, instead of the usual ones\n"
    "  --tests FILE             the same, with the list in a file\n"
    "  --die-with-parent[=PID]  end when the process that started this one ends; PID is its number\n"
    "  --memory-limit BYTES     allow so much address space\n"
    "  --file-size-limit BYTES  allow no larger file to be written\n"
    "  --no-core                leave no core file\n"
    "  --help                   print this\n"
    "  --version                print the version\n"
    "\n"
    "Exit status: as vsttorture; 64 for a mistake in the options.\n";

namespace {

constexpr int kHighestTest = 5;
constexpr std::size_t kMostTests = 1000000;
constexpr std::size_t kMostBytesOfList = 8 * kMostTests;
constexpr char kListCharacters[] = "0123456789, \t\r\n";

/// Decimal digits and nothing else; false also for a number that is too large.
bool readNumber(std::string_view text, std::uint64_t most, std::uint64_t& number) {
  number = 0;
  for (const char c : text) {
    if (c < '0' || c > '9') return false;
    const auto digit = static_cast<std::uint64_t>(c - '0');
    if (digit > most || number > (most - digit) / 10) return false;
    number = number * 10 + digit;
  }
  return !text.empty();
}

bool readFile(const std::string& path, std::string& content, std::string& mistake) {
  const std::unique_ptr<std::FILE, int (*)(std::FILE*)> file(std::fopen(path.c_str(), "re"), std::fclose);
  if (file == nullptr) {
    mistake = "cannot read the tests from " + path + ": " + std::strerror(errno);
    return false;
  }
  content.resize(kMostBytesOfList + 1);
  content.resize(std::fread(content.data(), 1, content.size(), file.get()));
  if (std::ferror(file.get()) != 0) {
    mistake = "cannot read the tests from " + path + ": " + std::strerror(errno);
    return false;
  }
  return true;
}

bool readList(std::string_view list, std::vector<int>& tests, std::string& mistake) {
  constexpr std::string_view kSeparators = ", \t\r\n";
  tests.clear();
  if (list.size() > kMostBytesOfList) {
    mistake = "the list of tests is too long";
    return false;
  }
  for (std::size_t begin = 0;
       (begin = list.find_first_not_of(kSeparators, begin)) != std::string_view::npos;) {
    const std::string_view word = list.substr(begin, list.find_first_of(kSeparators, begin) - begin);
    std::uint64_t number = 0;
    if (!readNumber(word, kHighestTest, number)) {
      mistake = "there is no test " + std::string(word.substr(0, 40)) + "; they are numbered 0 to 5";
      return false;
    }
    if (tests.size() == kMostTests) {
      mistake = "the list of tests is too long";
      return false;
    }
    tests.push_back(static_cast<int>(number));
    begin += word.size();
  }
  if (tests.empty()) mistake = "the list of tests is empty";
  return !tests.empty();
}

struct Option {
  enum class Argument { kNone, kNeeded, kOptional };

  const char* name;
  Argument argument;
  bool (*read)(const std::string& argument, WorkerOptions& options, std::string& mistake);
};

bool readBytes(const std::string& argument, std::optional<std::uint64_t>& limit, std::string& mistake) {
  std::uint64_t bytes = 0;
  if (!readNumber(argument, std::numeric_limits<std::uint64_t>::max(), bytes) || bytes == 0) {
    mistake = argument + " is no number of bytes";
    return false;
  }
  limit = bytes;
  return true;
}

bool readParent(const std::string& argument, WorkerOptions& options, std::string& mistake) {
  std::uint64_t parent = 0;
  if (!argument.empty() &&
      (!readNumber(argument, std::numeric_limits<std::int32_t>::max(), parent) || parent == 0)) {
    mistake = argument + " is no number of a process";
    return false;
  }
  options.parent = static_cast<pid_t>(parent);
  return true;
}

const Option kOptions[] = {
    {"--record", Option::Argument::kNeeded,
     [](const std::string& argument, WorkerOptions& options, std::string& mistake) {
       options.recordPath = argument;
       if (argument.empty()) mistake = "the record has no name";
       return !argument.empty();
     }},
    {"--tests", Option::Argument::kNeeded,
     [](const std::string& argument, WorkerOptions& options, std::string& mistake) {
       options.tests.emplace();
       return readTests(argument, *options.tests, mistake);
     }},
    {"--die-with-parent", Option::Argument::kOptional, readParent},
    {"--memory-limit", Option::Argument::kNeeded,
     [](const std::string& argument, WorkerOptions& options, std::string& mistake) {
       return readBytes(argument, options.memoryLimit, mistake);
     }},
    {"--file-size-limit", Option::Argument::kNeeded,
     [](const std::string& argument, WorkerOptions& options, std::string& mistake) {
       return readBytes(argument, options.fileSizeLimit, mistake);
     }},
    {"--no-core", Option::Argument::kNone,
     [](const std::string&, WorkerOptions& options, std::string&) { return options.withoutCore = true; }},
    {"--help", Option::Argument::kNone,
     [](const std::string&, WorkerOptions& options, std::string&) { return options.wantsHelp = true; }},
    {"--version", Option::Argument::kNone,
     [](const std::string&, WorkerOptions& options, std::string&) { return options.wantsVersion = true; }},
};

const Option* optionNamed(std::string_view name) {
  for (const Option& option : kOptions) {
    if (name == option.name) return &option;
  }
  return nullptr;
}

}  // namespace

bool readTests(const std::string& argument, std::vector<int>& tests, std::string& mistake) {
  if (argument.find_first_not_of(kListCharacters) == std::string::npos)
    return readList(argument, tests, mistake);
  std::string content;
  return readFile(argument, content, mistake) && readList(content, tests, mistake);
}

bool readCommandLine(int argc, const char* const* argv, WorkerOptions& options, std::string& mistake) {
  int next = 1;
  for (; next < argc; ++next) {
    const std::string_view word = argv[next];
    if (word.empty() || word[0] != '-' || word == "-") break;
    if (word == "--") {
      ++next;
      break;
    }
    const std::size_t equals = word.find('=');
    const Option* option = optionNamed(word.substr(0, equals));
    if (option == nullptr) {
      mistake = "there is no option " + std::string(word);
      return false;
    }
    const bool hasArgument = equals != std::string_view::npos;
    std::string argument(hasArgument ? word.substr(equals + 1) : std::string_view());
    if (hasArgument && option->argument == Option::Argument::kNone) {
      mistake = std::string(option->name) + " takes no argument";
      return false;
    }
    if (!hasArgument && option->argument == Option::Argument::kNeeded) {
      if (++next == argc) {
        mistake = std::string(option->name) + " needs an argument";
        return false;
      }
      argument = argv[next];
    }
    if (!option->read(argument, options, mistake)) return false;
  }
  options.firstOperand = next;
  return true;
}
