# SPDX-License-Identifier: MIT
"""Every row of the fault matrix through the whole scan: each must get its word, its step and its request.

    scan_matrix.py --scan build/release/vsttorture-scan --plugins build/release/plugins [--only REGEX] [--list]
                   [--part K/N] [--sandboxed COUNT [--seed NUMBER]]

The scan runs each file once, so a row is a copy of the faulty plug-in with a file beside it that names the fault; some
hundred at a time. The rows are those of tests/fault_matrix/rows.py, and those below: lines, statuses and records that a
plug-in forges. With --sandboxed only so many rows are run, drawn at random, in the sandbox. The environment variable
VSTTORTURE_SCAN_MATRIX=all overrides --part. With --sanitizer a few dozen of those rows are run that apply to programs
that are built with it.

Prints a line for each row that fails, then a summary. Status 77 where --sandboxed finds no sandbox that works.
"""
import argparse
import collections
import json
import os
import pathlib
import random
import re
import resource
import shutil
import subprocess
import sys
import tempfile
import time
import zlib

sys.path.insert(0, str(pathlib.Path(__file__).resolve().parents[2] / "fault_matrix"))
sys.path.insert(0, str(pathlib.Path(__file__).resolve().parents[2] / "shared"))
from program_run import take_usual_start  # noqa: E402
from sanitizers import is_reported, reason_to_leave_out  # noqa: E402
from rows import ALL_STEPS, FIRST_DRAWN, KIND_OF, PLACE_OF, PLACES, THROWN, all_rows  # noqa: E402

ALL_ROWS = all_rows()
ROWS_AT_A_TIME = 300
PART_FOR_SANITIZERS = "1/40"
SKIPPED = 77
WITHOUT_CHECK = object()

# step: number, None before the first, FIRST_DRAWN, or WITHOUT_CHECK. request: None, WITHOUT_CHECK, ("load",) or
# ("dispatcher", 52). signal, status: None where it is not looked at. contradicts: whether the result must name a
# contradiction; None where it may.
Expected = collections.namedtuple("Expected", "verdict step request signal status contradicts",
                                  defaults=(None, None, None, None))
# A fault and what the scan must say. plugin: its file name in the build; name_as: the copy's, where it matters.
Row = collections.namedtuple("Row", "name plugin kind place status expected hangs name_as", defaults=(False, None))

# ----- What the scan must say of a row of the matrix.

SENT = {"SIGINT", "SIGHUP", "SIGTERM", "SIGKILL", "SIGQUIT", "SIGUSR1", "SIGPIPE", "SIGALRM", "SIGXCPU", "SIGVTALRM"}
SIGNAL_OF = {"null_store": "SIGSEGV", "write_read_only": "SIGSEGV", "stack_overflow": "SIGSEGV", "abort": "SIGABRT",
             "terminate": "SIGABRT", "thread_crash": "SIGSEGV", "thread_throw": "SIGABRT",
             "replace_handlers_then_crash": "SIGSEGV", "block_signals_then_crash": "SIGSEGV",
             "divide_by_zero": "SIGFPE", "illegal_instruction": "SIGILL", "double_free": "SIGABRT"}
# These do their harm after the run: no request is under way any more.
LATE_KINDS = {"crash_in_atexit", "crash_in_every_atexit", "crash_in_static_destructor", "hang_in_atexit",
              "raise_in_atexit", "throw_when_unloaded"}


def request_of(place):
    moment, *opcode = place.split(":")
    return ("dispatcher", int(opcode[0])) if moment == "dispatch" else (moment,)


