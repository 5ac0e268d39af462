// SPDX-License-Identifier: MIT
// Runs of the engine, and what they must not leave behind.
#pragma once

#include <map>
#include <set>
#include <string>
#include <vector>

#include <gtest/gtest.h>

#include "scanner/engine/run_engine.h"
#include "tests/shared/temporary_directory.h"

/// A shell script as a job: its outputs are kept as texts.
scanner::Job shellJob(const std::string& script);

/// The worker on a sample plug-in.
scanner::Job workerJob(const std::string& plugin, const std::map<std::string, std::string>& environment = {});

/// All of what came on one of the two outputs.
std::string textOf(const scanner::RunSeen& seen, bool isStandardError = false);

/// The running processes of which an argument, or the name, is this text.
std::set<int> processesNamed(const std::string& argument);

/// Waits for up to `seconds` until there is none. False when there still is.
bool haveGone(const std::string& argument, double seconds);

/// At its end the engine must have left nothing: no process that has token() as an argument or name, no file in its folder
/// for scratch folders, no descriptor.
class EngineTest : public ::testing::TestWithParam<scanner::SandboxUse> {
 protected:
  EngineTest();
  void SetUp() override;
  void TearDown() override;

  /// The results, in the order of the jobs. A test of a build with a sanitizer has no limit of memory: the
  /// sanitizer reserves more.
  std::vector<scanner::RunSeen> run(const std::vector<scanner::Job>& jobs);
  scanner::RunSeen run(const scanner::Job& job) { return run(std::vector<scanner::Job>{job})[0]; }

  [[nodiscard]] bool isSandboxed() const { return options.sandbox == scanner::SandboxUse::kRequired; }
  [[nodiscard]] const std::string& token() const { return ownToken; }

  scanner::EngineOptions options;

 private:
  TemporaryDirectory folder;
  std::string ownToken;
  std::size_t descriptors = 0;
};

/// The name of a case for INSTANTIATE_TEST_SUITE_P.
std::string sandboxName(const ::testing::TestParamInfo<scanner::SandboxUse>& info);
