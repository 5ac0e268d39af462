// SPDX-License-Identifier: MIT
#include "tests/scanner/engine/engine_fixture.h"

#include <chrono>
#include <filesystem>
#include <fstream>
#include <iterator>
#include <sstream>
#include <stdexcept>
#include <thread>

#include <unistd.h>

#include "tests/shared/program_run.h"
#include "tests/shared/sanitizer.h"

namespace fs = std::filesystem;
using namespace scanner;

namespace {

std::size_t openDescriptors() {
  return static_cast<std::size_t>(
      std::distance(fs::directory_iterator("/proc/self/fd"), fs::directory_iterator()));
}

}  // namespace

Job shellJob(const std::string& script) {
  Job job;
  job.program = "/bin/sh";
  job.arguments = {"-c", script};
  job.isWorker = false;
  return job;
}

Job workerJob(const std::string& plugin, const std::map<std::string, std::string>& environment) {
  Job job;
  job.program = WORKER;
  job.arguments = {"--", samplePlugin(plugin)};
  job.environment = {"LSAN_OPTIONS=detect_leaks=0"};
  for (const auto& [name, value] : environment) job.environment.push_back(name + "=" + value);
  return job;
}

std::string textOf(const RunSeen& seen, bool isStandardError) {
  std::string all;
  for (const PluginText& text : seen.texts) {
    if (text.isStandardError == isStandardError) all += text.bytes;
  }
  return all;
}

std::set<int> processesNamed(const std::string& argument) {
  std::set<int> found;
  for (const fs::directory_entry& entry : fs::directory_iterator("/proc")) {
    const std::string name = entry.path().filename();
    if (name.find_first_not_of("0123456789") != std::string::npos) continue;
    std::ifstream file(entry.path() / "cmdline");
    std::ostringstream commandLine;
    // An istreambuf_iterator would throw for a process that ends meanwhile; operator<< does not.
    commandLine << '\0' << file.rdbuf();
    if (commandLine.str().find('\0' + argument + '\0') != std::string::npos) found.insert(std::stoi(name));
  }
  return found;
}

bool haveGone(const std::string& argument, double seconds) {
  const auto end = std::chrono::steady_clock::now() + std::chrono::duration<double>(seconds);
  while (!processesNamed(argument).empty()) {
    if (std::chrono::steady_clock::now() > end) return false;
    std::this_thread::sleep_for(std::chrono::milliseconds(10));
  }
  return true;
}

EngineTest::EngineTest() {
  static int number = 0;
  ownToken = "unruly-" + std::to_string(getpid()) + "-" + std::to_string(++number);
  options.jobs = 1;
  options.scratchParent = folder.path();
  options.sandbox = GetParam();
  if (kWithAddressSanitizer || kWithThreadSanitizer) options.limits.memoryInBytes = 0;
}

void EngineTest::SetUp() {
  try {
    const RunEngine engine(options);
  } catch (const std::runtime_error& error) {
    GTEST_SKIP() << error.what();
  }
  descriptors = openDescriptors();
}

void EngineTest::TearDown() {
  if (IsSkipped()) return;
  EXPECT_EQ(processesNamed(ownToken), std::set<int>());
  EXPECT_TRUE(fs::is_empty(folder.path()));
  EXPECT_EQ(openDescriptors(), descriptors);
}

std::vector<RunSeen> EngineTest::run(const std::vector<Job>& jobs) {
  RunEngine engine(options);
  std::vector<RunSeen> results(jobs.size());
  for (std::size_t i = 0; i < jobs.size(); ++i) {
    engine.add(jobs[i], [&results, i](const RunSeen& seen) { results[i] = seen; });
  }
  EXPECT_TRUE(engine.run());
  return results;
}

std::string sandboxName(const ::testing::TestParamInfo<SandboxUse>& info) {
  return info.param == SandboxUse::kOff ? "WithoutSandbox" : "InTheSandbox";
}
