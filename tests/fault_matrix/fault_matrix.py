# SPDX-License-Identifier: MIT
"""Every end is a known end: the program with a faulty plug-in, one run for each kind of fault at each place.

    fault_matrix.py --program build/release/vsttorture --plugins build/release/plugins [--only REGEX] [--list]

Prints a line for each row that fails, then a summary. The rows stand in rows.py. With --consumer it is the example
of docs/examples that starts, reads and ends the program; its verdict is held to the row in both ways. What does not
apply to a build with a sanitizer stands in sanitizers.py, and is named in the summary.
"""
import argparse
import collections
import concurrent.futures
import os
import pathlib
import re
import resource
import sys
import tempfile
import time

sys.path.insert(0, str(pathlib.Path(__file__).resolve().parents[2] / "docs" / "examples"))
import try_plugin  # noqa: E402
from program_run import (LIMIT_IN_SECONDS, Seen, differences, environment_of, plugin_path,  # noqa: E402
                         run_row, take_default_signals)
from rows import all_rows  # noqa: E402
from sanitizers import proofs, reason_to_leave_out  # noqa: E402

HANG_LIMIT_IN_SECONDS = 3
PROOF_LIMIT_IN_SECONDS = 4


def run_by_consumer(row, program, plugins, limit, sanitizer):
    """One run as the example makes it. Nothing is seen of standard error."""
    with tempfile.TemporaryDirectory(prefix="fault_matrix.") as home:
        settings = [f"{name}={value}" for name, value in environment_of(row, home, sanitizer).items()]
        command = ["env", "-i", "-C", home, *settings, "sh", "-c", 'exec "$@" 2>/dev/null', "sh", program]
        limit = HANG_LIMIT_IN_SECONDS if row.end.status is None else limit
        output, status = try_plugin.run([*command, plugin_path(row, plugins)], limit)
        return Seen(output, row.end.errors, status, None, os.listdir(home))


def chosen_rows(pattern):
    return [row for row in all_rows() if re.search(pattern, row.name)]


def main():
    parser = argparse.ArgumentParser(description=__doc__, formatter_class=argparse.RawDescriptionHelpFormatter)
    parser.add_argument("--program", help="the vsttorture to run")
    parser.add_argument("--plugins", help="the folder of the sample plug-ins")
    parser.add_argument("--only", default="", metavar="REGEX", help="rows whose name matches")
    parser.add_argument("--list", action="store_true", help="print the rows and what they demand")
    parser.add_argument("--consumer", action="store_true", help="let the example run the program")
    parser.add_argument("--sanitizer", choices=["address", "thread"], help="the one that the program is built with")
    parser.add_argument("--jobs", type=int, default=16, help="runs at a time; some of them only wait")
    arguments = parser.parse_args()

    rows = chosen_rows(arguments.only)
    if arguments.list:
        for row in rows:
            print(f"{row.name}\t{row.end.steps} steps, {row.end.tail!r}, status {row.end.status}")
        return 0
    if not rows:
        print("no such row")
        return 1

    resource.setrlimit(resource.RLIMIT_CORE, (0, 0))
    take_default_signals()
    started = time.monotonic()
    program, plugins = os.path.abspath(arguments.program), os.path.abspath(arguments.plugins)
    sanitizer = arguments.sanitizer
    run = run_by_consumer if arguments.consumer else run_row

    def check(row, limit=LIMIT_IN_SECONDS):
        """What is wrong with the row; empty when it holds."""
        return differences(row, run(row, program, plugins, limit, sanitizer), try_plugin.judge, sanitizer)

    left_out = collections.Counter(reason_to_leave_out(row, sanitizer) for row in rows)
    applying = [row for row in rows if reason_to_leave_out(row, sanitizer) is None]
    failed = 0
    with concurrent.futures.ThreadPoolExecutor(arguments.jobs) as pool:
        for row, found in zip(applying, pool.map(check, applying)):
            if found:
                failed += 1
                print(f"{row.name}: {'; '.join(found)}", flush=True)
        tried = proofs(rows, sanitizer)
        for row, found in zip(tried, pool.map(lambda row: check(row, PROOF_LIMIT_IN_SECONDS), tried)):
            if not found:
                failed += 1
                print(f"{row.name}: holds, although it is said not to apply", flush=True)
    for reason, count in left_out.items():
        if reason is not None:
            print(f"{count} rows do not apply: {reason}")
    print(f"{len(applying)} rows in {time.monotonic() - started:.0f} s, {failed} failed")
    return 1 if failed else 0


if __name__ == "__main__":
    sys.exit(main())
