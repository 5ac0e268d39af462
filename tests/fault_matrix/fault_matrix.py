# SPDX-License-Identifier: MIT
"""Every end is a known end: the program with a faulty plug-in, one run for each kind of fault at each place.

    fault_matrix.py --program build/release/vsttorture --plugins build/release/plugins [--only REGEX] [--list]

Prints a line for each row that fails, then a summary. The rows stand in rows.py. Each run is made and judged by the
Python example of docs/examples. With --consumer the compiled C++ example makes and judges a run of each kind that looks
different to a host, and its verdict and status are compared; the Python one is run as a command for a row of each
verdict. What does not apply to a build with a sanitizer stands in sanitizers.py, and is named in the summary.
"""
import argparse
import collections
import os
import pathlib
import re
import resource
import sys
import time

sys.path.insert(0, str(pathlib.Path(__file__).resolve().parents[1] / "shared"))
from program_run import as_printed, in_processes, run_program, take_usual_start, try_plugin  # noqa: E402
from rows import (ALL_STEPS, FLOOD, FIRST_DRAWN, LAST_DRAWN, LAST_WORDS, PHASE_OF_DRAWN, TEXT_WITHOUT_END,  # noqa: E402
                  all_rows)
from sanitizers import kinds_of, options_for, proofs, reason_to_leave_out, unwanted_report  # noqa: E402

LIMIT_IN_SECONDS = 20  # As the machine may be busy.
FLOOD_LIMIT_IN_SECONDS = 60  # On a busy machine 8 MiB of small writes take long.
HANG_LIMIT_IN_SECONDS = 5  # Before it, the run must have come to the place where it hangs, on a busy machine, too.
PROOF_LIMIT_IN_SECONDS = 4
GRACE_IN_SECONDS = 10
# Kinds that put text between the lines, or keep standard output open.
NOISE = frozenset(["buffer_stdout", "buffer_stdout@load", "close_stdout", "daemon_flooding_stdout",
                   "daemon_keeping_stdout", "flood_stdout", "fork_keeping_stdout", "print", "print_when_unloaded",
                   "wcout", "wprintf"])


def environment_of(row, sanitizer=None):
    """What the plug-in of the row asks for, and the sanitizer ("address", "thread") that the program is built with."""
    environment = {name: value for name, value in os.environ.items() if name.endswith("SAN_OPTIONS")}
    environment.update(options_for(row, environment, sanitizer))
    if row.kind is not None:
        environment.update(FAULT_KIND=row.kind, FAULT_PLACE=row.place, FAULT_STATUS=str(row.fault_status))
    return environment


def command_of(row, program, plugins):
    return [program, row.plugin if row.plugin.startswith("/") else os.path.join(plugins, row.plugin + ".so")]


def limit_of(row, limit=LIMIT_IN_SECONDS):
    if row.end.status is None:
        return HANG_LIMIT_IN_SECONDS
    return FLOOD_LIMIT_IN_SECONDS if "flood_stdout" in kinds_of(row) else limit


def run_row(row, program, plugins, limit=LIMIT_IN_SECONDS, sanitizer=None):
    return run_program(command_of(row, program, plugins), limit_of(row, limit), environment_of(row, sanitizer))


def without_noise(row, output):
    """Takes out what the plug-in itself printed. None when that is not there."""
    kinds = kinds_of(row)
    if "flood_stdout" in kinds and output.count(FLOOD) < 65536:
        return None
    if {"print", "print_when_unloaded", "wcout"}.intersection(kinds):
        is_too_late = "print" in kinds and LAST_WORDS + TEXT_WITHOUT_END in output
        if output.count(TEXT_WITHOUT_END) != 1 or is_too_late:
            return None
        output = output.replace(TEXT_WITHOUT_END, "")
    if "daemon_flooding_stdout" in kinds:
        output = output.rstrip("x")  # Of the last line there may be only the beginning.
    return output.replace(FLOOD, "")


def possible_steps(row):
    """Which of the drawn steps is the first for the latency is different in each run."""
    return range(len(try_plugin.FIXED_STEPS) + 1, ALL_STEPS + 1) if row.end.steps == FIRST_DRAWN else [row.end.steps]


def number_of_steps(row, texts):
    """The number of steps that a run with these texts must have."""
    drawn = texts[len(try_plugin.FIXED_STEPS):]
    latency = [step for step, text in zip(possible_steps(row), drawn) if text == "inspect latency"]
    return row.end.steps if row.end.steps != FIRST_DRAWN else min(latency, default=ALL_STEPS)


