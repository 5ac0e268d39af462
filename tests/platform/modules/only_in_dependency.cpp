// SPDX-License-Identifier: MIT
// The library that the module only_here needs. For the tests of CFBundleGetFunctionPointerForName.
extern "C" int onlyInDependency();

int onlyInDependency() { return 2; }
