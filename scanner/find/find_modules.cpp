// SPDX-License-Identifier: MIT
#include "scanner/find/find_modules.h"

#include <algorithm>
#include <cerrno>
#include <cstring>
#include <filesystem>
#include <map>
#include <set>
#include <utility>

#include <dirent.h>
#include <sys/stat.h>

#include "scanner/find/module_file.h"

namespace scanner {
namespace {

/// Deeper than any folder of plug-ins; a limit for what a file system in disorder may pretend to be.
constexpr int kMostLevels = 40;

// Below these, folders named after a processor and system ("x86_64-linux-gnu") and those of packages are looked
// into for the folders that follow.
constexpr const char* kHomePlaces[] = {"/.vst", "/.lxvst"};
constexpr const char* kSystemPlaces[] = {
    "/usr/lib/vst",   "/usr/local/lib/vst", "/usr/lib/lxvst",   "/usr/local/lib/lxvst",
    "/usr/lib32/vst", "/usr/lib64/vst",     "/usr/lib64/lxvst",
};
constexpr const char* kLibraryFolder = "/usr/lib";
constexpr const char* kPluginFolders[] = {"vst", "lxvst"};

std::vector<std::string> namesIn(const std::string& folder, std::string& problem) {
  std::vector<std::string> names;
  DIR* directory = opendir(folder.c_str());
  if (directory == nullptr) {
    problem = std::strerror(errno);
    return names;
  }
  errno = 0;
  while (const dirent* entry = readdir(directory)) {
    const std::string name = entry->d_name;
    if (name != "." && name != "..") names.push_back(name);
    errno = 0;
  }
  if (errno != 0) problem = std::strerror(errno);
  closedir(directory);
  std::sort(names.begin(), names.end());
  return names;
}

bool isFolder(const std::string& path) {
  struct stat status = {};
  return stat(path.c_str(), &status) == 0 && S_ISDIR(status.st_mode);
}

/// From the root, without slashes at the end. ".." stays, since what stands before it may be a link.
std::string absolutePath(std::string path) {
  while (path.compare(0, 2, "./") == 0) path.erase(0, path.find_first_not_of('/', 1));
  if (path == ".") path.clear();
  if (path.empty() || path[0] != '/') {
    std::error_code error;
    const std::string current = std::filesystem::current_path(error).string();
    path = current == "/" ? "/" + path : path.empty() ? current : current + "/" + path;
  }
  while (path.size() > 1 && path.back() == '/') path.pop_back();
  return path;
}

bool isBundleName(const std::string& path) {
  if (path.size() < 5) return false;
  std::string end = path.substr(path.size() - 4);
  std::transform(end.begin(), end.end(), end.begin(),
                 [](char c) { return c >= 'A' && c <= 'Z' ? c + 32 : c; });
  return end == ".vst";
}

/// The name of the executable that a folder would hold: its own, without the extension.
std::string executableName(const std::string& bundle) {
  const std::size_t slash = bundle.rfind('/');
  const std::string name = slash == std::string::npos ? bundle : bundle.substr(slash + 1);
  const std::size_t point = name.rfind('.');
  return point == std::string::npos || point == 0 ? name : name.substr(0, point);
}

class Search {
 public:
  void searchFolder(const std::string& folder, int level) {
    struct stat status = {};
    if (stat(folder.c_str(), &status) != 0) {
      result.unreadable.push_back({folder, std::strerror(errno)});
      return;
    }
    if (!visited.insert({status.st_dev, status.st_ino}).second || level > kMostLevels) return;
    std::string problem;
    const std::vector<std::string> names = namesIn(folder, problem);
    if (!problem.empty()) result.unreadable.push_back({folder, problem});
    for (const std::string& name : names) searchEntry((folder == "/" ? "" : folder) + "/" + name, level);
  }

  void searchEntry(const std::string& path, int level) {
    struct stat status = {};
    if (stat(path.c_str(), &status) != 0) {
      // Gone meanwhile, a link to nothing or to itself: no plug-in, and nobody's trouble.
      const bool isNothing = errno == ENOENT || errno == ENOTDIR || errno == ELOOP;
      if (!isNothing) result.unreadable.push_back({path, std::strerror(errno)});
      return;
    }
    if (S_ISDIR(status.st_mode)) {
      if (!isBundleName(path) || !addBundle(path)) searchFolder(path, level + 1);
    } else if (S_ISREG(status.st_mode)) {
      addFile(path, false);
    }
  }

  /// `isNamed`: on the command line, so that it is a plug-in whatever it holds.
  void addFile(const std::string& path, bool isNamed) {
    errno = 0;
    const std::optional<ModuleFile> file = readModuleFile(path);
    if (!file) {
      const int error = errno;
      if (error == ENOENT && !isNamed) return;
      (isNamed ? result.missing : result.unreadable)
          .push_back({path, error != 0 ? std::strerror(error) : "it is neither a file nor a folder"});
      return;
    }
    if (file->target || isNamed) add({path, path, file->identity, file->target.value_or(Target{})});
  }

