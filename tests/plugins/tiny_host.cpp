// SPDX-License-Identifier: MIT
// A small host program without any guard against faults: loads one module, uses one instance, and prints a
// line after each step.
//
//   tiny_host MODULE [ENTRY [CHILD]]
//
// ENTRY is the entry point, VSTPluginMain by default. CHILD is the answer to audioMasterCurrentId (2).
//
// When the plug-in throws, it prints "caught ..." and ends with status 9. Signals have their default action,
// except with TINY_HOST_ON_CRASH=malloc, stdout or exit: on SIGSEGV and SIGABRT it then prints "crashed",
// uses the named thing, and ends with status 8, after "not locked" unless it uses exit. With
// TINY_HOST_SECONDS, SIGALRM ends it when it has printed nothing for that time since its last line.
#include <array>
#include <cmath>
#include <csignal>
#include <cstdio>
#include <cstdlib>
#include <cstring>
#include <exception>
#include <string>

#include <dlfcn.h>
#include <unistd.h>

#include "vst2/dispatch.h"
#include "vst2/host_opcodes.h"

namespace {

VstInt32 wantedChild = 0;
std::string usedOnCrash;
unsigned mostSeconds = 0;  // 0: for ever.

double trackSample(AEffect*) { return 1.5; }

VstIntPtr answerPlugin(AEffect*, VstInt32 opcode, VstInt32, VstIntPtr, void* ptr, float) {
  switch (opcode) {
    case audioMasterVersion:
      return 2400;
    case audioMasterCurrentId:
      return wantedChild;
    case audioMasterGetVendorString:
      std::strcpy(static_cast<char*>(ptr), "HOST");
      return 0;
    case audioMasterGetProductString:
      std::memset(ptr, 0, 64);
      std::strcpy(static_cast<char*>(ptr), "Tiny host");
      return 0;
    case audioMasterCanDo:
      return std::strcmp(static_cast<char*>(ptr), "sizeWindow") == 0 ? 1 : 0;
    case fourCharacterCode('N', 'I', 'D', 'U'):
      if (std::strcmp(static_cast<char*>(ptr), "niduGetTrackSampleForCurBlock") != 0) return 0;
      return reinterpret_cast<VstIntPtr>(trackSample);
    default:
      return 0;
  }
}

/// Bypasses stdout, which a plug-in may have locked.
void say(const std::string& text) {
  const std::string line = text + '\n';
  if (write(STDOUT_FILENO, line.data(), line.size()) < 0) _exit(7);
  alarm(mostSeconds);
}

void handleCrash(int) {
  say("crashed");
  if (usedOnCrash == "malloc") {
    void* volatile block = std::malloc(50000);
    std::free(block);
  } else if (usedOnCrash == "stdout") {
    flockfile(stdout);
    funlockfile(stdout);
  } else {
    std::exit(8);
  }
  say("not locked");
  _exit(8);
}

void setUpSignals() {
  for (const int number : {SIGABRT, SIGSEGV, SIGBUS, SIGFPE, SIGILL}) std::signal(number, SIG_DFL);
  if (const char* seconds = std::getenv("TINY_HOST_SECONDS")) {
    mostSeconds = static_cast<unsigned>(std::atoi(seconds));
  }
  if (const char* used = std::getenv("TINY_HOST_ON_CRASH")) {
    usedOnCrash = used;
    for (const int number : {SIGSEGV, SIGABRT}) std::signal(number, handleCrash);
  }
}

void drive(AEffect& effect) {
  dispatch(effect, effOpen);
  say("opened");
  for (const VstEffectOpcode opcode : {effGetEffectName, effGetParamDisplay}) {
    std::array<char, 4096> text{};
    dispatch(effect, opcode, 0, 0, text.data());
    say("text of " + std::to_string(std::strlen(text.data())));
  }
  if (effect.numParams > 0) {
    effect.setParameter(&effect, 0, effect.getParameter(&effect, 0));
    effect.setParameter(&effect, 0, 0.75f);
  }
  say("tail of " + std::to_string(dispatch(effect, effGetTailSize)));
  volatile double zero = 0.0;
  say(std::isinf(1.0 / zero) ? "divided" : "divided wrongly");
  std::array<char, 4096> folder{};
  say(std::string("in ") + getcwd(folder.data(), folder.size()));
  dispatch(effect, effClose);
  say("closed");
}

}  // namespace

int main(int argc, char** argv) {
  setUpSignals();
  if (argc > 3) wantedChild = std::atoi(argv[3]);
  void* module = argc > 1 ? dlopen(argv[1], RTLD_NOW | RTLD_LOCAL) : nullptr;
  if (module == nullptr) {
    say("not loaded");
    return 1;
  }
  say("loaded");
  void* symbol = dlsym(module, argc > 2 ? argv[2] : "VSTPluginMain");
  if (symbol == nullptr) {
    say("no entry");
    return 2;
  }
  try {
    AEffect* effect = reinterpret_cast<PluginEntryProc>(symbol)(answerPlugin);
    if (effect == nullptr) {
      say("no instance");
      return 3;
    }
    say("made " + std::to_string(effect->uniqueID));
    drive(*effect);
  } catch (int number) {
    say("caught int " + std::to_string(number));
    return 9;
  } catch (const std::exception& error) {
    say(std::string("caught exception ") + error.what());
    return 9;
  } catch (...) {
    say("caught something");
    return 9;
  }
  return 0;
}
