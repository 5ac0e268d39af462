# SPDX-License-Identifier: MIT
"""The matrix on a build of the program with a sanitizer: what does not apply there, and why.

The sample plug-ins are never built with one: what they do is not what is looked for.
"""
import pathlib
import re

OTHER_HEAP = "the sanitizer's heap takes the place of the one that notices this"
STACK_FOR_EACH_THREAD = "the sanitizer gives each thread a signal stack, so that the guard can speak"
TIMER_HELD_BACK = "the sanitizer keeps the timer's signal back while exit() waits for the lock"

# {sanitizer: [(kind, reason)]}; the kind may stand anywhere in a row of several.
LEFT_OUT = {
    "address": [
        ("heap_corruption", OTHER_HEAP),
        ("crash_with_heap_lock", OTHER_HEAP),
        ("thread_stack_overflow", STACK_FOR_EACH_THREAD),
    ],
    "thread": [
        ("double_free", OTHER_HEAP),
        ("heap_corruption", OTHER_HEAP),
        ("crash_with_heap_lock", OTHER_HEAP),
        ("crash_with_stdout_lock", TIMER_HELD_BACK),
        ("crash_under_destructor_lock", TIMER_HELD_BACK),
    ],
}
# Where each of them is tried all the same: it must still fail, or the list is out of date.
PLACE_OF_PROOF = "dispatch:52"

SUPPRESSIONS = pathlib.Path(__file__).resolve().with_name("tsan_suppressions.txt")
OPTIONS = {
    # Leaks are what the other tests look for. Here an instance that throws while it is being created is never
    # closed, and one that crashes neither.
    "address": ("ASAN_OPTIONS", "detect_leaks=0"),
    # A crash ends the process through exit() inside the signal handler, which is more than the sanitizer wants;
    # and it must not wait for reports there.
    "thread": ("TSAN_OPTIONS", f"report_signal_unsafe=0:atexit_sleep_ms=0:suppressions={SUPPRESSIONS}"),
}
# Faults of the plug-in that the sanitizer notices itself. It reports them, and then aborts as the C library does.
REPORTED = {"address": ["double_free"], "thread": []}
ABORTS = ("ASAN_OPTIONS", "abort_on_error=1")
REPORT = re.compile(r"(Address|Leak|Thread|UndefinedBehavior)Sanitizer|runtime error:")


def kinds_of(row):
    return (row.kind or "").split("+")


def reason_to_leave_out(row, sanitizer):
    """None for a row that applies."""
    return next((reason for kind, reason in LEFT_OUT.get(sanitizer, []) if kind in kinds_of(row)), None)


def proofs(rows, sanitizer):
    """A row of each kind that is left out."""
    names = [f"faulty/{kind}@{PLACE_OF_PROOF}" for kind, _ in LEFT_OUT.get(sanitizer, [])]
    return [row for row in rows if row.name in names]


def is_reported(row, sanitizer):
    return any(kind in kinds_of(row) for kind in REPORTED.get(sanitizer, []))


def options_for(row, environment, sanitizer):
    """The environment variables that the row needs: those that are set, and more."""
    added = {}
    wanted = [OPTIONS[sanitizer]] if sanitizer else []
    for name, options in wanted + [ABORTS] * is_reported(row, sanitizer):
        added[name] = ":".join(filter(None, [added.get(name, environment.get(name)), options]))
    return added


def unwanted_report(row, errors, sanitizer):
    """Whether standard error holds a report about the program."""
    return sanitizer is not None and not is_reported(row, sanitizer) and bool(REPORT.search(errors or ""))
