// SPDX-License-Identifier: MIT
// The page around the results: scanner/report/html/page.html with its style and its script in it.
#pragma once

namespace scanner {

/// Made by cmake/embed_page.cmake. What the report fills in stands as "{{name}}".
extern const char kHtmlTemplate[];

}  // namespace scanner
