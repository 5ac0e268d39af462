# SPDX-License-Identifier: MIT
"""The matrix on a build of the program with a sanitizer: what does not apply there, and why.

The sample plug-ins are never built with one: what they do is not what is looked for.
"""
import pathlib
import re

OTHER_HEAP = "the sanitizer's heap takes the place of the one that notices this"
STACK_FOR_EACH_THREAD = "the sanitizer gives each thread a signal stack, so that the guard can speak"
HIDDEN_THROW = ("the sanitizer does not see throws of a hidden runtime; whether it takes the frames that they leave for live"
                " ones depends on where the compiler puts these")
TIMER_HELD_BACK = "the sanitizer keeps the timer's signal back while exit() waits for the lock"

# {sanitizer: [(regular expression for names of rows, reason, proof)]}. The proof is one of these rows. It is run all
# the same and must still fail, or the list is out of date. None: the rows fail in some builds only.
LEFT_OUT = {
    "address": [
        ("heap_corruption", OTHER_HEAP, "faulty/heap_corruption@dispatch:52"),
        ("crash_with_heap_lock", OTHER_HEAP, "faulty/crash_with_heap_lock@dispatch:52"),
        ("thread_stack_overflow", STACK_FOR_EACH_THREAD, "faulty/thread_stack_overflow@dispatch:52"),
        ("^faulty_own_runtime/throw_", HIDDEN_THROW, None),
    ],
    "thread": [
        ("double_free", OTHER_HEAP, "faulty/double_free@dispatch:52"),
        ("heap_corruption", OTHER_HEAP, "faulty/heap_corruption@dispatch:52"),
        ("crash_with_heap_lock", OTHER_HEAP, "faulty/crash_with_heap_lock@dispatch:52"),
        ("crash_with_stdout_lock", TIMER_HELD_BACK, "faulty/crash_with_stdout_lock@dispatch:52"),
        ("crash_under_destructor_lock", TIMER_HELD_BACK, "faulty/crash_under_destructor_lock@dispatch:52"),
    ],
}

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
    return next((reason for names, reason, _ in LEFT_OUT.get(sanitizer, []) if re.search(names, row.name)), None)


def proofs(rows, sanitizer):
    """The rows that show that what is left out must be."""
    names = [proof for _, _, proof in LEFT_OUT.get(sanitizer, [])]
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
