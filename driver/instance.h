// SPDX-License-Identifier: MIT
// Making and closing the instance under test.
#pragma once

#include <memory>

#include "host/vst_wrapper.h"
#include "loader/module_loader.h"
#include "loader/plugin_identity.h"
#include "support/counted_handle.h"

/// Creates a new instance and puts it into `wrapper`, which becomes null when the plug-in yields no instance.
/// With `announce`, prints the step "initialize" first. Throws what closing the previous instance throws.
/// On purpose: the previous instance is closed only after that, so both exist for a moment.
void deleteAndNew(NiduCOM::i_ptr<VSTPluginLoader> loader, const VST_loadID& loadID,
                  std::unique_ptr<VSTWrapper>& wrapper, bool announce);

/// Closes the instance, if there is one. Throws what the plug-in throws, which ~unique_ptr() could not do.
void closeInstance(std::unique_ptr<VSTWrapper>& wrapper);