  /// True when the folder is a bundle: one module for each executable that some worker would load from it.
  bool addBundle(const std::string& path) {
    const std::string name = executableName(path);
    bool isBundle = false;
    for (const char* architecture : {"x86_64", "i386", "aarch64"}) {
      const std::string own = std::string("/Contents/") + architecture + "-linux";
      const std::string executable = executableIn(path, {own, "/Contents/Linux", "/Contents", ""}, name);
      if (executable.empty()) continue;
      const std::optional<ModuleFile> file = readModuleFile(executable);
      if (!file || !file->target || file->target->processor != architecture) continue;
      add({path, executable, file->identity, *file->target});
      isBundle = true;
    }
    if (isBundle) return true;
    const std::string executable = executableIn(path, {"/Contents/MacOS"}, name);
    const std::optional<ModuleFile> file = executable.empty() ? std::nullopt : readModuleFile(executable);
    if (!file || !file->target) return false;
    add({path, executable, file->identity, *file->target});
    return true;
  }

  FindResult finish() {
    for (auto& [key, module] : found) {
      std::vector<std::string>& names = module.otherNames;
      std::sort(names.begin(), names.end());
      names.erase(std::unique(names.begin(), names.end()), names.end());
      result.modules.push_back(std::move(module));
    }
    std::sort(result.modules.begin(), result.modules.end(), [](const Module& a, const Module& b) {
      return std::tie(a.bundle, a.target.processor) < std::tie(b.bundle, b.target.processor);
    });
    return std::move(result);
  }

  FindResult result;

 private:
  static std::string executableIn(const std::string& bundle, const std::vector<std::string>& folders,
                                  const std::string& name) {
    for (const std::string& folder : folders) {
      for (const std::string& file : {name, name + ".so", "lib" + name + ".so"}) {
        const std::string path = bundle + folder + "/" + file;
        struct stat status = {};
        if (stat(path.c_str(), &status) == 0 && S_ISREG(status.st_mode)) return path;
      }
    }
    return {};
  }

  void add(Module module) {
    const auto key = std::make_pair(module.identity.device, module.identity.inode);
    const auto [at, isNew] = found.try_emplace(key, module);
    if (!isNew && at->second.bundle != module.bundle) at->second.otherNames.push_back(module.bundle);
  }

  std::set<std::pair<dev_t, ino_t>> visited;
  std::map<std::pair<std::uint64_t, std::uint64_t>, Module> found;
};

}  // namespace

FindResult findModules(const std::vector<std::string>& paths) {
  Search search;
  for (const std::string& named : paths) {
    const std::string path = absolutePath(named);
    struct stat status = {};
    // Asked by the path as it was named, since a slash at its end demands a folder.
    if (named.empty() || stat(named.c_str(), &status) != 0) {
      search.result.missing.push_back({named, std::strerror(named.empty() ? ENOENT : errno)});
    } else if (!S_ISDIR(status.st_mode)) {
      search.addFile(path, true);
    } else if (!isBundleName(path) || !search.addBundle(path)) {
      search.result.places.push_back(path);
      search.searchFolder(path, 0);
    }
  }
  return search.finish();
}

std::vector<std::string> namedPlaces(const char* vstPath, const char* home) {
  std::vector<std::string> places;
  if (vstPath != nullptr && *vstPath != '\0') {
    std::string rest = vstPath;
    for (std::size_t colon = 0; colon != std::string::npos;
         rest = rest.substr(std::min(colon + 1, rest.size()))) {
      colon = rest.find(':');
      if (const std::string place = rest.substr(0, colon); !place.empty()) places.push_back(place);
    }
    return places;
  }
  if (home != nullptr && *home != '\0') {
    for (const char* place : kHomePlaces) places.push_back(std::string(home) + place);
  }
  for (const char* place : kSystemPlaces) places.emplace_back(place);
  // The multi-architecture folders, and in these the folders of packages that keep their plug-ins apart.
  std::string ignored;
  for (const std::string& name : namesIn(kLibraryFolder, ignored)) {
    if (name.find("-linux-") == std::string::npos) continue;
    const std::string folder = std::string(kLibraryFolder) + "/" + name;
    for (const char* plugins : kPluginFolders) places.push_back(folder + "/" + plugins);
    for (const std::string& package : namesIn(folder, ignored)) {
      for (const char* plugins : kPluginFolders) {
        const std::string place = folder + "/" + package + "/" + plugins;
        if (isFolder(place)) places.push_back(place);
      }
    }
  }
  return places;
}

std::vector<std::string> defaultPlaces(const char* vstPath, const char* home) {
  std::vector<std::string> places = namedPlaces(vstPath, home);
  places.erase(
      std::remove_if(places.begin(), places.end(), [](const std::string& place) { return !isFolder(place); }),
      places.end());
  return places;
}

}  // namespace scanner
