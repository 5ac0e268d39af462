# SPDX-License-Identifier: MIT
"""Many scanned runs with faults at random places: nothing may be left behind, and the scan's memory must stay flat.

    soak.py --scan build/release/vsttorture-scan --plugins build/release/plugins [--runs 2000] [-j 4]
            [--sandbox=required] [--seed N]

All runs belong to one scan, of copies of the faulty plug-in, each with a file beside it that names its fault. While
it runs, its resident memory and its descriptors are measured. At the end there must be a verdict for each, and no
process with one of the plug-ins in its command line, no scratch folder, no temporary file or pipe, no shared memory of
either kind. The verdicts themselves are not looked at: which one a place leads to is what the fault matrix knows. Prints
the seed first, so that the same faults can be had again. Exits with 77 where a sandbox is required and none works.
"""
import argparse
import json
import os
import pathlib
import random
import shutil
import statistics
import subprocess
import sys
import tempfile
import time

sys.path.insert(0, str(pathlib.Path(__file__).resolve().parents[1] / "fault_matrix"))
sys.path.insert(0, str(pathlib.Path(__file__).resolve().parents[2] / "docs" / "examples"))
from engine.killed_scan import processes_of  # noqa: E402
from judge.scan_matrix import SKIPPED, sandbox_works  # noqa: E402
from rows import KINDS  # noqa: E402

MOMENTS = ["load", "entry", "getParameter", "setParameter"]
OPCODES = [0, 1, 2, 3, 4, 5, 6, 7, 8, 10, 11, 12, 22, 23, 24, 26, 27, 29, 33, 34, 35, 45, 47, 48, 51, 58, 70]
STEP_LIMIT_IN_SECONDS = 3
SECONDS_BETWEEN_LOOKS = 0.1
MOST_GROWTH = 1.25  # Of the resident memory, from the second quarter of the scan to the last.
SECONDS_TO_VANISH = 10  # For what others use for a moment, and for what has been killed and is still dying.


def random_fault(draw):
    place = draw.choice(MOMENTS + [f"dispatch:{opcode}" for opcode in OPCODES])
    if place != "load" and draw.random() < 0.5:
        place += f":{draw.randrange(1, 40)}"
    return f"{draw.choice(KINDS).name} {place} {draw.randrange(256)}\n"


def make_plugins(folder, plugin, runs, draw):
    folder.mkdir()
    for number in range(runs):
        copy = folder / f"{number:05}.so"
        # A hard link would be the same file under another name, which is run once.
        shutil.copy(plugin, copy)
        pathlib.Path(f"{copy}.fault").write_text(random_fault(draw))


class Looks:
    """What is seen of the scan from outside while it runs."""

    def __init__(self):
        self.resident = []
        self.descriptors = []

    def look(self, pid):
        try:
            pages = int(pathlib.Path(f"/proc/{pid}/statm").read_text().split()[1])
            descriptors = len(os.listdir(f"/proc/{pid}/fd"))
        except (OSError, IndexError):
            return
        if pages > 0:
            self.resident.append(pages * os.sysconf("SC_PAGESIZE"))
            self.descriptors.append(descriptors)

    def problems(self, jobs):
        quarter = len(self.resident) // 4
        if quarter < 3:
            return []
        before = statistics.median(self.resident[quarter:2 * quarter])
        after = statistics.median(self.resident[-quarter:])
        print(f"resident memory: {before / 2**20:.1f} MiB in the second quarter, {after / 2**20:.1f} MiB in the last; "
              f"at most {max(self.descriptors)} descriptors")
        problems = []
        if after > MOST_GROWTH * before:
            problems.append(f"the scan's memory grew from {before} to {after} bytes")
        if statistics.median(self.descriptors[-quarter:]) > statistics.median(self.descriptors[:quarter]) + 3 * jobs:
            problems.append("the scan holds more and more descriptors")
        return problems


