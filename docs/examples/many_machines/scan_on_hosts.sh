#!/usr/bin/env bash
# SPDX-License-Identifier: MIT
# Scans the plug-ins of a laboratory on several hosts, with GNU parallel over ssh, and merges the results:
#
#     scan_on_hosts.sh HOST,HOST... PARTS RESULTS [ARGUMENT...]
#
# The scan is cut into PARTS parts. Each host runs one part at a time, all processors at work on it, and gets the next
# one when it is done; twice as many parts as hosts keep all of them busy to the end. A part that a host could not run
# is tried again, on another host where there is one. Results come back over ssh into the folder RESULTS, one stream
# of events for each part (part-1.jsonl), with what the scan said on standard error beside it (part-1.jsonl.err).
#
# ARGUMENT...: options and folders for vsttorture-scan. Every host has vsttorture-scan in its path, and the same
# plug-ins at the same paths. Without folders each host looks where hosts look.
#
# Where the homes of the hosts are on a network file system, add --cache off: SQLite's locks do not work there.
#
# Standard output is the merged report. Status: that of the merged scan, 0 for all as wanted and 1 for something not;
# 3 when a part is missing.
set -euo pipefail

if [[ $# -lt 3 ]]; then
  echo "usage: scan_on_hosts.sh HOST,HOST... PARTS RESULTS [ARGUMENT...]" >&2
  exit 2
fi
hosts=$1 parts=$2 results=$3
shift 3
mkdir -p "$results"
rm -f "$results"/part-*.jsonl*

# Status 1 of a scan says that a plug-in fails, which is a result. Anything above is a part that has to be tried again.
scan="vsttorture-scan --no-progress --json - --shard {}/$parts${*:+ ${*@Q}}; [ \$? -le 1 ]"
status=0
seq "$parts" | parallel --will-cite --sshlogin "$hosts" --jobs 1 --retries 3 --results "$results/part-{}.jsonl" \
  "$scan" >/dev/null 2>"$results/parallel.log" || status=$?
if [[ $status -ne 0 ]]; then
  echo "scan_on_hosts.sh: $status of $parts parts could not be scanned:" >&2
  cat "$results/parallel.log" >&2
  exit 3
fi
exec vsttorture-scan report "$results"/part-*.jsonl
