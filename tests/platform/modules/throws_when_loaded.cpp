// SPDX-License-Identifier: MIT
// A module whose static constructor throws the int 42. The exception must reach the caller of
// CFBundleLoadExecutable.
namespace {

int throwing() { throw 42; }
const int neverSet = throwing();

}  // namespace

extern "C" int afterLoading();
int afterLoading() { return neverSet; }