def expected_of(row):
    """Of a row of rows.py."""
    kinds = (row.kind or "").split("+")
    names = [kind.split("@")[0].split(":")[0] for kind in kinds]
    step = row.end.steps if row.end.steps != 0 else None
    late = all(name in LATE_KINDS for name in names)
    request = request_of(row.place) if row.place is not None and not late else None
    signal = kinds[-1].split("@")[0].split(":")[1] if names[-1].startswith("raise") else SIGNAL_OF.get(kinds[-1])
    verdict = row.end.verdict.split(" at ")[0]
    if row.kind is None:
        request = WITHOUT_CHECK
    if "null_chunk" in names:  # The host copies it, when the request has returned.
        return Expected("crashed", step, None, "SIGSEGV")
    if "long_texts" in names:  # Noticed by whoever uses what the text has overwritten.
        return Expected("crashed", step, WITHOUT_CHECK)
    if "leave_the_thread" in names:  # The runtime ends the process when the request has been left.
        return Expected("crashed", step, WITHOUT_CHECK, "SIGABRT")
    if names[-1] in ("exit", "_exit", "quick_exit") and verdict != "timed out" and row.end.status == row.fault_status:
        return Expected("exited", step, request, None, row.fault_status)
    if verdict == "crashed":
        throws = row.kind in KIND_OF and KIND_OF[row.kind].leads_to == THROWN
        misses = row.place is not None and PLACE_OF[row.place].thrown in ("no instance", "no second instance")
        if throws and misses and unwinds(row):
            return Expected("no_instance", step, request)
        if "no_instance" in names:
            return Expected("no_instance", step, WITHOUT_CHECK)
        if row.plugin in ("null_instance", "entry_throws"):
            return Expected("no_instance", None, WITHOUT_CHECK)
        return Expected("killed" if signal in SENT else "crashed", step, request, signal)
    if verdict.startswith("killed by signal"):
        number = -row.end.status
        return Expected("crashed" if number in (4, 5, 6, 7, 8, 11, 31) else "killed", step, request, signal)
    if verdict == "exited":
        if "close_stdout" in names:
            return Expected("exited", step, WITHOUT_CHECK, None, row.end.status, True)
        return Expected("exited", step, request, None, row.end.status)
    if verdict == "failed":
        return Expected("failed", step, request)
    if names == ["hold_stdout_lock"]:  # Whoever is to print the next line waits for ever: it has begun.
        return Expected("hung", step + 1, None)
    if verdict == "timed out":
        return Expected("hung", step, request)
    if verdict == "not loadable":
        return Expected("not_loadable", None)
    if verdict == "shell":  # Its description may contradict it: the fault happens there, too.
        return Expected("shell", step, None)
    return Expected(verdict, step, None, None, None, False)


def unwinds(row):
    """Whether what this build of the plug-in throws reaches the program; else the throw itself is the crash."""
    in_a_step = f"{row.plugin}/{row.kind}@dispatch:52"
    return any(other.name == in_a_step and other.end.verdict.startswith("failed") for other in ALL_ROWS)


def rows_of_the_matrix():
    for row in ALL_ROWS:
        if row.plugin in ("missing", "no_entry", "/x/Grove.vst"):
            continue  # There is no file that the scan of a folder takes for a plug-in.
        yield Row(row.name, row.plugin, row.kind, row.place, row.fault_status, expected_of(row), row.end.status is None)


# ----- Forgeries.

def forged(kind, place, expected, status=0):
    return Row(f"forged/{kind}({status})@{place}", "faulty", kind, place, status, expected)


def rows_of_forgeries():
    for place in PLACES:
        step = place.steps or None
        ended = Expected("exited", step, request_of(place.name), None, 0)
        yield forged("_exit", place.name, ended)
        yield forged("forge_lines+_exit", place.name, ended._replace(contradicts=True))
        yield forged("close_stdout+_exit", place.name, ended)
    for place in ["load", "entry", "dispatch:58", "dispatch:52", "dispatch:1:2"]:
        request = request_of(place)
        step = PLACE_OF[place].steps or None
        # The run goes on and reaches its end.
        for kind in ["forge_lines", "forge_lines_in_a_child", "forge_last_words", "scribble_over_the_record",
                     "wipe_the_record"]:
            yield forged(kind, place, Expected("exited", ALL_STEPS, WITHOUT_CHECK, None, 0, True))
        # Nothing but the lines is left to say which step it was.
        for kind in ["scribble_over_the_record+forge_lines+_exit", "wipe_the_record+forge_lines+_exit"]:
            yield forged(kind, place, Expected("exited", ALL_STEPS, None, None, 0, True))
        yield forged("forge_failure+_exit", place, Expected("exited", step, request, None, 3, None), 3)
        yield forged("forge_last_words+null_store", place, Expected("crashed", step, request, "SIGSEGV"))
        yield forged("forge_lines+null_store", place, Expected("crashed", step, request, "SIGSEGV"))
        yield forged("scribble_over_the_record+null_store", place, Expected("crashed", step, None))
        yield forged("close_stdout+close_stderr+_exit", place, Expected("exited", step, request, None, 0))
    for kind in ["forge_step", "forge_failure"]:
        yield forged(kind, "dispatch:52", Expected("exited", ALL_STEPS, None, None, 0, True))
    yield forged("close_stdout+close_stderr", "dispatch:52", Expected("exited", 6, None, None, 0, True))
    for status in [139, 134, 64]:
        yield forged("_exit", "dispatch:52", Expected("exited", 6, ("dispatcher", 52), None, status), status)
    # A name on the list of those that are never loaded.
    yield Row("refused", "well_behaved_effect", None, None, 0, Expected("refused", None), False, "Grove.vst")
    # All that would tell a worker that has begun from one that has not is gone.
    yield forged("wipe_the_record+_exit", "load", Expected("not_run", None))


