# SPDX-License-Identifier: MIT
"""The flight record is true at every place of the fault matrix: each row once, with vsttorture-worker.

    flight_records.py --worker build/release/vsttorture-worker --plugins build/release/plugins [--only REGEX]

For each row: what a host sees is what the row demands of vsttorture; and the record names the step, the request under
way with its arguments where the run ended inside of one, and for a signal its number and the module that it happened
in. Prints a line for each row that fails, then a summary.

Nothing here is taken from the worker: the arguments of each request and the signal of each fault are literals.
"""
import argparse
import os
import pathlib
import re
import resource
import signal
import sys
import tempfile
import time

sys.path.insert(0, str(pathlib.Path(__file__).resolve().parents[2] / "docs" / "examples"))
import explain_plugin  # noqa: E402
from fault_matrix import (command_of, differences, environment_of, in_processes, limit_of, number_of_steps,  # noqa: E402
                          run_program, take_usual_start, try_plugin, without_noise)
from rows import ALL_STEPS, KIND_OF, PLACE_OF, all_rows  # noqa: E402
from sanitizers import kinds_of  # noqa: E402

# ----- The request at each place: index, value and float, where they are not all 0.
ARGUMENTS = {
    "dispatch:10": (0, 0, 44100.0),
    "dispatch:11": (0, 512, 0.0),
    "dispatch:31": (1, 1, 0.0),      # pins are connected from the last down to the first
    "dispatch:31:2": (0, 1, 0.0),
    "dispatch:32": (1, 1, 0.0),
    "dispatch:7": (2, 0, 0.0),       # the texts of the steps of the third parameter
    "dispatch:56:3": (2, 0, 0.0),
    "dispatch:29": (1, -1, 0.0),     # the first that is not the current program; of no category
    "dispatch:2:2": (0, 1, 0.0),
    "dispatch:56:6": (2, 0, 0.0),
    "dispatch:10:2": (0, 0, 44100.0),
    "dispatch:11:2": (0, 512, 0.0),
    "dispatch:23": (1, 0, 0.0),      # index 1: of a program
    "dispatch:24": (1, 12, 0.0),     # three floats
    "dispatch:24:2": (0, 52, 0.0),   # the number of the current program, and three floats for each of the four
    "dispatch:12": (0, 1, 0.0),
    "dispatch:44": (0, 1, 0.0),
    "dispatch:10:3": (0, 0, 44100.0),
    "dispatch:7:14": (2, 0, 0.0),
}

# ----- The first signal that reaches the guard, and where. One of the system's is about an address.
PLUGIN, LIBRARY, WORKER = "the plug-in", "the C library", "the worker"  # the last without an instance
RAISED = {f"raise:{name}": (name, LIBRARY) for name in
          ["SIGINT", "SIGABRT", "SIGHUP", "SIGSEGV", "SIGTERM", "SIGBUS", "SIGILL", "SIGFPE", "SIGTRAP", "SIGSYS"]}
SIGNALS = {
    **RAISED,
    "null_store": ("SIGSEGV", PLUGIN),
    "write_read_only": ("SIGSEGV", PLUGIN),
    "stack_overflow": ("SIGSEGV", PLUGIN),
    "abort": ("SIGABRT", LIBRARY),
    "terminate": ("SIGABRT", LIBRARY),
    "divide_by_zero": ("SIGFPE", PLUGIN),
    "illegal_instruction": ("SIGILL", PLUGIN),
    "double_free": ("SIGABRT", LIBRARY),
    "heap_corruption": ("SIGABRT", LIBRARY),
    "crash_with_heap_lock": ("SIGABRT", LIBRARY),
    "crash_with_stdout_lock": ("SIGSEGV", PLUGIN),
    "crash_with_own_stdout_lock": ("SIGSEGV", PLUGIN),
    "crash_under_destructor_lock": ("SIGSEGV", PLUGIN),
    "thread_crash": ("SIGSEGV", PLUGIN),
    "thread_throw": ("SIGABRT", LIBRARY),
    "thread_crash_behind_the_run": ("SIGSEGV", PLUGIN),
    "leave_the_thread": ("SIGABRT", LIBRARY),
}
# These do nothing before the process ends: a crash of another kind, or an exit, comes before them.
CRASHES_AT_EXIT = ["crash_in_atexit", "crash_in_every_atexit", "crash_in_static_destructor"]
THROW = ["throw_int", "throw_runtime_error", "throw_struct"]
ON_A_THREAD = ["thread_crash", "thread_throw", "thread_crash_behind_the_run"]
# The signal that the kind blocks arrives when the guard of another unblocks it.
LATER_SIGNALS = {"raise_in_atexit:SIGSEGV": ("SIGSEGV", LIBRARY),
                 "null_chunk": ("SIGSEGV", LIBRARY),  # in the copy that the program makes
                 "block_signals+raise:SIGTERM+null_store": ("SIGSEGV", PLUGIN),
                 "crash_in_static_destructor+crash_in_atexit+raise:SIGTERM": ("SIGTERM", LIBRARY)}
