# SPDX-License-Identifier: MIT
"""How one run of vsttorture ended, in a few words, told from what it printed and its exit status.

A run that went through is "passes"; any other end names the last step that was printed, what followed it,
and how the process ended: "step 5, unexpected exit, status 7".
"""
import signal

TESTS = [
    "inspect class info",
    "inspect preset info",
    "inspect parameter info",
    "testing setting states",
    "inspect latency",
    "inspect stream format",
]
FIXED_STEPS = ["test gathering info", *TESTS, *reversed(TESTS), "initialize", "test gathering info"]
RANDOM_TESTS = TESTS[:5]
STEP_COUNT = 65


def is_step_line(line, number):
    """Whether the line announces this step of an ordinary plug-in; steps after the fixed ones vary by run."""
    texts = FIXED_STEPS[number - 1 : number] or RANDOM_TESTS
    return line in [f"{number}, {text}" for text in texts]


def process_end(status):
    """status as subprocess has it: negative for a signal; None for a run that was stopped for its length."""
    if status is None:
        return "out of time"
    return f"status {status}" if status >= 0 else f"killed by {signal.Signals(-status).name}"


def run_end(output, status):
    """The end of a run that printed output (text) and ended with status."""
    lines = output.split("\n")
    if lines[0] != "total, 64":
        return ", ".join(["no total", *filter(None, lines), process_end(status)])
    step = 0
    while step < STEP_COUNT and step + 1 < len(lines) and is_step_line(lines[step + 1], step + 1):
        step += 1
    rest = lines[step + 1 :]
    if step == STEP_COUNT and rest == [""] and status == 0:
        return "passes"
    return ", ".join([f"step {step}", *filter(None, rest), process_end(status)])
