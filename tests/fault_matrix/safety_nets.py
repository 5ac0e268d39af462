# SPDX-License-Identifier: MIT
"""Each safety net around the exit after a crash is needed: without it, rows of the fault matrix fail in a known way.

    safety_nets.py --plugins build/release/plugins NET=PROGRAM...

PROGRAM is the program without that net. That the whole program passes the same rows is the fault matrix itself. In some
rows the crash races with the rest of the run, and on a busy machine the rest can be late: one of three tries has to show
what is expected.
"""
import argparse
import concurrent.futures
import os
import resource
import sys
import time

from fault_matrix import run_row, take_usual_start, try_plugin
from rows import all_rows

JOBS = 8  # Those that hang only wait.
MOST_TRIES = 3
LIMIT_IN_SECONDS = 4  # The timer that a variant lacks is one of one second.

# {net: {row: what a host sees without it, the verdict and whether the last words stand}}
NEEDED_BY = {
    "signal_stack": {
        "faulty/stack_overflow@dispatch:52": ("killed by signal 11 at 6", False),
        "faulty/stack_overflow@load": ("killed by signal 11 at 0", False),
        "faulty_own_runtime/stack_overflow@dispatch:52": ("killed by signal 11 at 6", False),
    },
    "exit_now": {
        "faulty/crash_in_every_atexit+null_store@dispatch:52": ("killed by signal 11 at 6", False),
        "faulty/crash_in_every_atexit@dispatch:52": ("killed by signal 11 at 65", False),
    },
    "second_signal": {
        "faulty/crash_in_atexit+null_store@dispatch:52": ("killed by signal 11 at 6", False),
        "faulty/crash_in_static_destructor+null_store@dispatch:52": ("killed by signal 11 at 6", False),
        "faulty/block_signals+crash_with_stdout_lock@dispatch:52": ("timed out at 6", False),
    },
    "timer": {
        "faulty/crash_with_stdout_lock@dispatch:52": ("timed out at 6", False),
        "faulty/crash_under_destructor_lock@dispatch:52": ("timed out at 6", False),
        "faulty/hang_in_atexit+null_store@dispatch:52": ("timed out at 6", False),
        "faulty/use_heap_in_atexit+crash_with_heap_lock@dispatch:52": ("timed out at 6", False),
    },
    "closed_report": {
        "faulty/thread_crash_behind_the_run@dispatch:52": ("passed", False),
        "faulty/thread_crash_behind_the_run@dispatch:1": ("passed", False),
        "faulty/exit_on_a_thread@dispatch:52": ("exited at 65 with 0", False),
    },
    "direct_last_words": {
        "faulty/crash_with_stdout_lock@dispatch:52": ("crashed at 6", False),
        "faulty/crash_in_atexit+null_store@dispatch:52": ("crashed at 6", False),
        "faulty/block_signals+raise:SIGTERM+null_store@dispatch:52": ("crashed at 6", False),
    },
    "own_process": {
        "faulty/fork_child_exits@dispatch:1:2": ("exited at 65 with 0", True),
        "faulty/fork_child_crashes@dispatch:1:2": ("exited at 65 with 0", True),
        "faulty/vfork_child_crashes@dispatch:52": ("crashed at 6", True),
    },
    "exception_handler": {
        "faulty/raise:SIGILL@dispatch:52": ("killed by signal 4 at 6", False),
        "faulty/raise:SIGTRAP@dispatch:52": ("killed by signal 5 at 6", False),
        "faulty/raise:SIGSYS@dispatch:52": ("killed by signal 31 at 6", False),
        "faulty/divide_by_zero@dispatch:52": ("killed by signal 8 at 6", False),
        "faulty/illegal_instruction@dispatch:52": ("killed by signal 4 at 6", False),
    },
}
# A row of each variant that needs no net: the variant is the program otherwise.
CONTROL = "faulty/null_store@dispatch:52"
CONTROL_IS = ("crashed at 6", True)


def what_is_seen(row, program, plugins):
    seen = run_row(row, program, plugins, LIMIT_IN_SECONDS)
    return try_plugin.judge(seen.output, seen.status), seen.output.endswith("unexpected exit")


def main():
    parser = argparse.ArgumentParser(description=__doc__, formatter_class=argparse.RawDescriptionHelpFormatter)
    parser.add_argument("--plugins", required=True, help="the folder of the sample plug-ins")
    parser.add_argument("variants", nargs="+", metavar="NET=PROGRAM")
    arguments = parser.parse_args()

    resource.setrlimit(resource.RLIMIT_CORE, (0, 0))
    take_usual_start()
    started = time.monotonic()
    rows = {row.name: row for row in all_rows()}
    programs = dict(variant.split("=", 1) for variant in arguments.variants)
    plugins = os.path.abspath(arguments.plugins)
    failed = 0
    for net in NEEDED_BY.keys() ^ programs.keys():
        failed += 1
        print(f"{net}: without a program, or without rows")
    tries = [(net, name, expected) for net in sorted(NEEDED_BY.keys() & programs.keys())
             for name, expected in [(CONTROL, CONTROL_IS), *NEEDED_BY[net].items()]]

    def try_out(net, name, expected):
        for _ in range(MOST_TRIES):
            seen = what_is_seen(rows[name], os.path.abspath(programs[net]), plugins)
            if seen == expected:
                break
        return seen

    with concurrent.futures.ThreadPoolExecutor(JOBS) as pool:
        for (net, name, expected), seen in zip(tries, pool.map(try_out, *zip(*tries))):
            if seen != expected:
                failed += 1
                print(f"{name} without {net}: {seen} instead of {expected}", flush=True)
    print(f"{len(tries)} rows of {len(programs)} variants in {time.monotonic() - started:.0f} s, {failed} failed")
    return 1 if failed else 0


if __name__ == "__main__":
    sys.exit(main())
