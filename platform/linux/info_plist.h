// SPDX-License-Identifier: MIT
// Reads the name of a bundle's executable from its Info.plist.
#pragma once

#include <optional>
#include <string>
#include <string_view>

namespace core_foundation {

/// The text of the key CFBundleExecutable in the outermost dict of an XML property list, without white space
/// around it. Nothing when there is no such key, when its value is not a string or is empty, and when `xml`
/// is anything but a whole, well-formed property list in UTF-8 (a binary one, for instance).
std::optional<std::string> bundleExecutableKey(std::string_view xml);

}  // namespace core_foundation