def shared_memory():
    """The segments that nobody may use any more: those of POSIX, and of System V where their maker has ended. A system
    may lack either kind."""
    posix, system_v = pathlib.Path("/dev/shm"), pathlib.Path("/proc/sysvipc/shm")
    found = {str(path) for path in posix.iterdir()} if posix.exists() else set()
    for line in system_v.read_text().splitlines()[1:] if system_v.exists() else []:
        key, number, _, _, maker, _, attached = line.split()[:7]
        if attached == "0" and not os.path.exists(f"/proc/{maker}"):
            found.add(f"System V segment {number} (key {key}, of process {maker})")
    return found


def left_behind(world, shared_before):
    """What stays. Who has made a segment of shared memory cannot be seen: a browser that another test runs makes some."""
    end = time.monotonic() + SECONDS_TO_VANISH
    while True:
        problems = [f"still running: {process}" for process in processes_of([str(world)])]
        problems += [f"still there: {path}" for path in (world / "tmp").iterdir()]
        problems += [f"shared memory: {name}" for name in shared_memory() - shared_before]
        if not problems or time.monotonic() > end:
            return problems
        time.sleep(0.1)


def main():
    parser = argparse.ArgumentParser(description=__doc__, formatter_class=argparse.RawDescriptionHelpFormatter)
    parser.add_argument("--scan", required=True)
    parser.add_argument("--plugins", required=True, type=pathlib.Path)
    parser.add_argument("--runs", type=int, default=2000)
    parser.add_argument("-j", "--jobs", type=int, default=4)
    parser.add_argument("--sandbox", default="off")
    parser.add_argument("--seed", type=int, default=random.SystemRandom().randrange(1 << 32))
    arguments = parser.parse_args()
    if arguments.sandbox == "required" and not sandbox_works():
        print("bubblewrap does not work here")
        return SKIPPED
    print(f"seed {arguments.seed}", flush=True)
    shared_before = shared_memory()
    with tempfile.TemporaryDirectory(prefix="scan-soak-") as folder:
        world = pathlib.Path(folder)
        (world / "tmp").mkdir()
        draw = random.Random(arguments.seed)
        make_plugins(world / "plugins", arguments.plugins / "faulty.so", arguments.runs, draw)
        events = world / "events"
        looks = Looks()
        begin = time.monotonic()
        with open(world / "errors", "wb") as errors:
            scan = subprocess.Popen(
                [os.path.abspath(arguments.scan), "-j", str(arguments.jobs), "--no-progress", "--quiet",
                 "--cache=off", f"--sandbox={arguments.sandbox}", "--step-limit", str(STEP_LIMIT_IN_SECONDS),
                 "--json", str(events), str(world / "plugins")],
                env=dict(os.environ, TMPDIR=str(world / "tmp")), stdin=subprocess.DEVNULL,
                stdout=subprocess.DEVNULL, stderr=errors)
            while scan.poll() is None:
                looks.look(scan.pid)
                time.sleep(SECONDS_BETWEEN_LOOKS)
        problems = looks.problems(arguments.jobs) + left_behind(world, shared_before)
        results = [event for event in map(json.loads, events.read_text().splitlines())
                   if event["event"] == "plugin_ended"]
        counts = {}
        for event in results:
            counts[event["verdict"]] = counts.get(event["verdict"], 0) + 1
        # A fault can make a shell of the plug-in, whose children have results of their own.
        bundles = {event["plugin"]["bundle"] for event in results}
        if len(bundles) != arguments.runs:
            problems.append(f"results of {len(bundles)} plug-ins, not of {arguments.runs}")
        if scan.returncode not in (0, 1):
            problems.append(f"status {scan.returncode}: {(world / 'errors').read_text()[:1000]}")
        print(", ".join(f"{count} {verdict}" for verdict, count in sorted(counts.items())),
              f"in {time.monotonic() - begin:.0f} s")
    for problem in problems:
        print(problem)
    return 1 if problems else 0


if __name__ == "__main__":
    sys.exit(main())
