#!/usr/bin/env python3
# SPDX-License-Identifier: MIT
"""Reads the events of a scan while it runs, as a host does that fills its list of plug-ins:

    read_scan.py VSTTORTURE_SCAN [ARGUMENT...]

Starts VSTTORTURE_SCAN with --describe and these arguments (folders and options), and prints a line for each plug-in
as soon as its verdict is there: the verdict, the name, and where it is. Exits with the status of the scan, or with 3
when it cannot be started.
"""
import json
import os
import re
import subprocess
import sys


def printable(text):
    """A text of a plug-in, or a path, without control characters: a terminal may obey them."""
    return re.sub("[\x00-\x1f\x7f-\x9f]", "?", text)


def line_of(event):
    plugin = event["plugin"]
    place = plugin["bundle"]
    name = os.path.basename(place)
    if plugin["child"] is not None:
        place += f" #{plugin['child']}"
        name = plugin["childName"] or name
    # Only there for a plug-in that could be described.
    name = event.get("description", {}).get("name") or name
    return f"{event['verdict']:<12}  {printable(name)}  {printable(place)}"


def main():
    if len(sys.argv) < 2:
        print("usage: read_scan.py VSTTORTURE_SCAN [ARGUMENT...]", file=sys.stderr)
        return 2
    command = [sys.argv[1], "--json", "-", "--quiet", "--no-progress", "--describe", *sys.argv[2:]]
    try:
        scan = subprocess.Popen(command, stdin=subprocess.DEVNULL, stdout=subprocess.PIPE, stderr=subprocess.DEVNULL)
    except OSError as error:
        print(f"cannot start {sys.argv[1]}: {error.strerror}", file=sys.stderr)
        return 3
    with scan:
        for line in scan.stdout:
            event = json.loads(line)
            # scan_started, run_started (what runs now) and scan_ended (the counts) come as well. Pass over events
            # that you do not know: there may be more of them one day.
            if event["event"] == "plugin_ended":
                print(line_of(event), flush=True)
    return scan.returncode if scan.returncode >= 0 else 3


if __name__ == "__main__":
    sys.exit(main())