# Whole plug-ins: the place at which each of them ends the run, and the signal.
PLACE_OF_PLUGIN = {"open_crashes": "dispatch:0", "exits_on_open": "dispatch:0", "exits_in_test": "dispatch:52"}
SIGNAL_OF_PLUGIN = {"open_crashes": ("SIGSEGV", PLUGIN)}
# Overwrites the guard's own stack: whichever notices first.
LONG_TEXTS = {"SIGABRT", "SIGSEGV", "SIGBUS", "SIGILL"}


def request_at(place):
    moment, *numbers = place.split(":")
    index, value, number = ARGUMENTS.get(place, (0, 0, 0.0))
    if moment == "dispatch":
        return ("dispatcher", int(numbers[0]), index, value, number)
    if moment == "getParameter":
        return ("getParameter", None, 0, None, None)
    if moment == "setParameter":
        return ("setParameter", None, 2, None, 0.0)  # the third is stepped: its first value's text is asked for
    return (moment, None, None, None, None)


def made(request):
    return (request.kind, request.opcode, request.index, request.value, request.opt)


def is_without_instance(row):
    """Whether the program has to crash on purpose."""
    if row.kind is None:
        return row.plugin in ("no_entry", "null_instance", "entry_throws")
    is_thrown = any(kind in THROW for kind in kinds_of(row))
    return row.kind == "no_instance" or is_thrown and PLACE_OF[row.place].thrown in ("no instance",
                                                                                   "no second instance")


def expected_signal(row):
    """Its name and place; None where no handler of ours is called, or the row says nothing about it."""
    if row.kind in LATER_SIGNALS:
        return LATER_SIGNALS[row.kind]
    if row.end.status is not None and row.end.status < 0:
        return None
    if row.kind is None and row.plugin in SIGNAL_OF_PLUGIN:
        return SIGNAL_OF_PLUGIN[row.plugin]
    if is_without_instance(row):
        return ("SIGSEGV", WORKER)
    for kind in kinds_of(row):
        if kind in SIGNALS:
            return SIGNALS[kind]
    if any(kind in kinds_of(row) for kind in CRASHES_AT_EXIT):
        return ("SIGSEGV", PLUGIN)
    return ("SIGABRT", LIBRARY) if "throw_when_unloaded" in kinds_of(row) else None


