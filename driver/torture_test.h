// SPDX-License-Identifier: MIT
// The torture test of one plug-in: its frame from loading to the verdict.
#pragma once

#include <memory>
#include <string>

#include "host/vst_wrapper.h"
#include "loader/counted_handle.h"
#include "loader/module_loader.h"
#include "loader/plugin_identity.h"

/// Runs the whole test on the bundle at `path`, and in it on the child that `loadID` names. Prints the lines
/// of the run. True when every phase ran to its end; false after a failure line. `isShellPlugin` becomes true
/// for a shell, else false. A plug-in that yields no instance crashes the process on purpose.
bool RunVSTTortureTest(const std::string& path, const VST_loadID& loadID, bool& isShellPlugin);

/// Creates a new instance and puts it into `wrapper`; null where the plug-in yields none. With `announce`,
/// prints the step "initialize" first.
/// On purpose: the instance held before is closed only now, so both exist side by side for a moment.
void deleteAndNew(NiduCOM::i_ptr<VSTPluginLoader> loader, const VST_loadID& loadID,
                  std::unique_ptr<VSTWrapper>& wrapper, bool announce);

/// Closes the instance, if there is one. Unlike the owner's destructor, lets through what the plug-in throws.
void closeInstance(std::unique_ptr<VSTWrapper>& wrapper);
