#!/bin/sh
# SPDX-License-Identifier: MIT
# Tries out the plug-ins that a CI job has built, and fails when one of them fails that did not fail before.
#
#     torture.sh [--accept] PLUG-IN|FOLDER... [OPTION...]
#
# Runs in any CI: all it needs is a folder that the CI keeps from one run to the next, and one for the reports.
#
#     TORTURE_STATE     .torture          kept: baseline.jsonl, the last results that were accepted, and what the scan
#                                         remembers of plug-ins that have not changed
#     TORTURE_REPORTS   torture-reports   made anew: scan.html for people, junit.xml for the CI, scan.jsonl for
#                                         programs
#
# Results are accepted when nothing new fails, and then replace the baseline. --accept accepts them in any case: what
# fails today is known from now on, and counts no more. OPTION...: more options for vsttorture-scan.
#
# Status: that of vsttorture-scan, 0 when nothing new fails and 1 when something does; 2 for wrong use; 3 when the
# scan could not be made.
#
# Uses vsttorture-scan where it is installed, else ./scan of the clone that this script is in, which builds it.
set -u

accepts=no
if [ "${1:-}" = --accept ]; then
  accepts=yes
  shift
fi
if [ $# -eq 0 ]; then
  echo "usage: torture.sh [--accept] PLUG-IN|FOLDER... [OPTION...]" >&2
  exit 2
fi
state=${TORTURE_STATE:-.torture}
reports=${TORTURE_REPORTS:-torture-reports}
scan=$(command -v vsttorture-scan) || scan=$(dirname "$0")/../../../scan
if [ ! -x "$scan" ]; then
  echo "torture.sh: vsttorture-scan is not installed, and $scan is not there" >&2
  exit 3
fi

mkdir -p "$reports" "$state" || exit 3
# Those of an earlier job are not to be taken for this one's. Nothing else is removed: the folder may hold more.
rm -f "$reports/scan.html" "$reports/junit.xml" "$reports/scan.jsonl" || exit 3
[ ! -e "$state/baseline.jsonl" ] || set -- --baseline "$state/baseline.jsonl" "$@"

status=0
"$scan" --cache "$state/cache.sqlite" --shrink --quiet --json "$reports/scan.jsonl" --junit "$reports/junit.xml" \
  --html "$reports/scan.html" "$@" || status=$?

# Replaced in one step: a job that is ended meanwhile leaves the old baseline.
if [ "$status" -eq 0 ] || { [ "$status" -eq 1 ] && [ "$accepts" = yes ]; }; then
  cp "$reports/scan.jsonl" "$state/baseline.new" && mv "$state/baseline.new" "$state/baseline.jsonl" || exit 3
fi
[ "$accepts" = no ] || [ "$status" -ne 1 ] || status=0
exit "$status"
