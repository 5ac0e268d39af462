#!/usr/bin/env python3
# SPDX-License-Identifier: MIT
"""Compares the cost of vsttorture with that of the bare C host in bench/bare_host, as whole processes in pairs.

    cmake --preset bench && cmake --build --preset bench
    bench/whole_process.py [--build build/bench] [--pairs FACTOR] [CASE ...]

Cases: light, null, real, linear, instructions; all of them when none is named. Needs Python's standard library, and
the Debian packages time (peak memory) and valgrind (instructions); real plug-ins come from amsynth and
zynaddsubfx-vst.

A pair is a run of the program and then a run of the bare host, which repeats the random tests that the program
drew. Both must print the same lines. Ratios are taken within a pair; the median of all pairs is printed,
with the quartiles. CPU time is user and system time, which other work on the machine disturbs less.
"""

import argparse
import collections
import os
import re
import statistics
import subprocess
import sys
import tempfile
import time

Cost = collections.namedtuple("Cost", "wall cpu lines")
LARGE = {"NULL_PLUGIN_PARAMETERS": "10000", "NULL_PLUGIN_PROGRAMS": "1000"}


class Bench:
    def __init__(self, build, factor, folder):
        self.tool = os.path.join(build, "vsttorture")
        self.bare_host = os.path.join(build, "bench", "bare_host")
        self.plugins = os.path.join(build, "plugins")
        self.factor = factor
        self.lines = os.path.join(folder, "lines")
        self.replayed = os.path.join(folder, "replayed")
        # Plug-ins that keep files of their own find an empty home.
        self.environment = {**os.environ, "HOME": folder, "LC_ALL": "C"}

    def sample(self, name):
        return os.path.join(self.plugins, name + ".so")

    def run(self, command, output, extra=None):
        """Runs a command that must end with status 0, or 1 as for a shell."""
        with open(output, "wb") as out:
            start = time.perf_counter()
            process = subprocess.Popen(command, stdout=out, stderr=subprocess.DEVNULL,
                                       env={**self.environment, **(extra or {})})
            _, status, usage = os.wait4(process.pid, 0)
            wall = time.perf_counter() - start
        process.returncode = os.waitstatus_to_exitcode(status)
        if process.returncode not in (0, 1):
            sys.exit(f"{' '.join(command)}: ended with {process.returncode}")
        with open(output, encoding="utf-8") as text:
            return Cost(wall, usage.ru_utime + usage.ru_stime, text.read())

    def pair(self, plugin, extra=None):
        tool = self.run([self.tool, plugin], self.lines, extra)
        bare_host = self.run([self.bare_host, self.lines, plugin], self.replayed, extra)
        if tool.lines != bare_host.lines:
            sys.exit(f"{plugin}: the two runs printed different lines")
        return tool, bare_host

    def compare(self, name, plugin, pairs, extra=None):
        pairs = max(3, int(pairs * self.factor))
        self.pair(plugin, extra)  # Warms the caches.
        measured = [self.pair(plugin, extra) for _ in range(pairs)]
        for what in ("wall", "cpu"):
            ratios = [getattr(tool, what) / getattr(bare_host, what) for tool, bare_host in measured]
            low, middle, high = statistics.quantiles(ratios, n=4)
            times = [statistics.median(getattr(cost, what) for cost in side) for side in zip(*measured)]
            print(f"{name:24} {what:4} ratio {middle:5.3f} ({low:5.3f} to {high:5.3f}), "
                  f"{times[0] * 1e3:9.3f} ms against {times[1] * 1e3:9.3f} ms, {pairs} pairs", flush=True)

    def peak_memory(self, command, extra=None):
        """In KiB. Not from wait4(), which would count this interpreter: the child starts as a copy of it."""
        report = self.lines + ".memory"
        self.run(["/usr/bin/time", "-q", "-f", "%M", "-o", report] + command, self.replayed, extra)
        with open(report, encoding="utf-8") as text:
            return int(text.read())

    def compare_memory(self, name, plugin, runs=15):
        self.run([self.tool, plugin], self.lines)
        tool = statistics.median(self.peak_memory([self.tool, plugin]) for _ in range(runs))
        bare_host = statistics.median(self.peak_memory([self.bare_host, self.lines, plugin]) for _ in range(runs))
        print(f"{name:24} peak {tool:.0f} KiB against {bare_host:.0f} KiB, {tool - bare_host:+.0f} KiB, median of {runs}",
              flush=True)


