// SPDX-License-Identifier: MIT
// CoreFoundation's bundles on the dynamic loader.
#include <filesystem>
#include <string>
#include <system_error>
#include <utility>

#include <dlfcn.h>
#include <link.h>

#include "platform/core_foundation.h"
#include "platform/linux/bundle_layout.h"
#include "platform/linux/core_foundation_objects.h"
#include "platform/linux/elf_header.h"
#include "platform/linux/failure_line.h"
#include "platform/linux/file_format.h"

// NOLINTBEGIN(bugprone-reserved-identifier,misc-non-private-member-variables-in-classes): the system's own
// name, and a record that only this file sees
struct __CFBundle final : core_foundation::CountedObject {
  explicit __CFBundle(std::string whereItIs) : path(std::move(whereItIs)) {}
  ~__CFBundle() override { unload(); }

  void unload() {
    if (module != nullptr) dlclose(module);
    module = nullptr;
  }

  const std::string path;
  void* module = nullptr;  ///< The dynamic loader's handle, owned; null while not loaded.
};
// NOLINTEND(bugprone-reserved-identifier,misc-non-private-member-variables-in-classes)

namespace {

// The C library declares dlopen as never throwing, but a plug-in's static constructors run inside it. On
// purpose: called through a volatile pointer, so that the compiler cannot see that declaration and an
// exception passes through us as it came.
void* (*volatile const openModule)(const char* path, int mode) = dlopen;

// Why the dynamic loader refused the file at `path`. To be asked at once, as dlerror forgets.
std::string reasonOfRefusal(const std::string& path) {
  const char* const text = dlerror();  // NOLINT(concurrency-mt-unsafe): each thread has its own
  const std::string said = text != nullptr ? text : path + " cannot be loaded";
  if (const auto mismatch = core_foundation::architectureMismatch(path)) return *mismatch;
  return core_foundation::formatMismatch(path).value_or(said);
}

// The dynamic loader's records of a handle and of the module that an address lies in; null when unknown.
const link_map* recordOfModule(void* module) {
  link_map* record = nullptr;
  return dlinfo(module, RTLD_DI_LINKMAP, &record) == 0 ? record : nullptr;
}
const link_map* recordOfAddress(const void* address) {
  Dl_info unused{};
  void* record = nullptr;
  return dladdr1(address, &unused, &record, RTLD_DL_LINKMAP) != 0 ? static_cast<link_map*>(record) : nullptr;
}

}  // namespace

CFBundleRef CFBundleCreate(CFAllocatorRef, CFURLRef url) {
  std::error_code error;
  const std::filesystem::file_status status = std::filesystem::status(url->path, error);
  if (is_regular_file(status) || is_directory(status)) return new __CFBundle(url->path);
  core_foundation::logFailure(core_foundation::findBundleExecutable(url->path).problem);
  return nullptr;
}

Boolean CFBundleLoadExecutable(CFBundleRef bundle) {
  if (bundle->module != nullptr) return 1;
  const core_foundation::BundleExecutable executable = core_foundation::findBundleExecutable(bundle->path);
  if (executable.path.empty()) {
    core_foundation::logFailure(executable.problem);
    return 0;
  }
  // All symbols are bound now: a missing one fails the load instead of ending the process later.
  bundle->module = openModule(executable.path.c_str(), RTLD_NOW | RTLD_LOCAL);
  if (bundle->module != nullptr) return 1;
  core_foundation::logFailure(reasonOfRefusal(executable.path));
  return 0;
}

void* CFBundleGetFunctionPointerForName(CFBundleRef bundle, CFStringRef name) {
  if (bundle->module == nullptr) return nullptr;
  void* const address = dlsym(bundle->module, name->text.c_str());
  // dlsym looks into the libraries that the module needs, too.
  const bool ofThisModule = address != nullptr && recordOfAddress(address) == recordOfModule(bundle->module);
  return ofThisModule ? address : nullptr;
}

void CFBundleUnloadExecutable(CFBundleRef bundle) { bundle->unload(); }
