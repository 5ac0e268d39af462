# SPDX-License-Identifier: MIT
"""Kills vsttorture-scan with SIGKILL at random moments: soon nothing of it may be left but its results.

    killed_scan.py --scan build/release/vsttorture-scan --plugins build/release/plugins [--times 15] [--seed N]

Each scan runs plug-ins that pass, that never end, and that leave processes with sessions of their own behind, some of
them without any environment. Within ten seconds of the kill (on an idle machine, milliseconds, and the longest time is
printed) there must be no process with one of their names and no scratch folder any more. The file of events must end at
a whole line. The database must be whole. The next scan (after the first 15 kills) must remember each result that was
reported, and run the others. Prints the seed first, so that the same moments can be had again.
"""
import argparse
import json
import os
import pathlib
import random
import shutil
import sqlite3
import subprocess
import sys
import tempfile
import time

SECONDS_TO_CLEAN_UP = 10.0  # As the machine may be busy.
LEAST_LONGEST_LIFE_IN_SECONDS = 0.4
LONGEST_LIFE_IN_STARTS = 2  # With a sanitizer, or on a busy machine, a start takes longer.
PLUGINS = 30
JOBS = 4
NEXT_SCANS = 15  # So many kills are followed by a whole scan, which takes seconds where plug-ins hang.
UNRULY = ["fork", "fork_in_own_session", "fork_twice", "fork_twice_without_environment", "ignore_termination", "burn"]


def processes_of(names):
    """The processes, zombies left out, with one of the texts in their command lines."""
    found = []
    for folder in pathlib.Path("/proc").glob("[0-9]*"):
        try:
            command = (folder / "cmdline").read_bytes()
        except OSError:
            continue  # Gone meanwhile.
        if int(folder.name) != os.getpid() and any(name.encode() in command for name in names):
            found.append(f"{folder.name} {command.decode(errors='replace')!r}")
    return found


def problems_after_kill(world, token):
    problems = [f"still running: {process}" for process in processes_of([token, str(world)])]
    problems += [f"still there: {path}" for path in (world / "tmp").iterdir()]
    return problems


def seconds_of_a_start(scan, world):
    """How long a scan takes until it has written its first event."""
    events = world / "events"
    begin = time.monotonic()
    process = subprocess.Popen(
        [scan, "--no-progress", "--cache=off", "--sandbox=auto", "--json", str(events),
         str(world / "plugins" / "01_well_behaved_effect.so")],
        env=dict(os.environ, TMPDIR=str(world / "tmp")), stdin=subprocess.DEVNULL, stdout=subprocess.DEVNULL,
        stderr=subprocess.DEVNULL)
    while process.poll() is None and not (events.exists() and events.stat().st_size):
        time.sleep(0.005)
    seconds = time.monotonic() - begin
    process.wait()
    return seconds


def results_in(events):
    """{bundle: whether it was remembered}, and what is wrong with the lines."""
    written = events.read_bytes() if events.exists() else b""
    results, problems = {}, []
    for line in written.splitlines(keepends=True):
        try:
            event = json.loads(line)
        except ValueError:
            problems.append(f"no whole event: {line!r}")
            continue
        if event["event"] == "plugin_ended":
            results[event["plugin"]["bundle"]] = event["isRemembered"]
    if written and not written.endswith(b"\n"):
        problems.append("the events do not end at a whole line")
    return results, problems


def problems_of_database(file):
    if not file.exists():
        return []  # Killed before it was made.
    try:
        database = sqlite3.connect(file)
        found = database.execute("PRAGMA integrity_check").fetchall()
        database.close()
    except sqlite3.Error as error:
        return [f"the database: {error}"]
    return [] if found == [("ok",)] else [f"the database: {found}"]


def problems_of_next_scan(command, environment, events, known):
    """A scan to its end: it must take what is known from the database, and run the rest."""
    ended = subprocess.run(command, env=environment, stdin=subprocess.DEVNULL, stdout=subprocess.DEVNULL,
                           stderr=subprocess.PIPE, timeout=120, check=False)
    results, problems = results_in(events)
    if ended.returncode not in (0, 1) or ended.stderr:
        problems.append(f"the next scan ended with {ended.returncode}: {ended.stderr!r}")
    if len(results) != PLUGINS:
        problems.append(f"the next scan has {len(results)} results")
    problems += [f"not remembered: {bundle}" for bundle in known if not results.get(bundle)]
    # One more may have been saved, and not been reported, for each that can end at a time.
    if sum(results.values()) > len(known) + JOBS:
        problems.append(f"{sum(results.values())} remembered after {len(known)} results")
    return problems


