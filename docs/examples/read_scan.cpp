// SPDX-License-Identifier: MIT
// Reads the events of a scan while it runs, as a host does that fills its list of plug-ins:
//
//     read_scan VSTTORTURE_SCAN [ARGUMENT...]
//
// Starts VSTTORTURE_SCAN with --describe and these arguments (folders and options), and prints a line for each
// plug-in as soon as its verdict is there: the verdict, the name, and where it is. Exits with the status of the
// scan, or with 3 when it cannot be started. Needs C++17, POSIX and nlohmann/json (Debian: nlohmann-json3-dev):
//
//     c++ -std=c++17 -o read_scan read_scan.cpp
#include <algorithm>
#include <cerrno>
#include <cstdio>
#include <cstdlib>
#include <cstring>
#include <string>
#include <vector>

#include <fcntl.h>
#include <nlohmann/json.hpp>
#include <spawn.h>
#include <sys/wait.h>
#include <unistd.h>

extern char** environ;

namespace {

using nlohmann::json;

/// A text of a plug-in, or a path, without control characters: a terminal may obey them.
std::string printable(const std::string& text) {
  std::string line;
  for (std::size_t at = 0; at < text.size(); ++at) {
    const auto byte = static_cast<unsigned char>(text[at]);
    const bool isC1 = byte == 0xC2 && at + 1 < text.size() && static_cast<unsigned char>(text[at + 1]) < 0xA0;
    line += byte < 0x20 || byte == 0x7F || isC1 ? '?' : text[at];
    if (isC1) ++at;
  }
  return line;
}

std::string lineOf(const json& event) {
  const json& plugin = event.at("plugin");
  std::string place = plugin.at("bundle").get<std::string>();
  std::string name = place.substr(place.rfind('/') + 1);
  if (const json& child = plugin.at("child"); !child.is_null()) {
    place += " #" + std::to_string(child.get<int>());
    if (const json& childName = plugin.at("childName"); !childName.is_null() && childName != "")
      name = childName;
  }
  // Only there for a plug-in that could be described.
  if (const auto description = event.find("description"); description != event.end()) {
    const json& itsName = description->at("name");
    if (!itsName.is_null() && itsName != "") name = itsName;
  }
  std::string verdict = event.at("verdict");
  verdict.resize(std::max<std::size_t>(verdict.size(), 12), ' ');
  return verdict + "  " + printable(name) + "  " + printable(place);
}

/// Starts the program with standard output into a pipe, whose reading end is returned; -1 for an error, whose
/// number is in `error`.
int start(const std::vector<const char*>& command, pid_t& process, int& error) {
  int ends[2];
  if (pipe2(ends, O_CLOEXEC) != 0) {
    error = errno;
    return -1;
  }
  posix_spawn_file_actions_t actions;
  posix_spawn_file_actions_init(&actions);
  posix_spawn_file_actions_addopen(&actions, STDIN_FILENO, "/dev/null", O_RDONLY, 0);
  posix_spawn_file_actions_adddup2(&actions, ends[1], STDOUT_FILENO);
  posix_spawn_file_actions_addopen(&actions, STDERR_FILENO, "/dev/null", O_WRONLY, 0);
  error = posix_spawnp(&process, command[0], &actions, nullptr, const_cast<char* const*>(command.data()),
                       environ);
  posix_spawn_file_actions_destroy(&actions);
  close(ends[1]);
  if (error == 0) return ends[0];
  close(ends[0]);
  return -1;
}

}  // namespace

int main(int argc, char** argv) {
  if (argc < 2) {
    std::fprintf(stderr, "usage: read_scan VSTTORTURE_SCAN [ARGUMENT...]\n");
    return 2;
  }
  std::vector<const char*> command = {argv[1], "--json", "-", "--quiet", "--no-progress", "--describe"};
  command.insert(command.end(), argv + 2, argv + argc);
  command.push_back(nullptr);
  pid_t process = 0;
  int error = 0;
  const int pipe = start(command, process, error);
  if (pipe < 0) {
    std::fprintf(stderr, "cannot start %s: %s\n", argv[1], std::strerror(error));
    return 3;
  }

  std::FILE* events = fdopen(pipe, "r");
  char* line = nullptr;
  std::size_t room = 0;
  while (getline(&line, &room, events) > 0) {
    const json event = json::parse(line);
    // scan_started, run_started (what runs now) and scan_ended (the counts) come as well. Pass over events that
    // you do not know: there may be more of them one day.
    if (event.at("event") == "plugin_ended") {
      std::printf("%s\n", lineOf(event).c_str());
      std::fflush(stdout);
    }
  }
  std::free(line);
  std::fclose(events);

  int status = 0;
  waitpid(process, &status, 0);
  return WIFEXITED(status) ? WEXITSTATUS(status) : 3;
}
