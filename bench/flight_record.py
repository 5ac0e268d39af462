#!/usr/bin/env python3
# SPDX-License-Identifier: MIT
"""What the flight record costs: vsttorture and vsttorture-worker --record against a vsttorture without its stores.

    bench/flight_record.py --without PROGRAM [--build build/bench] [--rounds 15]

PROGRAM is a vsttorture that was built from the commit before the stores. The plug-in answers nothing and seeds the
random numbers, so that all three draw the same tests: their lines are compared. A round runs the three one after the
other, in an order that changes; a ratio is taken within a round. The median over all rounds is printed with the
quartiles. Processor time is user and system time.
"""
import argparse
import itertools
import os
import statistics
import subprocess
import sys
import tempfile

CASES = {
    "null 10000 x 1000": (10000, 1000, 1),
    "light: 16 x 4": (16, 4, 20),
}


def run(command, environment):
    """Processor time in seconds, and the lines."""
    with tempfile.TemporaryFile() as output:
        process = subprocess.Popen(command, stdout=output, env=environment)
        _, status, usage = os.wait4(process.pid, 0)
        process.returncode = os.waitstatus_to_exitcode(status)
        if process.returncode != 0:
            sys.exit(f"{' '.join(command)}: ended with {process.returncode}")
        output.seek(0)
        return usage.ru_utime + usage.ru_stime, output.read()


def main():
    parser = argparse.ArgumentParser(description=__doc__, formatter_class=argparse.RawDescriptionHelpFormatter)
    parser.add_argument("--without", required=True, help="a vsttorture without the stores")
    parser.add_argument("--build", default="build/bench", help="folder of the build (build/bench)")
    parser.add_argument("--rounds", type=int, default=15)
    parser.add_argument("--case", choices=list(CASES), help="one case alone")
    arguments = parser.parse_args()
    build = os.path.abspath(arguments.build)

    with tempfile.TemporaryDirectory() as folder:
        plugin = os.path.join(build, "plugins", "null_plugin.so")
        record = os.path.join(folder, "record")
        programs = {
            "without": [os.path.abspath(arguments.without), plugin],
            "vsttorture": [os.path.join(build, "vsttorture"), plugin],
            "vsttorture-worker --record": [os.path.join(build, "vsttorture-worker"), "--record", record, plugin],
        }
        orders = itertools.cycle(itertools.permutations(programs))
        for case, (parameters, program_count, factor) in CASES.items():
            if arguments.case not in (None, case):
                continue
            ratios = {name: [] for name in programs}
            for turn in range(arguments.rounds * factor + 1):
                environment = {**os.environ, "HOME": folder, "NULL_PLUGIN_PARAMETERS": str(parameters),
                               "NULL_PLUGIN_PROGRAMS": str(program_count), "NULL_PLUGIN_SEED": str(turn)}
                cost = {name: run(programs[name], environment) for name in next(orders)}
                if len({lines for _, lines in cost.values()}) != 1:
                    sys.exit("the programs printed different lines")
                if turn == 0:
                    continue  # warms the caches
                for name in programs:
                    ratios[name].append(cost[name][0] / cost["without"][0])
            for name in list(programs)[1:]:
                low, middle, high = statistics.quantiles(ratios[name], n=4)
                print(f"{case:20} {name:28} {middle:.3f} ({low:.3f} to {high:.3f}), {len(ratios[name])} rounds",
                      flush=True)


if __name__ == "__main__":
    main()
