// SPDX-License-Identifier: MIT
// Entities and character references in the text of an XML document.
#pragma once

#include <optional>
#include <string>
#include <string_view>

namespace core_foundation {

/// `raw` with the five predefined entities (`&amp;`) and character references (`&#65;`, `&#x41;`) resolved,
/// in UTF-8. Nothing when another entity or half of one stands in it.
std::optional<std::string> resolveEntities(std::string_view raw);

}  // namespace core_foundation
