// SPDX-License-Identifier: MIT
// A small module that needs a library of its own. For the tests of CFBundle: what is found in it, and whether
// it was unloaded.
extern "C" {
int onlyInDependency();
int onlyHere();
int oldestEntryPoint() __asm__("main");
void setWhenUnloaded(int* flag);
}

namespace {

struct UnloadWatch {
  ~UnloadWatch() {
    if (flag != nullptr) *flag = 1;
  }
  int* flag = nullptr;
} watch;

}  // namespace

int onlyHere() { return 1 + onlyInDependency(); }
int oldestEntryPoint() { return 7; }
void setWhenUnloaded(int* flag) { watch.flag = flag; }