def rows_of_everything():
    return list({row.name: row for source in (rows_of_the_matrix, rows_of_forgeries) for row in source()}.values())


# ----- The scan.

def prepare(rows, plugins, folder):
    """Makes the copies; by their path."""
    copies = {}
    for number, row in enumerate(rows):
        place = os.path.join(folder, str(number))
        os.mkdir(place)
        copy = os.path.join(place, row.name_as or row.plugin + ".so")
        shutil.copyfile(os.path.join(plugins, row.plugin + ".so"), copy)
        if row.kind is not None:
            pathlib.Path(copy + ".fault").write_text(f"{row.kind} {row.place} {row.status}\n")
        copies[os.path.realpath(copy)] = row
    return copies


def scan(arguments, folder, options):
    """The results of a folder by the path of the plug-in, and what was wrong with the scan itself."""
    command = [arguments.scan, "-j", str(arguments.jobs), "--cache=off", "--quiet", "--no-progress",
               "--json", os.path.join(folder, "events"), *options, os.path.join(folder, "plugins")]
    environment = {name: value for name, value in os.environ.items() if not name.startswith("FAULT_")}
    ended = subprocess.run(command, env=environment, stdin=subprocess.DEVNULL, stdout=subprocess.PIPE,
                           stderr=subprocess.STDOUT, check=False)
    if ended.returncode not in (0, 1):
        return {}, [f"the scan ended with {ended.returncode}: {ended.stdout.decode(errors='replace')[-500:]}"]
    results = {}
    with open(os.path.join(folder, "events"), encoding="utf-8") as events:
        for event in map(json.loads, events):
            if event["event"] == "plugin_ended" and event["plugin"]["child"] is None:
                results[os.path.realpath(event["plugin"]["bundle"])] = event
    return results, []


def request_seen(request):
    if request is None:
        return None
    return ("dispatcher", request["opcode"]) if request["kind"] == "dispatcher" else (request["kind"],)


def first_drawn(result):
    """The number of the first of the drawn steps that is for the latency; the last step where none is."""
    drawn = [step["number"] for step in result["steps"] if step["number"] > 15 and step["text"] == "inspect latency"]
    return min(drawn, default=ALL_STEPS)


def differences(row, result):
    """What the scan says and should not say, in words; empty for a row that holds."""
    if result is None:
        return ["no result"]
    expected, found = row.expected, []
    if result["verdict"] != expected.verdict:
        found.append(f"{result['verdict']} instead of {expected.verdict}")
    step = None if result["step"] is None else result["step"]["number"]
    wanted = first_drawn(result) if expected.step == FIRST_DRAWN else expected.step
    if expected.step is not WITHOUT_CHECK and step != wanted:
        found.append(f"step {step} instead of {wanted}")
    request = request_seen(result["request"])
    if expected.request is not WITHOUT_CHECK and request != expected.request:
        found.append(f"request {request} instead of {expected.request}")
    signal = None if result["signal"] is None else result["signal"]["name"]
    if expected.signal is not None and signal != expected.signal:
        found.append(f"signal {signal} instead of {expected.signal}")
    if expected.status is not None and result["status"] != expected.status:
        found.append(f"status {result['status']} instead of {expected.status}")
    if expected.contradicts is not None and bool(result["contradictions"]) != expected.contradicts:
        found.append(f"contradictions: {result['contradictions']}")
    if result["isWanted"] != (expected.verdict in ("passed", "shell")):
        found.append("wanted" if result["isWanted"] else "not wanted")
    if not result["cause"] and expected.verdict not in ("passed", "shell"):
        found.append("no cause")
    if found:
        found.append(f"({result['cause']})")
    return found