def light(bench):
    """Creation, description and close (a shell's whole run), and full runs on a plug-in of three parameters and on one
    without any, which is written in C."""
    for name in ("shell", "well_behaved_effect", "null_plugin"):
        bench.compare(name, bench.sample(name), 300)
        bench.compare_memory(name, bench.sample(name))


def null(bench):
    """The null plug-in, with 10 000 parameters and 1 000 programs."""
    bench.compare("null 10000 x 1000", bench.sample("null_plugin"), 15, LARGE)


def real(bench):
    for name, path in (("amsynth", "/usr/lib/vst/amsynth_vst.so"), ("ZynAddSubFX", "/usr/lib/vst/ZynAddSubFX.so")):
        if not os.path.exists(path):
            sys.exit(f"{path} is missing: install the plug-in or leave the case `real` out")
        bench.compare(name, path, 15)


def linear(bench):
    """CPU time of one state test per parameter and program, which is the same at every size when the cost is linear.

    A run draws 2 to 52 state tests, which are nearly all of its cost here, so it is divided by their number."""
    for parameters, programs in ((1000, 250), (1000, 1000), (4000, 1000), (16000, 1000)):
        counts = {"NULL_PLUGIN_PARAMETERS": str(parameters), "NULL_PLUGIN_PROGRAMS": str(programs)}
        each = []
        for _ in range(max(3, int(7 * bench.factor))):
            cost = bench.run([bench.tool, bench.sample("null_plugin")], bench.lines, counts)
            states = cost.lines.count("testing setting states")
            each.append(cost.cpu / (states * parameters * programs))
        print(f"{parameters:6} parameters x {programs:4} programs: {statistics.median(each) * 1e9:6.2f} ns "
              "per parameter, program and state test", flush=True)


def instructions_by_object(bench, command, extra):
    profile = bench.lines + ".callgrind"
    bench.run(["valgrind", "--tool=callgrind", f"--callgrind-out-file={profile}"] + command, bench.replayed, extra)
    listing = subprocess.run(["callgrind_annotate", "--threshold=100", "--auto=no", profile], check=True,
                             capture_output=True, text=True).stdout
    counts = collections.Counter()
    for line in listing.splitlines():
        match = re.match(r"\s*([\d,]+) .*\[(.+)\]$", line)
        if match:
            counts[os.path.basename(match[2])] += int(match[1].replace(",", ""))
    return counts


def instructions(bench):
    """Instructions of a run per shared object, on a small null plug-in, in the program and in the bare host."""
    extra = {"NULL_PLUGIN_PARAMETERS": "2000", "NULL_PLUGIN_PROGRAMS": "100"}
    plugin = bench.sample("null_plugin")
    bench.run([bench.tool, plugin], bench.lines, extra)
    # The program draws other random tests under valgrind, so the bare host repeats those.
    tool = instructions_by_object(bench, [bench.tool, plugin], extra)
    os.replace(bench.replayed, bench.lines)
    bare_host = instructions_by_object(bench, [bench.bare_host, bench.lines, plugin], extra)
    for name, counts in (("vsttorture", tool), ("bare_host", bare_host)):
        total = sum(counts.values())
        shares = ", ".join(f"{key} {count / total:.1%}" for key, count in counts.most_common(5))
        print(f"{name:12} {total:12,} instructions: {shares}")
    print(f"ratio {sum(tool.values()) / sum(bare_host.values()):.2f}", flush=True)


CASES = {case.__name__: case for case in (light, null, real, linear, instructions)}


def main():
    parser = argparse.ArgumentParser(description=__doc__, formatter_class=argparse.RawDescriptionHelpFormatter)
    parser.add_argument("--build", default="build/bench", help="folder of the build (build/bench)")
    parser.add_argument("--pairs", type=float, default=1.0, metavar="FACTOR", help="more or fewer pairs (1.0)")
    parser.add_argument("cases", nargs="*", metavar="CASE", help=", ".join(CASES))
    arguments = parser.parse_intermixed_args()
    unknown = set(arguments.cases) - set(CASES)
    if unknown:
        parser.error(f"no such case: {', '.join(sorted(unknown))}")
    with tempfile.TemporaryDirectory() as folder:
        bench = Bench(os.path.abspath(arguments.build), arguments.pairs, folder)
        for name in arguments.cases or CASES:
            print(f"-- {name}")
            CASES[name](bench)


if __name__ == "__main__":
    main()