def signal_differences(row, record, plugins):
    if (row.kind or "").startswith("long_texts"):
        name = explain_plugin.signal_name(record.fault.signal) if record.fault else None
        return [] if name in LONG_TEXTS else [f"signal {name}"]
    expected = expected_signal(row)
    if expected is None:
        return [] if record.fault is None else [f"a signal: {explain_plugin.fault_text(record)}"]
    if record.fault is None:
        return [f"no signal instead of {expected[0]}"]
    found, fault = [], record.fault
    name = explain_plugin.signal_name(fault.signal)
    if name != expected[0]:
        found.append(f"{name} instead of {expected[0]}")
    if expected[1] == WORKER and (os.path.basename(fault.module) != "vsttorture-worker" or fault.address != 0):
        found.append(f"in {fault.module!r} at {fault.address:#x} instead of the worker's own crash")
    if expected[1] == PLUGIN and (fault.module != command_of(row, "", plugins)[1] or fault.offset == 0):
        found.append(f"in {fault.module!r}+{fault.offset:#x} instead of the plug-in")
    # A 32-bit process makes its system calls from a page of the kernel's, which is no file.
    in_kernel_page = record.pointer_size == 4 and fault.module == ""
    if expected[1] == LIBRARY and not in_kernel_page and not os.path.basename(fault.module).startswith("libc.so"):
        found.append(f"in {fault.module!r} instead of the C library")
    is_ours = any(kind in ON_A_THREAD for kind in kinds_of(row))
    if (fault.thread != record.process) != is_ours:
        found.append(f"thread {fault.thread} of process {record.process}")
    if expected in (("SIGSEGV", PLUGIN), ("SIGSEGV", WORKER)) and fault.code <= 0:
        found.append(f"code {fault.code}")
    if expected[1] == LIBRARY and row.kind != "null_chunk" and (fault.code > 0 or fault.sender != record.process):
        found.append(f"code {fault.code} from process {fault.sender}")
    return found


def leads_to(row):
    """How the run ended: inside the request of the row's place, by something thrown, or at its own end."""
    kinds = kinds_of(row)
    if row.kind is None and row.plugin in PLACE_OF_PLUGIN:
        return "inside"
    if row.kind is None and row.end.verdict in ("passed", "shell"):
        return "passed"
    if row.kind is None and row.end.verdict == "not loadable":
        return "not loaded"
    if row.kind is None or row.kind in ("no_instance", "null_chunk") or row.kind.startswith("long_texts"):
        return "outside"
    if any(kind in THROW for kind in kinds) or "leave_the_thread" in kinds:
        return "thrown"
    if row.kind in ("close_stdout", "hang_in_atexit", "hold_stdout_lock"):
        return "passed"  # as far as the plug-in is concerned
    if row.end.status is None or row.end.status < 0 or row.end.verdict.startswith(("crashed", "exited", "killed")):
        is_late = row.kind in KIND_OF and KIND_OF[row.kind].leads_to == "late"
        is_late = is_late or row.kind.startswith("raise_in_atexit")
        return "late" if is_late else "inside"
    is_gone = kinds[-1] in ("_exit", "quick_exit", "exec") or re.match(r"(_exit|exec|quick_exit)\b", row.kind)
    return "inside" if is_gone else "passed"


def end_differences(row, record):
    """The request, the verdict and the note of an exit."""
    found = []
    expected = leads_to(row)
    passed = ("shell" if row.end.total == 51 else "passed", "ended")
    if expected == "inside":
        request = request_at(row.place or PLACE_OF_PLUGIN[row.plugin])
        if record.request.state != "under way" or made(record.request) != request:
            found.append(f"request {record.request} instead of {request}")
        if record.verdict != "none":
            found.append(f"verdict {record.verdict}")
    elif expected == "thrown":
        if record.thrown.state != "threw" or made(record.thrown) != request_at(row.place):
            found.append(f"thrown {record.thrown} instead of {request_at(row.place)}")
        if record.step_of_thrown != PLACE_OF[row.place].steps and PLACE_OF[row.place].steps in range(ALL_STEPS + 1):
            found.append(f"thrown in step {record.step_of_thrown}")
        verdict = thrown_verdict(row)
        if (record.verdict, record.failure_code) != verdict:
            found.append(f"verdict {record.verdict} {record.failure_code} instead of {verdict}")
    elif expected == "not loaded":
        if (record.verdict, record.failure_code) != ("failed", -1) or record.request.state == "under way":
            found.append(f"verdict {record.verdict} {record.failure_code}, request {record.request}")
    elif is_without_instance(row):
        if record.verdict != "no instance":
            found.append(f"verdict {record.verdict}")
    elif expected in ("passed", "late"):
        if record.request.state == "under way":
            found.append(f"request {record.request}")
        if (record.verdict, record.phase) != passed and row.kind != "hold_stdout_lock":
            found.append(f"{record.verdict} and {record.phase} instead of {passed}")
    if record.unexpected_exit and not row.end.tail.endswith("unexpected exit"):
        found.append("a note of an exit")
    if expected == "inside" and row.end.verdict.startswith("exited") and row.end.tail and not record.unexpected_exit:
        found.append("no note of an exit")
    return found


