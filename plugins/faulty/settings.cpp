// SPDX-License-Identifier: MIT
#include "plugins/faulty/settings.h"

#include <cstdlib>
#include <fstream>

#include <dlfcn.h>

namespace sample_plugins {
namespace {

std::string variable(const char* name) {
  const char* text = std::getenv(name);
  return text == nullptr ? "" : text;
}

FaultSettings readSettings() {
  FaultSettings settings;
  settings.place = variable("FAULT_PLACE");
  if (!settings.place.empty()) {
    settings.kind = variable("FAULT_KIND");
    settings.status = std::atoi(variable("FAULT_STATUS").c_str());
    return settings;
  }
  Dl_info self = {};
  if (dladdr(reinterpret_cast<const void*>(&faultSettings), &self) == 0) return settings;
  std::ifstream file(std::string(self.dli_fname) + ".fault");
  file >> settings.kind >> settings.place >> settings.status;
  return settings;
}

}  // namespace

const FaultSettings& faultSettings() {
  static const FaultSettings settings = readSettings();
  return settings;
}

}  // namespace sample_plugins
