// SPDX-License-Identifier: MIT
// A result that an earlier scan has left, and whether it still answers the question. Pure functions.
#pragma once

#include <cstdint>
#include <optional>
#include <string>
#include <vector>

#include "scanner/find/module.h"
#include "scanner/judge/verdict.h"
#include "scanner/plan/run_list.h"

namespace scanner {

/// What a run of a plug-in depends on, as far as the scan knows it.
struct Circumstances {
  FileIdentity file = {};          ///< Of the plug-in's executable.
  std::string worker = {};         ///< The identities of the worker's and the describer's files, as one text.
  std::string options = {};        ///< Those that have a part in how a run ends, as one text.
  std::string sandboxWanted = {};  ///< "auto", "required" or "off".
  std::string libraries = {};      ///< The state of the system's list of shared libraries, as one text.
  int format = 0;                  ///< Of the events.
  std::string toolVersion = {};    ///< Of vsttorture-scan.
};

/// What the database has of one finished run of a plug-in, but for its event.
struct Remembered {
  std::int64_t id = 0;  ///< Of the row; a later result has a larger one.
  Circumstances circumstances = {};
  Verdict verdict = Verdict::kNotRun;
  int step = 0;  ///< 0 before the first.
  std::string cause = {};
  bool isFlaky = false;
  bool wasSandboxed = false;
  double time = 0;  ///< When the run began, in seconds since 1970.
  double wallSeconds = 0;
  std::optional<std::vector<Child>> children = {};  ///< Of a shell that could be described.
  bool hasEvent = true;                             ///< The event itself is kept of the latest results only.
};

/// Why a remembered result is no answer.
enum class Void {
  kNot,          ///< It is one.
  kFile,         ///< The file was changed, replaced or moved.
  kWorker,       ///< The worker or the describer is another one.
  kOptions,      ///< The scan had other options.
  kSandbox,      ///< It was confined, or was not, unlike what is wanted now.
  kLibraries,    ///< It could not be loaded, and other libraries are installed now.
  kFormat,       ///< Its event has another form, or is no longer there.
  kToolVersion,  ///< Another version of the scan judged it.
  kNoChildren,   ///< A shell whose children are not known.
  kSaysNothing,  ///< Its verdict says nothing about the plug-in.
};

/// Whether `remembered` answers what a run under the circumstances `wanted` would. Device numbers are not
/// compared, since those of many file systems change at each start of the machine; an inode with the same
/// number, size and time of change (in nanoseconds) is the same file.
Void whyVoid(const Remembered& remembered, const Circumstances& wanted);

}  // namespace scanner
