// SPDX-License-Identifier: MIT
// The order of the steps that follow the creation of a plug-in.
#pragma once

#include <cstdint>
#include <memory>
#include <vector>

#include "host/vst_wrapper.h"
#include "loader/module_loader.h"
#include "loader/plugin_identity.h"
#include "support/counted_handle.h"

/// The full plan: description, every test forwards and backwards, re-creation, description, fifty tests at
/// random. `wrapper` holds the re-created instance afterwards. Catches nothing.
/// On purpose: announces 64 steps and prints 65.
void torturePlugin(const NiduCOM::i_ptr<VSTPluginLoader>& loader, const VST_loadID& loadID,
                   const VST_Class_Spec& classSpec, std::unique_ptr<VSTWrapper>& wrapper);

/// A plan of one's own: description, then these tests in their order. Announces as many steps as it prints.
void torturePluginWith(const std::vector<int>& tests, const VST_Class_Spec& classSpec, VSTWrapper& wrapper);

/// The plan of a shell, which only contains other plug-ins: one description. Catches nothing.
/// On purpose: announces 51 steps and prints 1.
void tortureShell(const VSTPluginLoader& loader, VSTWrapper& wrapper);

/// The test, 0 to 4, for a draw of 0 to 2147483647.
/// On purpose: test 5 is never drawn.
int testNumberFor(std::int64_t draw);
