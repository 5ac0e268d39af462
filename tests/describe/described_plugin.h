// SPDX-License-Identifier: MIT
// What the tests of describe/ describe: a live wrapper around an instance in this process.
#pragma once

#include "tests/shared/wrapper_fixture.h"

/// The bundle's identity, without a child.
inline VST_Class_Spec bundleSpec() { return {VST_DLL_Info("/described.vst", "bundle"), VST_ChildSpec()}; }

using DescribedPlugin = host_tests::WrapperTest;
