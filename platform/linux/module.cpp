// SPDX-License-Identifier: MIT
// CoreFoundation's bundles on the dynamic loader.
#include <cstddef>
#include <filesystem>
#include <string>
#include <system_error>
#include <utility>
#include <vector>

#include <dlfcn.h>
#include <link.h>

#include "platform/core_foundation.h"
#include "platform/entry_point_name.h"
#include "platform/linux/core_foundation_objects.h"
#include "platform/linux/file_kind.h"

namespace fs = std::filesystem;

// NOLINTBEGIN(bugprone-reserved-identifier,misc-non-private-member-variables-in-classes): the system's own
// name, and a record that only this file sees
struct __CFBundle final : core_foundation::Object {
  explicit __CFBundle(std::string pathOfBundle) : Object(Lifetime::kOwned), path(std::move(pathOfBundle)) {}
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
// purpose: called through a volatile pointer, so that the compiler cannot see that declaration, and their
// exceptions reach our caller unchanged.
void* (*volatile const openModule)(const char* path, int mode) = dlopen;

// The name of a folder without its last extension; empty for "/".
std::string nameOf(const fs::path& folder) {
  const fs::path plain = folder.lexically_normal();
  return (plain.has_filename() ? plain : plain.parent_path()).stem().string();
}

// "a, b and c".
std::string listed(const std::vector<std::string>& words) {
  std::string list;
  for (std::size_t i = 0; i < words.size(); ++i)
    list += (i == 0 ? "" : i + 1 == words.size() ? " and " : ", ") + words[i];
  return list;
}

// The executable of the bundle at `path`, a file or a folder. Empty, with a line on standard error, when a
// folder has none.
std::string findExecutable(const std::string& path) {
  std::error_code error;
  if (!fs::is_directory(path, error)) return path;

  const std::string name = nameOf(path);
  if (name.empty()) {
    core_foundation::logFailure(path + " has no executable");
    return {};
  }
  const std::vector<std::string> files = {name, name + ".so", "lib" + name + ".so"};
  const std::string ofArchitecture = core_foundation::architectureOfProgram() + std::string("-linux");
  std::vector<std::string> folders = {"Contents/" + ofArchitecture, "Contents/Linux", "Contents", "."};
  for (const std::string& folder : folders)
    for (const std::string& file : files)
      if (const fs::path found = (fs::path(path) / folder / file).lexically_normal();
          fs::is_regular_file(found, error))
        return found.string();

  folders.back() = "the folder itself";
  core_foundation::logFailure(path + " has no executable: looked for " + listed(files) + " in " +
                              listed(folders));
  return {};
}

// Why the dynamic loader refused the file at `path`. Must be called right after the refusal: dlerror() tells
// the latest failure of this thread, and only once.
std::string reasonOfRefusal(const std::string& path) {
  const char* const text = dlerror();  // NOLINT(concurrency-mt-unsafe): each thread has its own
  const std::string loadersReason = text != nullptr ? text : path + " cannot be loaded";
  return core_foundation::whyNotForThisProgram(path).value_or(loadersReason);
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

CFStringRef systemEntryPointName() { return CFSTR("main"); }

CFBundleRef CFBundleCreate(CFAllocatorRef, CFURLRef url) {
  const std::string& path = url->path;
  std::error_code error;
  const fs::file_status status = fs::status(path, error);
  if (is_regular_file(status) || is_directory(status)) return new __CFBundle(path);
  if (exists(status)) {
    core_foundation::logFailure(path + " is neither a file nor a directory");
  } else {
    if (!error) error = make_error_code(std::errc::no_such_file_or_directory);
    core_foundation::logFailure(path + ": " + error.message());
  }
  return nullptr;
}

Boolean CFBundleLoadExecutable(CFBundleRef bundle) {
  if (bundle->module != nullptr) return 1;
  const std::string executable = findExecutable(bundle->path);
  if (executable.empty()) return 0;
  // All symbols are bound now: a missing one fails the load instead of ending the process later.
  bundle->module = openModule(executable.c_str(), RTLD_NOW | RTLD_LOCAL);
  if (bundle->module != nullptr) return 1;
  core_foundation::logFailure(reasonOfRefusal(executable));
  return 0;
}

void* CFBundleGetFunctionPointerForName(CFBundleRef bundle, CFStringRef name) {
  if (bundle->module == nullptr) return nullptr;
  void* const address = dlsym(bundle->module, name->text.c_str());
  // dlsym also searches the libraries that the module needs.
  const bool isOfThisModule =
      address != nullptr && recordOfAddress(address) == recordOfModule(bundle->module);
  return isOfThisModule ? address : nullptr;
}

void CFBundleUnloadExecutable(CFBundleRef bundle) { bundle->unload(); }
