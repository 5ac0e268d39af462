// SPDX-License-Identifier: MIT
// Making and closing the instance under test.
#pragma once

#include <memory>

#include "host/vst_wrapper.h"
#include "loader/module_loader.h"
#include "loader/plugin_identity.h"
#include "support/counted_handle.h"

/// Creates a new instance and puts it into `wrapper`; null where the plug-in yields none. With `announce`,
/// prints the step "initialize" first.
/// On purpose: the instance held before is closed only now, so both exist side by side for a moment.
void deleteAndNew(NiduCOM::i_ptr<VSTPluginLoader> loader, const VST_loadID& loadID,
                  std::unique_ptr<VSTWrapper>& wrapper, bool announce);

/// Closes the instance, if there is one. Unlike the owner's destructor, lets exceptions of the plug-in pass.
void closeInstance(std::unique_ptr<VSTWrapper>& wrapper);
