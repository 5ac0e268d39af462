#!/usr/bin/env python3
# SPDX-License-Identifier: MIT
"""Holds the cost of vsttorture-scan against bare runs of vsttorture on the same plug-ins.

    cmake --preset release && cmake --build --preset release
    bench/scan.py [--build build/release] [--copies 200] [--rounds 7] [--modules FOLDER]

A round is: all plug-ins run one after the other without the scan; scanned with -j 1, without and with sandbox;
scanned with -j 2 without sandbox. Wall and processor time (user and system, of all processes) are taken of each; the
medians of all rounds are printed. What a scan of one plug-in costs beyond its run is the start of the scan, which
is taken off where the cost of a run is told. Bare runs write to /dev/null, which is the least that they can cost.
Plug-ins are copies of the sample effect, or with --modules those below that folder. Needs Python's standard library.
"""
import argparse
import json
import os
import pathlib
import resource
import shutil
import statistics
import subprocess
import sys
import tempfile
import time

WAYS = {
    "bare": None,
    "scan, no sandbox": ["-j", "1", "--sandbox=off"],
    "scan, sandbox": ["-j", "1", "--sandbox=required"],
    "scan, no sandbox, -j 2": ["-j", "2", "--sandbox=off"],
}


def children_seconds():
    used = resource.getrusage(resource.RUSAGE_CHILDREN)
    return used.ru_utime + used.ru_stime


def measured(work):
    """Wall and processor seconds of what `work` does in child processes."""
    wall, processor = time.perf_counter(), children_seconds()
    work()
    return time.perf_counter() - wall, children_seconds() - processor


class Bench:
    def __init__(self, build):
        self.scan = os.path.join(build, "vsttorture-scan")
        self.tool = os.path.join(build, "vsttorture")

    def run_bare(self, plugins):
        silent = [(os.POSIX_SPAWN_OPEN, number, "/dev/null", os.O_RDWR, 0) for number in range(3)]
        for plugin in plugins:
            process = os.posix_spawn(self.tool, [self.tool, plugin], os.environ, file_actions=silent)
            os.waitpid(process, 0)

    def run_scan(self, options, plugins):
        process = subprocess.run([self.scan, *options, "--quiet", "--no-progress", "--", *plugins],
                                 stdin=subprocess.DEVNULL, stdout=subprocess.DEVNULL, stderr=subprocess.PIPE,
                                 check=False)
        if process.returncode not in (0, 1):
            sys.exit(f"the scan ended with {process.returncode}: {process.stderr.decode(errors='replace')}")

    def measure(self, way, plugins):
        options = WAYS[way]
        return measured(lambda: self.run_bare(plugins) if options is None else self.run_scan(options, plugins))

    def modules_below(self, folder):
        """The modules that can be run here, as the scan finds them."""
        events = subprocess.run([self.scan, "--sandbox=off", "--no-progress", "--json", "-", folder],
                                stdout=subprocess.PIPE, stderr=subprocess.DEVNULL, check=False).stdout
        started = [json.loads(line) for line in events.splitlines() if b'"run_started"' in line]
        return sorted({event["plugin"]["bundle"] for event in started if event["plugin"]["child"] is None})


def main():
    parser = argparse.ArgumentParser(description=__doc__, formatter_class=argparse.RawDescriptionHelpFormatter)
    parser.add_argument("--build", default="build/release")
    parser.add_argument("--copies", type=int, default=200)
    parser.add_argument("--rounds", type=int, default=7)
    parser.add_argument("--modules")
    arguments = parser.parse_args()
    bench = Bench(os.path.abspath(arguments.build))
    with tempfile.TemporaryDirectory(prefix="scan-bench-") as folder:
        if arguments.modules:
            plugins = bench.modules_below(arguments.modules)
        else:
            sample = pathlib.Path(arguments.build, "plugins", "well_behaved_effect.so")
            plugins = [shutil.copy(sample, os.path.join(folder, f"{number}.so"))
                       for number in range(arguments.copies)]
        costs = {way: [] for way in WAYS}
        starts = {way: [] for way in WAYS}
        for _ in range(arguments.rounds):
            for way in WAYS:
                costs[way].append(bench.measure(way, plugins))
                starts[way].append(bench.measure(way, plugins[:1]))
    count = len(plugins)
    print(f"{count} plug-ins, {arguments.rounds} rounds, load {os.getloadavg()[0]:.1f}")
    print("| | wall s | processor s | against bare | wall ms a run | more than bare | processor ms a run |")
    print("|---|---|---|---|---|---|---|")

    def median(rounds, place):
        return statistics.median(one[place] for one in rounds)

    def per_run(way, place):
        if count < 2:
            return float("nan")
        return (median(costs[way], place) - median(starts[way], place)) / (count - 1) * 1000

    for way in WAYS:
        wall, processor = median(costs[way], 0), median(costs[way], 1)
        print(f"| {way} | {wall:.2f} | {processor:.2f} | {processor / median(costs['bare'], 1):.2f} "
              f"| {per_run(way, 0):.2f} | {per_run(way, 0) - per_run('bare', 0):.2f} | {per_run(way, 1):.2f} |")


if __name__ == "__main__":
    main()
