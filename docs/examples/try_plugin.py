#!/usr/bin/env python3
# SPDX-License-Identifier: MIT
"""Tries out a plug-in with vsttorture, as a host does, and prints one verdict:

    try_plugin.py [--limit SECONDS] VSTTORTURE BUNDLE [CHILD_ID]

Exits with 0 for "passed" and "shell", with 1 for any other verdict.
"""
import argparse
import os
import re
import signal
import subprocess
import sys
import threading

TESTS = ["inspect class info", "inspect preset info", "inspect parameter info", "testing setting states",
         "inspect latency", "inspect stream format"]
FIXED_STEPS = ["test gathering info", *TESTS, *reversed(TESTS), "initialize", "test gathering info"]
LAST_STEP = 65
FAILURE = re.compile(r"!.* failed( -?\d+|, unknown error)$", re.MULTILINE)
LAST_WORDS = "unexpected exit"


def run(command, limit):
    """What the program printed, and its status: negative for a signal, None when the limit had to end it."""
    child = subprocess.Popen(command, stdin=subprocess.DEVNULL, stdout=subprocess.PIPE, start_new_session=True)
    chunks = []
    reader = threading.Thread(target=lambda: chunks.extend(iter(lambda: child.stdout.read1(65536), b"")))
    reader.start()
    out_of_time = threading.Event()
    timer = threading.Timer(limit, lambda: (out_of_time.set(), os.killpg(child.pid, signal.SIGKILL)))
    timer.start()
    os.waitid(os.P_PID, child.pid, os.WEXITED | os.WNOWAIT)  # Ended, but not reaped: its group is still its own.
    timer.cancel()
    timer.join()
    os.killpg(child.pid, signal.SIGKILL)  # What the plug-in left behind; it may hold the pipe open.
    reader.join(1)
    status = child.wait()
    return b"".join(chunks).decode(errors="replace"), None if out_of_time.is_set() else status


def judge(output, status):
    """The verdict. Text of the plug-in's own between the lines, or in front of one, does no harm."""
    total, step = None, 0
    for line in output.split("\n"):
        expected = FIXED_STEPS[step:step + 1] or TESTS[:5]
        if total is None:
            match = re.search(r"total, (64|51)$", line)
            total = match and int(match[1])
        elif step < LAST_STEP and line.endswith(tuple(f"{step + 1}, {text}" for text in expected)):
            step += 1
    if status is None:
        return f"timed out at {step}"
    if status < 0:
        return f"killed by signal {-status}"
    if status == 7:
        return f"crashed at {step}"
    if status == 5 and output == "":
        return "refused"
    if LAST_WORDS in output:  # Maybe with a text of the plug-in's behind them.
        return f"exited at {step} with {status}"
    if status == 3 and FAILURE.search(output):
        return "not loadable" if output == "!create and initialize failed -1\n" else f"failed at {step}"
    if (status, total, step) in [(0, 64, LAST_STEP), (1, 51, 1)]:
        return "passed" if status == 0 else "shell"
    return f"exited at {step} with {status}"


if __name__ == "__main__":
    parser = argparse.ArgumentParser(description=__doc__, formatter_class=argparse.RawDescriptionHelpFormatter)
    parser.add_argument("--limit", type=float, default=60, help="seconds a run may take")
    parser.add_argument("command", nargs="+", metavar="VSTTORTURE BUNDLE CHILD_ID")
    arguments = parser.parse_args()
    verdict = judge(*run(arguments.command, arguments.limit))
    print(verdict)
    sys.exit(0 if verdict in ("passed", "shell") else 1)
