// SPDX-License-Identifier: MIT
// A description as JSON, in the form of docs/schema/plugin-description.schema.json.
#pragma once

#include <string>

#include "describer/plugin_description.h"

/// One JSON object and a newline.
std::string descriptionAsJson(const PluginDescription& description);