def differences(row, seen, sanitizer=None):
    """What is seen and should not be, in words; empty for a row that holds."""
    output = without_noise(row, seen.output)
    if output is None:
        return [f"what the plug-in prints is missing: {seen.output[-200:]!r}"]
    total, texts = try_plugin.read_steps(output)
    steps, head = number_of_steps(row, texts), as_printed(total, texts)
    tail = row.end.tail.replace(LAST_DRAWN, PHASE_OF_DRAWN.get(texts[-1], "") if texts else "")
    found = []
    if len(texts) != steps:
        found.append(f"{len(texts)} steps instead of {steps}")
    if total != (row.end.total if steps > 0 else None):
        found.append(f"a total of {total}")
    if output != head + tail:
        found.append(f"{output.removeprefix(head)[-200:]!r} after the steps instead of {tail!r}")
    if seen.status != row.end.status:
        found.append(f"status {seen.status} instead of {row.end.status}")
    if row.end.errors is not None and seen.errors != row.end.errors:
        found.append(f"standard error {seen.errors[-200:]!r} instead of {row.end.errors!r}")
    if unwanted_report(row, seen.errors, sanitizer):
        found.append(f"a report of the sanitizer: {seen.errors[:2000]!r}")
    if seen.leftovers:
        found.append(f"files left: {seen.leftovers}")
    if seen.seconds > limit_of(row) + GRACE_IN_SECONDS:
        found.append(f"{seen.seconds:.0f} s")
    verdict, expected_verdict = try_plugin.judge(seen.output, seen.status), row.end.verdict.format(steps)
    if verdict != expected_verdict:
        found.append(f"verdict {verdict!r} instead of {expected_verdict!r}")
    return found


def consumer_differences(row, consumer, program, plugins):
    """Likewise for the example as a command: it prints the verdict, and its status tells a pass."""
    limit = limit_of(row)
    seen = run_program([*consumer, "--limit", str(limit), *command_of(row, program, plugins)],
                       limit + GRACE_IN_SECONDS, environment_of(row))
    verdicts = {row.end.verdict.format(steps) for steps in possible_steps(row)}
    status = 0 if verdicts <= {"passed", "shell"} else 1
    if seen.output.removesuffix("\n") in verdicts and seen.status == status:
        return []
    return [f"{seen.output!r} and status {seen.status} instead of {min(verdicts)!r} and {status}"]


def rows_that_look_different(rows):
    """A row of each end that a host can see, and of each text that a plug-in puts between the lines."""
    return list({(row.end._replace(errors=None), NOISE.intersection(kinds_of(row))): row for row in rows}.values())


def a_row_of_each_verdict(rows):
    return list({row.end.verdict.split("{")[0]: row for row in rows}.values())


def main():
    parser = argparse.ArgumentParser(description=__doc__, formatter_class=argparse.RawDescriptionHelpFormatter)
    parser.add_argument("--program", help="the vsttorture to run")
    parser.add_argument("--plugins", help="the folder of the sample plug-ins")
    parser.add_argument("--only", default="", metavar="REGEX", help="rows whose name matches")
    parser.add_argument("--list", action="store_true", help="print the rows and what they demand")
    parser.add_argument("--consumer", metavar="TRY_PLUGIN", help="let this compiled example run the program")
    parser.add_argument("--sanitizer", choices=["address", "thread"], help="the one that the program is built with")
    parser.add_argument("--jobs", type=int, default=16, help="runs at a time; some of them only wait")
    arguments = parser.parse_args()

    rows = [row for row in all_rows() if re.search(arguments.only, row.name)]
    if arguments.consumer:
        rows = rows_that_look_different(rows)
    if arguments.list:
        for row in rows:
            print(f"{row.name}\t{row.end.steps} steps, {row.end.tail!r}, status {row.end.status}")
        return 0
    if not rows:
        print("no such row")
        return 1

    resource.setrlimit(resource.RLIMIT_CORE, (0, 0))
    take_usual_start()
    started = time.monotonic()
    program, plugins = os.path.abspath(arguments.program), os.path.abspath(arguments.plugins)
    sanitizer = arguments.sanitizer

    def check(row, limit=LIMIT_IN_SECONDS):
        """What is wrong with the row; empty when it holds."""
        if arguments.consumer:
            return consumer_differences(row, [os.path.abspath(arguments.consumer)], program, plugins)
        return differences(row, run_row(row, program, plugins, limit, sanitizer), sanitizer)

    def check_python_command(row):
        return consumer_differences(row, [sys.executable, try_plugin.__file__], program, plugins)

    left_out = collections.Counter(reason_to_leave_out(row, sanitizer) for row in rows)
    applying = [row for row in rows if reason_to_leave_out(row, sanitizer) is None]
    tries = [(row.name, check, row) for row in applying]
    if arguments.consumer:
        tries += [(f"{row.name} in Python", check_python_command, row) for row in a_row_of_each_verdict(rows)]
    proven = [(row.name, lambda row: check(row, PROOF_LIMIT_IN_SECONDS), row) for row in proofs(rows, sanitizer)]
    found = in_processes(lambda one: one[1](one[2]), tries + proven, arguments.jobs)
    failed = 0
    for (name, _, _), problems in zip(tries, found):
        if problems:
            failed += 1
            print(f"{name}: {'; '.join(problems)}", flush=True)
    for (name, _, _), problems in zip(proven, found):
        if not problems:
            failed += 1
            print(f"{name}: holds, although it is said not to apply", flush=True)
    for reason, count in left_out.items():
        if reason is not None:
            print(f"{count} rows do not apply: {reason}")
    print(f"{len(applying)} rows in {time.monotonic() - started:.0f} s, {failed} failed")
    return 1 if failed else 0


if __name__ == "__main__":
    sys.exit(main())
