// SPDX-License-Identifier: MIT
#include "scanner/explain/explain_tool.h"

#include <cstdlib>
#include <filesystem>
#include <sstream>

#include <fmt/format.h>
#include <sys/stat.h>
#include <unistd.h>

#include "scanner/explain/frames.h"

namespace scanner {
namespace {

constexpr const char* kMemcheck = "memcheck";
constexpr const char* kValgrind = "valgrind";
constexpr const char* kGdb = "gdb";

bool isProgram(const std::string& file) {
  struct stat status = {};
  return stat(file.c_str(), &status) == 0 && S_ISREG(status.st_mode) && access(file.c_str(), X_OK) == 0;
}

/// The absolute path of a program, looked for as a shell does; empty where there is none.
std::string pathOf(const std::string& program) {
  if (program.find('/') != std::string::npos)
    return isProgram(program) ? std::filesystem::absolute(program).string() : "";
  const char* path = std::getenv("PATH");
  std::istringstream folders(path == nullptr ? "/usr/bin:/bin" : path);
  for (std::string folder; std::getline(folders, folder, ':');) {
    const std::string file = folder + "/" + program;
    if (!folder.empty() && isProgram(file)) return std::filesystem::absolute(file).string();
  }
  return {};
}

ExplainTool knownTool(ExplainTool::Kind kind, const std::string& name, const std::string& program) {
  const std::string path = pathOf(program);
  if (path.empty()) {
    throw UnusableTool(fmt::format("--under {}: there is no {} in PATH; Debian's package {} has it", name,
                                   program, program));
  }
  return {kind, name, {path}};
}

}  // namespace

std::vector<std::string> splitCommand(const std::string& line) {
  std::vector<std::string> words;
  bool isInWord = false;
  char quote = 0;
  for (std::size_t i = 0; i < line.size(); ++i) {
    const char c = line[i];
    const bool isBlank = quote == 0 && (c == ' ' || c == '\t' || c == '\n');
    if (isBlank) {
      isInWord = false;
      continue;
    }
    if (!isInWord) words.emplace_back();
    isInWord = true;
    if (c == quote) {
      quote = 0;
    } else if (quote == 0 && (c == '\'' || c == '"')) {
      quote = c;
    } else if (c == '\\' && quote != '\'' && i + 1 < line.size()) {
      words.back() += line[++i];
    } else {
      words.back() += c;
    }
  }
  if (quote != 0) throw UnusableTool("--under: a quote is not closed in: " + line);
  return words;
}

ExplainTool findTool(const std::string& under) {
  if (under == kMemcheck) return knownTool(ExplainTool::Kind::kMemcheck, kMemcheck, kValgrind);
  if (under == kGdb) return knownTool(ExplainTool::Kind::kGdb, kGdb, kGdb);
  ExplainTool tool;
  tool.command = splitCommand(under);
  if (tool.command.empty()) throw UnusableTool("--under: there is no command");
  tool.name = fileNameOf(tool.command.front());
  const std::string path = pathOf(tool.command.front());
  if (path.empty()) throw UnusableTool("--under: there is no program " + tool.command.front());
  tool.command.front() = path;
  return tool;
}

}  // namespace scanner
