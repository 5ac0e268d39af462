# SPDX-License-Identifier: MIT
"""A process that SIGKILL does not end holds up neither the scan nor its end, and is named with its folder.

    unkillable.py --scan build/release/vsttorture-scan --plugins build/release/plugins --sandbox MODE...

The kernel ends no process that waits for a device or a file system which does not answer. A process whose end a tracer
has to see first looks the same to its parent: killed, and still there. So this script traces the worker of a plug-in
that hangs. In a sandbox that keeps the first process of the namespace, too. The modes of --sandbox are tried at the same
time, since most of it is waiting. Exits with 77 where tracing is forbidden.
"""
import argparse
import concurrent.futures
import ctypes
import json
import os
import pathlib
import shutil
import subprocess
import sys
import tempfile
import time

SKIPPED = 77
PTRACE_SEIZE = 0x4206
WALL = 0x40000000
LIMIT_IN_SECONDS = 120


def worker_of(plugin):
    """The number of the worker that runs this plug-in; waits for it."""
    end = time.monotonic() + LIMIT_IN_SECONDS
    while time.monotonic() < end:
        for folder in pathlib.Path("/proc").glob("[0-9]*"):
            try:
                words = (folder / "cmdline").read_bytes().split(b"\0")
            except OSError:
                continue  # Gone meanwhile.
            if words[0].endswith(b"vsttorture-worker") and os.fsencode(plugin) in words:
                return int(folder.name)
        time.sleep(0.01)
    raise TimeoutError(plugin)


def problems_with(events, worker, plugin, temporary):
    """What is wrong with the events of the scan, and with what it has left in its folder for temporary files."""
    problems = []
    ended = {event["plugin"]["bundle"]: event for event in events if event["event"] == "plugin_ended"}
    neighbours = [event["verdict"] for bundle, event in ended.items() if bundle != str(plugin)]
    if neighbours != ["passed"] * 6:
        problems.append(f"the neighbours: {neighbours}")
    stuck = ended.get(str(plugin))
    if stuck is None or stuck["verdict"] != "hung":
        return [*problems, f"no verdict \"hung\": {stuck}"]
    notes = [note for note in stuck["contradictions"] if note.startswith("could not be killed: process ")]
    if len(notes) != 1:
        return [*problems, f"contradictions: {stuck['contradictions']}"]
    if stuck["sandbox"] == "none" and f"process {worker} " not in notes[0]:
        problems.append(f"{worker} is not named in: {notes[0]}")
    left = [str(folder) for root in temporary.iterdir() for folder in root.iterdir()]
    if len(left) != 1 or not notes[0].endswith(left[0]):
        problems.append(f"left: {left}, named: {notes[0]}")
    return problems


def problems_of_a_scan(scan, plugins, sandbox):
    """What is wrong with a scan of six good plug-ins and one that cannot be killed; None where nothing can be traced."""
    libc = ctypes.CDLL(None, use_errno=True)
    with tempfile.TemporaryDirectory(prefix="unkillable-") as folder:
        world = pathlib.Path(os.path.realpath(folder))
        (world / "tmp").mkdir()
        (world / "plugins").mkdir()
        plugin = world / "plugins" / "0_unruly.so"
        shutil.copy(plugins / "unruly.so", plugin)
        for number in range(1, 7):
            shutil.copy(plugins / "well_behaved_effect.so", world / "plugins" / f"{number}.so")
        command = [scan.resolve(), "-j", "2", "--step-limit", "5", "--cache=off", "--no-progress", "--json", "-",
                   f"--sandbox={sandbox}", world / "plugins"]
        environment = dict(os.environ, TMPDIR=str(world / "tmp"), UNRULY="ignore_termination")
        process = subprocess.Popen(command, env=environment, stdin=subprocess.DEVNULL, stdout=subprocess.PIPE,
                                   stderr=subprocess.DEVNULL)
        worker = worker_of(plugin)
        if libc.ptrace(PTRACE_SEIZE, worker, None, None) != 0:
            process.terminate()
            process.communicate()
            print(f"cannot trace a process: {os.strerror(ctypes.get_errno())}")
            return None
        try:
            output = process.communicate(timeout=LIMIT_IN_SECONDS)[0]
            problems = problems_with(map(json.loads, output.splitlines()), worker, plugin, world / "tmp")
            if process.returncode != 1:
                problems.append(f"the scan ended with {process.returncode}")
        except subprocess.TimeoutExpired:
            problems = [f"the scan has not ended after {LIMIT_IN_SECONDS} s"]
            process.kill()
            process.communicate()
        os.waitpid(worker, WALL)
    return [f"--sandbox={sandbox}: {problem}" for problem in problems]


def main():
    parser = argparse.ArgumentParser(description=__doc__, formatter_class=argparse.RawDescriptionHelpFormatter)
    parser.add_argument("--scan", required=True, type=pathlib.Path)
    parser.add_argument("--plugins", required=True, type=pathlib.Path)
    parser.add_argument("--sandbox", required=True, nargs="+", help="modes of the scan's option")
    arguments = parser.parse_args()
    # Processes, not threads: only the thread that traces a process may wait for it.
    with concurrent.futures.ProcessPoolExecutor(len(arguments.sandbox)) as pool:
        tries = [pool.submit(problems_of_a_scan, arguments.scan, arguments.plugins, sandbox)
                 for sandbox in arguments.sandbox]
    if any(one.result() is None for one in tries):
        return SKIPPED
    problems = sum((one.result() for one in tries), [])
    print("\n".join([*problems, f"{len(problems)} problems"]))
    return 1 if problems else 0


if __name__ == "__main__":
    sys.exit(main())
