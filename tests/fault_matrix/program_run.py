# SPDX-License-Identifier: MIT
"""Runs vsttorture as a host does, and compares what is seen with what a row of the matrix demands."""
import collections
import os
import signal
import subprocess
import tempfile
import threading
import time

from rows import (ALL_STEPS, DRAWN_TEXTS, FIRST_DRAWN, LAST_DRAWN, PHASE_OF_DRAWN, STEP_TEXTS, TEXT_WITHOUT_END)
from sanitizers import add_options, unwanted_report

LIMIT_IN_SECONDS = 10
HANG_IS_SEEN_AFTER_SECONDS = 0.3
FLOOD = "x" * 127 + "\n"

# status: as subprocess has it; None for a run that was ended for its length.
Seen = collections.namedtuple("Seen", "output errors status seconds leftovers")


def take_default_signals():
    """A shell starts what it sends to the background with SIGQUIT ignored, and each run would inherit that."""
    for number in (signal.SIGQUIT, signal.SIGUSR1, signal.SIGALRM, signal.SIGXCPU, signal.SIGVTALRM):
        signal.signal(number, signal.SIG_DFL)


class Child:
    """A program in a process group of its own, and a reader of its output."""

    def __init__(self, command, folder, environment, errors):
        self.process = subprocess.Popen(command, cwd=folder, env=environment, stdin=subprocess.DEVNULL,
                                        stdout=subprocess.PIPE, stderr=errors, start_new_session=True)
        self.chunks = []
        self.reader = threading.Thread(target=self.read, daemon=True)
        self.reader.start()

    def read(self):
        for chunk in iter(lambda: self.process.stdout.read1(1 << 20), b""):
            self.chunks.append(chunk)

    def output(self):
        return b"".join(self.chunks).decode(errors="replace")

    def has_ended(self):
        """Does not reap: until then nobody else gets the group's number."""
        return os.waitid(os.P_PID, self.process.pid, os.WEXITED | os.WNOWAIT | os.WNOHANG) is not None

    def wait(self, seconds):
        """Whether the program ended in time."""
        end = time.monotonic() + seconds
        pause = 0.001
        while not self.has_ended():
            if time.monotonic() > end:
                return False
            time.sleep(pause)
            pause = min(pause * 1.5, 0.02)
        return True

    def wait_for_text(self, text, seconds):
        """Whether the program is seen to hang: it has printed so much, and then nothing happens."""
        end = time.monotonic() + seconds
        while time.monotonic() < end and len(self.output()) < len(text):
            if self.has_ended():
                return False
            time.sleep(0.005)
        return not self.wait(HANG_IS_SEEN_AFTER_SECONDS)

    def finish(self):
        """Ends what is left of the group, and gives the status of the program."""
        os.killpg(self.process.pid, signal.SIGKILL)
        self.reader.join(LIMIT_IN_SECONDS)
        status = self.process.wait()
        if not self.reader.is_alive():
            self.process.stdout.close()
        return status


def environment_of(row, home, sanitizer=None):
    """sanitizer: the one that the program is built with, "address" or "thread"."""
    environment = {"HOME": home, "TMPDIR": home, "LC_ALL": "C", "PATH": "/usr/bin:/bin"}
    for name, value in os.environ.items():
        if name.endswith("SAN_OPTIONS"):
            environment[name] = value
    add_options(environment, row, sanitizer)
    if row.kind is not None:
        environment.update(FAULT_KIND=row.kind, FAULT_PLACE=row.place, FAULT_STATUS=str(row.fault_status))
    return environment


def plugin_path(row, plugins):
    return row.plugin if row.plugin.startswith("/") else os.path.join(plugins, row.plugin + ".so")


def run_row(row, program, plugins, limit=LIMIT_IN_SECONDS, sanitizer=None):
    with tempfile.TemporaryDirectory(prefix="fault_matrix.") as home, tempfile.TemporaryFile() as errors:
        started = time.monotonic()
        environment = environment_of(row, home, sanitizer)
        child = Child([program, plugin_path(row, plugins)], home, environment, errors)
        if row.end.status is None:
            ended = not child.wait_for_text(expected_output(row), limit)
        else:
            ended = child.wait(limit)
        status = child.finish()
        seconds = time.monotonic() - started
        errors.seek(0)
        return Seen(child.output(), errors.read().decode(errors="replace"), status if ended else None, seconds,
                    os.listdir(home))


def expected_output(row):
    """For ends in a step before those that are drawn."""
    if row.end.steps == 0:
        return row.end.tail
    lines = [f"total, {row.end.total}"]
    lines += [f"{number}, {text}" for number, text in enumerate(STEP_TEXTS[:row.end.steps], 1)]
    return "".join(line + "\n" for line in lines) + row.end.tail


def steps_and_tail(output, total):
    """Splits an output into its step texts and what follows them; steps are only counted in their order."""
    head = f"total, {total}\n"
    if not output.startswith(head):
        return [], output
    texts, rest = [], output[len(head):]
    while "\n" in rest and len(texts) < ALL_STEPS:
        line, after = rest.split("\n", 1)
        known = STEP_TEXTS[len(texts):len(texts) + 1] or DRAWN_TEXTS
        text = next((text for text in known if line == f"{len(texts) + 1}, {text}"), None)
        if text is None:
            break
        texts.append(text)
        rest = after
    return texts, rest


def expected_steps(row, texts):
    """The number of steps that must stand; texts are those that do."""
    if row.end.steps != FIRST_DRAWN:
        return row.end.steps
    drawn = texts[len(STEP_TEXTS):]
    return len(STEP_TEXTS) + drawn.index("inspect latency") + 1 if "inspect latency" in drawn else ALL_STEPS


def without_noise(row, output):
    """Takes out what the plug-in itself printed. None when that is not there."""
    kinds = (row.kind or "").split("+")
    if "flood_stdout" in kinds:
        if output.count(FLOOD) < 65536:
            return None
        output = output.replace(FLOOD, "")
    if "print" in kinds or "print_when_unloaded" in kinds:
        if output.count(TEXT_WITHOUT_END) != 1:
            return None
        output = output.replace(TEXT_WITHOUT_END, "")
    return output


def differences(row, seen, judge, sanitizer=None):
    """What is seen and should not be, in words; empty for a row that holds."""
    found = []
    output = without_noise(row, seen.output)
    if output is None:
        return [f"what the plug-in prints is missing: {seen.output[-200:]!r}"]
    texts, tail = steps_and_tail(output, row.end.total)
    steps = expected_steps(row, texts)
    expected_tail = row.end.tail
    if LAST_DRAWN in expected_tail and texts:
        expected_tail = expected_tail.replace(LAST_DRAWN, PHASE_OF_DRAWN.get(texts[-1], ""))
    if len(texts) != steps:
        found.append(f"{len(texts)} steps instead of {steps}")
    if tail != expected_tail:
        found.append(f"{tail[-200:]!r} behind them instead of {expected_tail!r}")
    if seen.status != row.end.status:
        found.append(f"status {seen.status} instead of {row.end.status}")
    if row.end.errors is not None and seen.errors != row.end.errors:
        found.append(f"standard error {seen.errors[-200:]!r} instead of {row.end.errors!r}")
    if unwanted_report(row, seen.errors, sanitizer):
        found.append(f"a report of the sanitizer: {seen.errors[:2000]!r}")
    if seen.leftovers:
        found.append(f"files left: {seen.leftovers}")
    verdict, expected_verdict = judge(seen.output, seen.status), row.end.verdict.format(steps)
    if verdict != expected_verdict:
        found.append(f"verdict {verdict!r} instead of {expected_verdict!r}")
    return found
