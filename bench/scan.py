#!/usr/bin/env python3
# SPDX-License-Identifier: MIT
"""Holds the cost of vsttorture-scan against bare runs of vsttorture on the same plug-ins.

    cmake --preset bench && cmake --build --preset bench
    bench/scan.py [--build build/bench] [--copies 200] [--rounds 7] [--modules [FOLDER...]]
    bench/scan.py --sizes 1000 2500 5000 10000 [--build build/bench] [--jobs 2]
    bench/scan.py --again [--build build/bench] [--modules [FOLDER...]]

A round is: all plug-ins run one after the other without the scan; scanned with -j 1, without and with sandbox;
scanned with -j 2 without sandbox; every second round in the opposite order. Wall and processor time (user and system, of
all processes) are taken of each; the medians of all rounds are printed, and of a ratio the median of the rounds' ratios.
What a scan of one plug-in costs beyond its run is the start of the scan, which is taken off where the cost of a run is
told. Bare runs write to /dev/null, which is the least that they can cost. All runs draw the same tests: same_draws.so is
preloaded, since the draws decide how long a run takes.
Plug-ins are copies of the sample effect, or with --modules those in these folders, or all of
this machine. A ratio follows each table.

With --sizes it scans so many copies of the plug-in that answers nothing, once each, and prints wall time, time for each
plug-in and the scan's own peak memory. They are copies, since hard links are one plug-in to the scan. No scan uses
remembered results, but those of --again, which follow one that has filled the database. Needs Python's standard library.
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
        self.null_plugin = os.path.join(build, "plugins", "null_plugin.so")
        self.environment = {**os.environ, "LD_PRELOAD": os.path.join(build, "bench", "same_draws.so")}

    def run_bare(self, plugins):
        silent = [(os.POSIX_SPAWN_OPEN, number, "/dev/null", os.O_RDWR, 0) for number in range(3)]
        for plugin in plugins:
            process = os.posix_spawn(self.tool, [self.tool, plugin], self.environment, file_actions=silent)
            os.waitpid(process, 0)

    def run_scan(self, options, plugins):
        process = subprocess.run([self.scan, "--cache=off", *options, "--quiet", "--no-progress", "--", *plugins],
                                 env=self.environment, stdin=subprocess.DEVNULL, stdout=subprocess.DEVNULL,
                                 stderr=subprocess.PIPE, check=False)
        if process.returncode not in (0, 1):
            sys.exit(f"the scan ended with {process.returncode}: {process.stderr.decode(errors='replace')}")

    def measure(self, way, plugins):
        options = WAYS[way]
        return measured(lambda: self.run_bare(plugins) if options is None else self.run_scan(options, plugins))

    def modules_in(self, folders):
        """The modules that can be run here, as the scan finds them; without folders those of this machine."""
        events = subprocess.run([self.scan, "--cache=off", "--sandbox=off", "--no-progress", "--json", "-", *folders],
                                stdout=subprocess.PIPE, stderr=subprocess.DEVNULL, check=False).stdout
        started = [json.loads(line) for line in events.splitlines() if b'"run_started"' in line]
        return sorted({event["plugin"]["bundle"] for event in started if event["plugin"]["child"] is None})

    def scan_again(self, options, folders, rounds):
        """Wall seconds of scans that follow one with the same options; each must remember everything."""
        with tempfile.TemporaryDirectory(prefix="scan-bench-") as folder:
            command = [self.scan, "--cache", os.path.join(folder, "results"), "--no-progress", *options, *folders]
            walls = []
            for number in range(rounds + 1):
                begin = time.perf_counter()
                process = subprocess.run(command, stdin=subprocess.DEVNULL, stdout=subprocess.PIPE,
                                         stderr=subprocess.DEVNULL, check=False)
                if number > 0:
                    walls.append(time.perf_counter() - begin)
                    if b'"run_started"' in process.stdout:
                        sys.exit("a plug-in was run again")
        return walls

    def peak_of_scan(self, options, folder):
        """Wall seconds of a scan, and the peak of its own resident memory in bytes, without that of its children."""
        begin = time.perf_counter()
        process = subprocess.Popen([self.scan, "--cache=off", *options, "--quiet", "--no-progress", folder],
                                   stdin=subprocess.DEVNULL, stdout=subprocess.DEVNULL)
        peak = 0
        while process.poll() is None:
            try:
                status = pathlib.Path(f"/proc/{process.pid}/status").read_text()
            except OSError:
                continue
            peak = max([peak] + [int(line.split()[1]) * 1024 for line in status.splitlines()
                                 if line.startswith("VmHWM:")])
            time.sleep(0.02)
        seconds = time.perf_counter() - begin
        if process.returncode not in (0, 1):
            sys.exit(f"the scan ended with {process.returncode}")
        return seconds, peak


def compare_sizes(bench, sizes, jobs):
    print(f"load {os.getloadavg()[0]:.1f}, -j {jobs}, no sandbox")
    print("| plug-ins | wall s | ms a plug-in | peak memory MiB |")
    print("|---|---|---|---|")
    costs = []
    for size in sizes:
        with tempfile.TemporaryDirectory(prefix="scan-bench-") as folder:
            for number in range(size):
                shutil.copy(bench.null_plugin, os.path.join(folder, f"{number:05}.so"))
            seconds, peak = bench.peak_of_scan(["-j", str(jobs), "--sandbox=off"], folder)
        costs.append(seconds / size * 1000)
        print(f"| {size} | {seconds:.1f} | {costs[-1]:.2f} | {peak / 2**20:.1f} |", flush=True)
    print(f"time for a plug-in, {sizes[-1]} against {sizes[0]}: {costs[-1] / costs[0]:.2f} (goal: linear, 1)")


def compare_again(bench, folders, rounds):
    print(f"load {os.getloadavg()[0]:.1f}, {rounds} rounds")
    count = len(bench.modules_in(folders))
    for name, options in (("for people", []), ("with --json", ["--json", "-"])):
        walls = bench.scan_again(options, folders, rounds)
        print(f"second scan of {count} unchanged plug-ins, {name}: {statistics.median(walls) * 1000:.0f} ms "
              f"({min(walls) * 1000:.0f} to {max(walls) * 1000:.0f}; goal: 50)")


def main():
    parser = argparse.ArgumentParser(description=__doc__, formatter_class=argparse.RawDescriptionHelpFormatter)
    parser.add_argument("--build", default="build/bench")
    parser.add_argument("--copies", type=int, default=200)
    parser.add_argument("--rounds", type=int, default=7)
    parser.add_argument("--modules", nargs="*", metavar="FOLDER")
    parser.add_argument("--sizes", type=int, nargs="+", metavar="COUNT")
    parser.add_argument("--again", action="store_true", help="how long a scan takes that remembers everything")
    parser.add_argument("--jobs", type=int, default=2, help="with --sizes: runs at a time")
    arguments = parser.parse_args()
    bench = Bench(os.path.abspath(arguments.build))
    if arguments.sizes:
        compare_sizes(bench, arguments.sizes, arguments.jobs)
        return
    if arguments.again:
        compare_again(bench, arguments.modules or [], arguments.rounds)
        return
    with tempfile.TemporaryDirectory(prefix="scan-bench-") as folder:
        if arguments.modules is not None:
            plugins = bench.modules_in(arguments.modules)
        else:
            sample = pathlib.Path(arguments.build, "plugins", "well_behaved_effect.so")
            plugins = [shutil.copy(sample, os.path.join(folder, f"{number}.so"))
                       for number in range(arguments.copies)]
        costs = {way: [] for way in WAYS}
        starts = {way: [] for way in WAYS}
        for number in range(arguments.rounds):
            for way in list(WAYS)[::-1 if number % 2 else 1]:
                costs[way].append(bench.measure(way, plugins))
                starts[way].append(bench.measure(way, plugins[:1]))
    count = len(plugins)
    print(f"{count} plug-ins, {arguments.rounds} rounds, load {os.getloadavg()[0]:.1f}")
    print("| | wall s | processor s | against bare | wall ms a run | more than bare | processor ms a run |")
    print("|---|---|---|---|---|---|---|")

    def median(rounds, place):
        return statistics.median(one[place] for one in rounds)

    def ratio(way, other, place):
        return statistics.median(one[place] / two[place] for one, two in zip(costs[way], costs[other]))

    def per_run(way, place):
        if count < 2:
            return float("nan")
        return (median(costs[way], place) - median(starts[way], place)) / (count - 1) * 1000

    for way in WAYS:
        wall, processor = median(costs[way], 0), median(costs[way], 1)
        print(f"| {way} | {wall:.2f} | {processor:.2f} | {ratio(way, 'bare', 1):.2f} "
              f"| {per_run(way, 0):.2f} | {per_run(way, 0) - per_run('bare', 0):.2f} | {per_run(way, 1):.2f} |")

    if count > 1:
        for way, goal in (("scan, no sandbox", 1), ("scan, sandbox", 8)):
            print(f"more than a bare run, {way}: {per_run(way, 0) - per_run('bare', 0):.2f} ms (goal: {goal})")
    faster = ratio("scan, no sandbox", "scan, no sandbox, -j 2", 0)
    print(f"-j 2 against -j 1: {faster:.2f} times faster (goal: 1.9)")
    print(f"processor time without sandbox against bare runs: {ratio('scan, no sandbox', 'bare', 1):.2f} (goal: 1.05)")


if __name__ == "__main__":
    main()