def run_rows(rows, arguments, options):
    """The failed rows and what is wrong with them."""
    failed = []
    for begin in range(0, len(rows), ROWS_AT_A_TIME):
        batch = rows[begin:begin + ROWS_AT_A_TIME]
        with tempfile.TemporaryDirectory(prefix="scan_matrix.") as folder:
            os.mkdir(os.path.join(folder, "plugins"))
            copies = prepare(batch, arguments.plugins, os.path.join(folder, "plugins"))
            results, problems = scan(arguments, folder, options)
            failed += [("the scan", problem) for problem in problems]
            for path, row in copies.items():
                found = differences(row, results.get(path))
                if found:
                    failed.append((row.name, "; ".join(found)))
    return failed


def sandbox_works():
    command = ["bwrap", "--ro-bind", "/", "/", "--proc", "/proc", "--dev", "/dev", "--unshare-pid", "--unshare-net",
               "--unshare-ipc", "true"]
    try:
        return subprocess.run(command, stderr=subprocess.DEVNULL, check=False).returncode == 0
    except FileNotFoundError:
        return False


def is_in_part(row, part):
    wanted, parts = map(int, part.split("/"))
    return zlib.crc32(row.name.encode()) % parts == wanted - 1


def main():
    parser = argparse.ArgumentParser(description=__doc__, formatter_class=argparse.RawDescriptionHelpFormatter)
    parser.add_argument("--scan", required=True, help="the vsttorture-scan to run")
    parser.add_argument("--plugins", required=True, help="the folder of the sample plug-ins")
    parser.add_argument("--only", default="", metavar="REGEX", help="rows whose name matches")
    parser.add_argument("--list", action="store_true", help="print the rows and what they demand")
    parser.add_argument("--part", default="1/1", metavar="K/N", help="a fixed part of the rows")
    parser.add_argument("--sandboxed", type=int, metavar="COUNT", help="run so many rows in the sandbox")
    parser.add_argument("--sanitizer", choices=["address", "thread"], help="the one that the programs are built with")
    parser.add_argument("--seed", type=int, default=random.SystemRandom().randrange(1 << 32), help="what draws them")
    parser.add_argument("--jobs", type=int, default=12, help="runs at a time; some of them only wait")
    arguments = parser.parse_args()
    arguments.scan, arguments.plugins = os.path.abspath(arguments.scan), os.path.abspath(arguments.plugins)

    part = "1/1" if os.environ.get("VSTTORTURE_SCAN_MATRIX") == "all" else arguments.part
    rows = [row for row in rows_of_everything() if re.search(arguments.only, row.name) and is_in_part(row, part)]
    options = ["--sandbox=off"]
    if arguments.sanitizer is not None:
        rows = [row for row in rows_of_everything() if is_in_part(row, PART_FOR_SANITIZERS) and not
                (reason_to_leave_out(row, arguments.sanitizer) or is_reported(row, arguments.sanitizer))]
    if arguments.sandboxed is not None:
        if not sandbox_works():
            print("bubblewrap does not work here")
            return SKIPPED
        print(f"seed {arguments.seed}")
        # A status that the sandbox uses for a signal cannot be told from it.
        rows = [row for row in rows if not (row.kind == "_exit" and row.status > 128)]
        rows = random.Random(arguments.seed).sample(rows, min(arguments.sandboxed, len(rows)))
        options = ["--sandbox=required"]
    if arguments.list:
        for row in rows:
            print(row.name, *row.expected[:3], sep="\t")
        return 0
    if not rows:
        print("no such row")
        return 1

    resource.setrlimit(resource.RLIMIT_CORE, (0, 0))
    take_usual_start()
    started = time.monotonic()
    failed = run_rows([row for row in rows if not row.hangs], arguments, options)
    failed += run_rows([row for row in rows if row.hangs], arguments, [*options, "--step-limit", "4", "--limit", "30"])
    for name, problem in failed:
        print(f"{name}: {problem}")
    print(f"{len(rows)} rows in {time.monotonic() - started:.0f} s, {len(failed)} failed")
    return 1 if failed else 0


if __name__ == "__main__":
    sys.exit(main())
