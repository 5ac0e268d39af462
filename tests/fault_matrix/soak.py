# SPDX-License-Identifier: MIT
"""Many runs over the sample plug-ins with faults at random places: none may hang or leave anything behind.

    soak.py --program build/release/vsttorture --plugins build/release/plugins [--runs 1000] [--seed N]

After each run its folder, which is its HOME and TMPDIR as well, must be empty, although core files are allowed: a
crash that the guard caught leaves none. At the end there must be no zombie, no process of a run, and no temporary
file. Which verdict a place leads to is tested by the fault matrix, not here. Prints the seed first, so that
a run can be repeated.
"""
import argparse
import collections
import concurrent.futures
import os
import pathlib
import random
import resource
import statistics
import sys
import tempfile
import time

from fault_matrix import run_row, take_usual_start, try_plugin
from rows import KINDS, End, Row

SHARE_OF_OTHER_SAMPLES = 0.1
MOMENTS = ["load", "entry", "getParameter", "setParameter"]
OPCODES = [0, 1, 2, 3, 4, 5, 6, 7, 8, 10, 11, 12, 22, 23, 24, 26, 27, 29, 31, 32, 33, 34, 35, 44, 45, 47, 48, 51, 52,
           56, 58, 70]
MOST_TURNS = 40
DYING_LIMIT_IN_SECONDS = 30
ANY_END = End(0, "", 0, "")


def random_row(number, draw, samples):
    if draw.random() < SHARE_OF_OTHER_SAMPLES:
        plugin = draw.choice(samples)
        return Row(f"{number}: {plugin}", plugin, None, None, 0, ANY_END)
    plugin = draw.choice(["faulty", "faulty_own_runtime", "faulty_exported_runtime"])
    kind = "+".join(draw.choice(KINDS).name for _ in range(draw.choice([1, 1, 1, 2, 3])))
    place = draw.choice(MOMENTS + [f"dispatch:{opcode}" for opcode in OPCODES])
    if place != "load" and draw.random() < 0.5:
        place += f":{draw.randrange(1, MOST_TURNS)}"
    status = draw.randrange(256)
    return Row(f"{number}: {plugin}/{kind}@{place} ({status})", plugin, kind, place, status, ANY_END)


def processes(home):
    """The processes with this folder in their environment, as each run has one below it, and those of our own that nobody
    has reaped. Other tests may run the program at the same time."""
    found = []
    for folder in pathlib.Path("/proc").glob("[0-9]*"):
        try:
            state, parent = (folder / "stat").read_text().rpartition(")")[2].split()[:2]
            is_ours = folder.name != str(os.getpid()) and os.fsencode(home) in (folder / "environ").read_bytes()
            if is_ours or (state == "Z" and int(parent) == os.getpid()):
                found.append(folder.name)
        except OSError:
            pass  # Gone meanwhile, or of another user.
    return found


def processes_that_stay(home):
    """What a run has killed may still be dying."""
    end = time.monotonic() + DYING_LIMIT_IN_SECONDS
    while (found := processes(home)) and time.monotonic() < end:
        time.sleep(0.1)
    return found


def allow_cores():
    _, most = resource.getrlimit(resource.RLIMIT_CORE)
    resource.setrlimit(resource.RLIMIT_CORE, (most, most))


def may_leave(name, verdict):
    """A process that a signal killed past the guard leaves the core that its host's limit allows. Its name is the
    system's choice."""
    return "core" in name and verdict.startswith("killed by signal")


def main():
    parser = argparse.ArgumentParser(description=__doc__, formatter_class=argparse.RawDescriptionHelpFormatter)
    parser.add_argument("--program", required=True, help="the vsttorture to run")
    parser.add_argument("--plugins", required=True, help="the folder of the sample plug-ins")
    parser.add_argument("--runs", type=int, default=1000)
    parser.add_argument("--seed", type=int, default=random.randrange(1 << 32))
    parser.add_argument("--jobs", type=int, default=4, help="runs at a time; some of them only wait")
    arguments = parser.parse_args()
    print(f"seed {arguments.seed}", flush=True)

    allow_cores()
    take_usual_start()
    program, plugins = os.path.realpath(arguments.program), os.path.abspath(arguments.plugins)
    samples = sorted(path.stem for path in pathlib.Path(plugins).glob("*.so"))
    draw = random.Random(arguments.seed)
    rows = [random_row(number, draw, samples) for number in range(arguments.runs)]

    problems = 0
    verdicts, times = collections.Counter(), []
    with tempfile.TemporaryDirectory(prefix="soak.") as folder:
        # Everything that a run would leave, it leaves here.
        os.environ["TMPDIR"] = tempfile.tempdir = folder
        with concurrent.futures.ThreadPoolExecutor(arguments.jobs) as pool:
            for row, seen in zip(rows, pool.map(lambda row: run_row(row, program, plugins), rows)):
                verdict = try_plugin.judge(seen.output, seen.status)
                verdicts[verdict.split(" at ")[0]] += 1
                times.append(seen.seconds)
                left = [name for name in seen.leftovers if not may_leave(name, verdict)]
                if seen.status is None or left:
                    problems += 1
                    print(f"{row.name}: {verdict}, files left: {left}", flush=True)
        left = os.listdir(folder) + processes_that_stay(folder)
    if left:
        problems += 1
        print(f"left behind: {left}")

    for verdict, count in verdicts.most_common():
        print(f"{count:6} {verdict}")
    times.sort()
    print(f"seconds of a run: least {times[0]:.3f}, median {statistics.median(times):.3f}, "
          f"99 of 100 below {times[len(times) * 99 // 100]:.3f}, most {times[-1]:.3f}")
    print(f"{len(rows)} runs, {problems} problems")
    return 1 if problems else 0


if __name__ == "__main__":
    sys.exit(main())
