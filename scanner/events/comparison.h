// SPDX-License-Identifier: MIT
// What has changed since an earlier result of the same plug-in. Pure functions.
#pragma once

#include "scanner/events/result.h"

namespace scanner {

/// Compares `now` with `earlier`, which may be null: the plug-in is seen for the first time. `isUnchanged`
/// says that the plug-in's file, the worker and the options are the same as they were then, so that another
/// end is the plug-in's own doing.
///
/// A plug-in whose verdict is good fails all the same where a tool has found something in it
/// (failsByFindings()). It still fails while the tool finds no more of any kind than it did, is new when it
/// finds more, also when it did not look before, and is mended when it has looked and found nothing. Of a bad
/// verdict findings are no part.
///
/// A failure that is wanted (PluginResult::isWanted), a plug-in that is skipped, and one that could not be
/// run are no change worth a word. An earlier result that says nothing about the plug-in (skipped, not_run)
/// counts as none.
Comparison compare(const PluginResult& now, const PluginResult* earlier, bool isUnchanged);

/// Whether what a tool has found is why the plug-in is not as wanted: its verdict is good, and no row of a
/// list says how it should end.
bool failsByFindings(const PluginResult& result);

}  // namespace scanner
