// SPDX-License-Identifier: MIT
#include "scanner/store/remembered.h"

namespace scanner {
namespace {

bool isSameFile(const FileIdentity& a, const FileIdentity& b) {
  return a.inode == b.inode && a.sizeInBytes == b.sizeInBytes &&
         a.changedAtInNanoseconds == b.changedAtInNanoseconds;
}

/// What "auto" came to then is good enough for "auto" now: finding out what it would come to takes a process.
bool fitsSandbox(const Remembered& remembered, const std::string& wanted) {
  if (wanted == "off") return !remembered.wasSandboxed;
  if (wanted == "required") return remembered.wasSandboxed;
  return remembered.wasSandboxed || remembered.circumstances.sandboxWanted == wanted;
}

}  // namespace

Void whyVoid(const Remembered& remembered, const Circumstances& wanted) {
  const Circumstances& then = remembered.circumstances;
  const Verdict verdict = remembered.verdict;
  if (verdict == Verdict::kNotRun || verdict == Verdict::kSkipped || verdict == Verdict::kWrongArchitecture)
    return Void::kSaysNothing;
  if (!isSameFile(then.file, wanted.file)) return Void::kFile;
  if (then.worker != wanted.worker) return Void::kWorker;
  if (then.toolVersion != wanted.toolVersion) return Void::kToolVersion;
  if (then.format != wanted.format || !remembered.hasEvent) return Void::kFormat;
  if (then.options != wanted.options) return Void::kOptions;
  if (!fitsSandbox(remembered, wanted.sandboxWanted)) return Void::kSandbox;
  // The file itself says nothing about the libraries that it needs.
  if (verdict == Verdict::kNotLoadable && then.libraries != wanted.libraries) return Void::kLibraries;
  if (verdict == Verdict::kShell && !remembered.children) return Void::kNoChildren;
  return Void::kNot;
}

}  // namespace scanner
