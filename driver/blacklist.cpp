// SPDX-License-Identifier: MIT
#include "driver/blacklist.h"

#include <cctype>

namespace {

constexpr const char* kRefusedBundles[] = {
    "GroveSampler.vst",
    "Grove.vst",
    "Ashkeys VST.vst",
    "Wexlo3.VST",
    "NIDU Parlo Instrument.vst",
    "Wexlo2 VST 5.1.vst",
    "Wexlo2 VST 7.1.vst",
    "Wexlo2 VST 5.1.vst",    // On purpose: listed twice.
    "WeXlo2 VST. Quad.vst",  // On purpose: this capital X and this full stop.
    "Wexlo2 VST.vst",
};

/// toupper() for a signed character: characters below 0 stay as they are.
signed char upperCase(char c) {
  return static_cast<signed char>(c < 0 ? c : static_cast<char>(std::toupper(c)));
}

}  // namespace

bool IsBlackListed(const std::string& path, int, bool& matched) {
  matched = false;
  const std::string name = bundleFileName(path);
  for (const char* refused : kRefusedBundles) {
    if (my_stricmp(name.c_str(), refused) == 0) {
      matched = true;
      return true;
    }
  }
  return false;
}

int my_stricmp(const char* a, const char* b) {
  for (;; ++a, ++b) {
    const auto difference = static_cast<signed char>(upperCase(*a) - upperCase(*b));
    if (difference != 0) return difference;
    if (*a == '\0') return 0;
  }
}

std::string bundleFileName(const std::string& path) {
  const std::size_t slash = path.rfind('/');
  if (path.size() < 2 || slash == std::string::npos) return {};
  return path.substr(slash + 1);
}
