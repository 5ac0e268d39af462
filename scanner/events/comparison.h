// SPDX-License-Identifier: MIT
// What has changed since an earlier result of the same plug-in. A pure function.
#pragma once

#include "scanner/events/result.h"

namespace scanner {

/// Compares `now` with `earlier`, which may be null: the plug-in is seen for the first time. `isUnchanged` says
/// that the plug-in's file, the worker and the options are the same as they were then, so that another verdict
/// is the plug-in's own doing.
///
/// A failure that is wanted (PluginResult::isWanted), and a plug-in that is skipped, are no change worth a word.
/// An earlier result that says nothing about the plug-in (skipped, not_run) counts as none.
Comparison compare(const PluginResult& now, const PluginResult* earlier, bool isUnchanged);

}  // namespace scanner