def thrown_verdict(row):
    if row.end.status == 0:
        return ("passed", 0)
    if row.end.status == 1:
        return ("shell", 0)
    if row.kind == "leave_the_thread" and row.place == "entry":
        return ("none", 0)  # the C library aborts where the unwinding is stopped
    if "!" not in row.end.tail:
        return ("no instance", 0)
    return ("failed", 5) if row.end.tail.endswith("failed 5\n") else ("failed, unknown error", 0)


def record_differences(row, record, output, plugins):
    found = []
    if record.bundle != command_of(row, "", plugins)[1]:
        found.append(f"bundle {record.bundle}")
    _, texts = try_plugin.read_steps(without_noise(row, output) or "")
    steps, text = number_of_steps(row, texts), texts[-1] if texts else ""
    if row.kind == "close_stdout":
        steps, text = 1 if row.end.total == 51 else ALL_STEPS, None  # all of them, unseen
    if row.kind == "close_stdout+null_store":
        text = None
    if row.kind == "hold_stdout_lock":
        steps, text = steps + 1, try_plugin.FIXED_STEPS[steps]  # the next step waits for the lock
    if record.step != steps or len(record.step_times) != steps:
        found.append(f"step {record.step} with {len(record.step_times)} times instead of {steps}")
    if text is not None and record.step_text != text:
        found.append(f"step text {record.step_text!r} instead of {text!r}")
    return found + signal_differences(row, record, plugins) + end_differences(row, record)


def check(row, worker, plugins):
    """What is wrong with the row; empty when it holds."""
    with tempfile.TemporaryDirectory(prefix="flight_records.") as folder:
        path = os.path.join(folder, "record")
        _, plugin = command_of(row, worker, plugins)
        seen = run_program([worker, "--record", path, plugin], limit_of(row), environment_of(row))
        found = differences(row, seen)
        with open(path, "rb") as file:
            data = file.read()
    try:
        record = explain_plugin.read_record(data)
    except ValueError as error:
        return found + [f"no record, because {error}"]
    if row.end.verdict == "refused" and row.kind is None:
        return found + ([] if record.verdict == "refused" and record.request.state == "idle" else [str(record)])
    return found + record_differences(row, record, seen.output, plugins)


def main():
    parser = argparse.ArgumentParser(description=__doc__, formatter_class=argparse.RawDescriptionHelpFormatter)
    parser.add_argument("--worker", required=True, help="the vsttorture-worker to run")
    parser.add_argument("--plugins", required=True, help="the folder of the sample plug-ins")
    parser.add_argument("--only", default="", metavar="REGEX", help="rows whose name matches")
    parser.add_argument("--jobs", type=int, default=16, help="runs at a time; some of them only wait")
    arguments = parser.parse_args()

    resource.setrlimit(resource.RLIMIT_CORE, (0, 0))
    take_usual_start()
    started = time.monotonic()
    worker, plugins = os.path.abspath(arguments.worker), os.path.abspath(arguments.plugins)
    rows = [row for row in all_rows() if re.search(arguments.only, row.name)]
    failed = 0
    for row, found in zip(rows, in_processes(lambda row: check(row, worker, plugins), rows, arguments.jobs)):
        if found:
            failed += 1
            print(f"{row.name}: {'; '.join(found)}", flush=True)
    print(f"{len(rows)} rows in {time.monotonic() - started:.0f} s, {failed} failed")
    return 1 if failed or not rows else 0


if __name__ == "__main__":
    sys.exit(main())