def kill_once(scan, world, token, draw, longest_life, has_next_scan):
    """Starts a scan and kills it. Returns what is wrong then, whether it had begun, how many results there were, and how
    many seconds it took until nothing was left."""
    events, database = world / "events", world / "cache/results.sqlite"
    events.unlink(missing_ok=True)
    shutil.rmtree(database.parent, ignore_errors=True)
    environment = dict(os.environ, TMPDIR=str(world / "tmp"), UNRULY=draw.choice(UNRULY), UNRULY_TOKEN=token)
    sandbox = draw.choice(["off", "off", "auto"])
    command = [scan, "-j", str(JOBS), "--no-progress", "--step-limit=0.3", f"--sandbox={sandbox}",
               "--cache", str(database), "--json", str(events), str(world / "plugins")]
    process = subprocess.Popen(command, env=environment, stdin=subprocess.DEVNULL, stdout=subprocess.DEVNULL,
                               stderr=subprocess.DEVNULL)
    time.sleep(draw.random() * longest_life)
    process.kill()
    process.wait()
    killed = time.monotonic()
    while (problems := problems_after_kill(world, token)) and time.monotonic() < killed + SECONDS_TO_CLEAN_UP:
        time.sleep(0.02)
    seconds = time.monotonic() - killed
    begun = events.exists()
    known, found = results_in(events)
    problems += found + problems_of_database(database)
    if has_next_scan:
        problems += problems_of_next_scan(command, environment, events, known)
    problems = [f"{environment['UNRULY']}, sandbox {sandbox}: {problem}" for problem in problems]
    return problems, begun, len(known), seconds


def main():
    parser = argparse.ArgumentParser(description=__doc__, formatter_class=argparse.RawDescriptionHelpFormatter)
    parser.add_argument("--scan", required=True)
    parser.add_argument("--plugins", required=True, type=pathlib.Path)
    parser.add_argument("--times", type=int, default=15)
    parser.add_argument("--seed", type=int, default=random.SystemRandom().randrange(1 << 32))
    arguments = parser.parse_args()
    print(f"seed {arguments.seed}", flush=True)
    draw = random.Random(arguments.seed)
    problems = []
    begun = in_the_middle = number = 0
    longest = 0.0
    with tempfile.TemporaryDirectory(prefix="killed-scan-") as folder:
        world = pathlib.Path(folder)
        (world / "tmp").mkdir()
        (world / "plugins").mkdir()
        for number in range(PLUGINS):
            name = "unruly" if number % 3 == 0 else "well_behaved_effect"
            shutil.copy(arguments.plugins / f"{name}.so", world / "plugins" / f"{number:02}_{name}.so")
        scan = os.path.abspath(arguments.scan)
        longest_life = max(LEAST_LONGEST_LIFE_IN_SECONDS, LONGEST_LIFE_IN_STARTS * seconds_of_a_start(scan, world))
        # If every kill came before anything ran, nothing was tested. Where the machine has become busy since the start
        # was measured, the scans live longer.
        while number < arguments.times or (begun < arguments.times / 4 and number < 5 * arguments.times):
            if number >= arguments.times:
                longest_life *= 1.5
            found, has_begun, known, seconds = kill_once(scan, world, f"{world.name}-{number}-", draw, longest_life,
                                                         number < NEXT_SCANS)
            begun += has_begun
            in_the_middle += 0 < known < PLUGINS
            longest = max(longest, seconds)
            problems += [f"kill {number}: {problem}" for problem in found]
            number += 1
    for problem in problems:
        print(problem)
    print(f"{number} kills, {begun} of them after the scan had begun, {in_the_middle} between two results; after each "
          f"nothing was left within {longest:.2f} s; {len(problems)} problems")
    return 1 if problems or begun < arguments.times / 4 else 0


if __name__ == "__main__":
    sys.exit(main())
