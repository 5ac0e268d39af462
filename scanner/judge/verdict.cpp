// SPDX-License-Identifier: MIT
#include "scanner/judge/verdict.h"

namespace scanner {

const std::vector<VerdictRow>& verdictTable() {
  static const std::vector<VerdictRow> table = {
      {Verdict::kPassed, "passed", "All 65 steps were run, and the process ended by itself.",
       "Nothing. A pass says nothing about audio, MIDI and the editor, which are not tried.", true},
      {Verdict::kShell, "shell",
       "The plug-in only holds others. Each of its children has a verdict of its own.",
       "Nothing; look at the children.", true},
      {Verdict::kFailed, "failed", "The plug-in threw an exception out of a request.",
       "Repeat the run under a debugger with \"catch throw\" and look where the exception comes from.",
       false},
      {Verdict::kCrashed, "crashed", "The process was ended by a signal that a fault in it raised.",
       "Repeat the run under a debugger; the place says in which module and at which offset it crashed.",
       false},
      {Verdict::kExited, "exited",
       "The plug-in ended the process before the run was over, or nothing confirms that the run went to its "
       "end.",
       "Repeat the run under a debugger with breakpoints on exit and _exit. If the result names a "
       "contradiction, "
       "look what the plug-in prints, and whether it closes standard output or writes to memory that is not "
       "its "
       "own.",
       false},
      {Verdict::kHung, "hung", "A step, or the run, took longer than its limit.",
       "\"busy\" used the processor meanwhile: an endless loop, or a limit that is too low (--step-limit). "
       "\"waiting\" slept: look at the system call, and whether a lock or a socket is behind it.",
       false},
      {Verdict::kKilled, "killed",
       "The process was ended by a signal that was sent, not raised by a fault, or because it used more "
       "memory, "
       "output or disk than it may.",
       "If a limit ended it, try a higher one. Otherwise look who sent the signal: another process, such as "
       "the "
       "system's out-of-memory killer, or the plug-in itself.",
       false},
      {Verdict::kNoInstance, "no_instance", "The module was loaded, but it yields no plug-in instance.",
       "It has no entry point, its entry point answers nothing, or it throws while it is created or opened. "
       "A "
       "plug-in that needs a licence, a device or a file may do this on purpose.",
       false},
      {Verdict::kNotLoadable, "not_loadable", "The system could not load the module.",
       "The loader's reason says what is missing: a library, a symbol, or the file itself.", false},
      {Verdict::kWrongArchitecture, "wrong_architecture",
       "The module was built for another processor or system, and no worker for it is installed.",
       "Install the worker for its processor, or the plug-in for this one.", false},
      {Verdict::kRefused, "refused", "The bundle's name is on the list of those that are never loaded.",
       "Nothing; a host that refuses the same names will not load it either.", false},
      {Verdict::kSkipped, "skipped", "A row of the skip list matches; its reason is part of the result.",
       "Nothing, until the reason no longer holds.", true},
      {Verdict::kNotRun, "not_run",
       "The scan could not run it, or was interrupted. Never the plug-in's fault.",
       "The cause says what was missing: a worker, memory, disk space. Mend that and scan again.", false},
  };
  return table;
}

const VerdictRow& rowOf(Verdict verdict) {
  for (const VerdictRow& row : verdictTable()) {
    if (row.verdict == verdict) return row;
  }
  return verdictTable().back();
}

std::optional<Verdict> verdictOf(std::string_view word) {
  for (const VerdictRow& row : verdictTable()) {
    if (word == row.word) return row.verdict;
  }
  return std::nullopt;
}

std::vector<std::string> verdictWords() {
  std::vector<std::string> words;
  for (const VerdictRow& row : verdictTable()) words.emplace_back(row.word);
  return words;
}

}  // namespace scanner
