#!/usr/bin/env python3
# SPDX-License-Identifier: MIT
"""Tries out a plug-in with vsttorture, as a host does, and prints one verdict:

    try_plugin.py [--limit SECONDS] VSTTORTURE BUNDLE [CHILD_ID]

Exits with 0 for "passed" and "shell", 1 for any other verdict, 2 for wrong arguments, 3 when VSTTORTURE cannot be
started. What the verdicts mean: PROTOCOL.md.
"""
import argparse
import os
import re
import select
import signal
import subprocess
import sys
import time

TESTS = ["inspect class info", "inspect preset info", "inspect parameter info", "testing setting states",
         "inspect latency", "inspect stream format"]
FIXED_STEPS = ["test gathering info", *TESTS, *reversed(TESTS), "initialize", "test gathering info"]
DRAWN_STEPS = TESTS[:5]
LAST_STEP = 65
FAILURE = re.compile(r"!.* failed( -?\d+|, unknown error)$", re.MULTILINE)
LAST_WORDS = "unexpected exit"
MOST_IN_A_PIPE = 1 << 20


def has_ended(child):
    """Does not reap the child: until then its number, which is its group's too, belongs to nobody else."""
    return os.waitid(os.P_PID, child.pid, os.WEXITED | os.WNOWAIT | os.WNOHANG) is not None


def read_some(pipe, seconds):
    """What can be read within so many seconds; None for nothing yet, b"" at the end of the pipe."""
    return os.read(pipe, 65536) if select.select([pipe], [], [], seconds)[0] else None


def run(command, limit, **options):
    """What the program printed, and its status: negative for a signal, None when the limit had to end it.

    options: of subprocess.Popen. Throws OSError when the program cannot be started.
    """
    with subprocess.Popen(command, stdin=subprocess.DEVNULL, stdout=subprocess.PIPE, start_new_session=True,
                          **options) as child:
        pipe, chunks, end = child.stdout.fileno(), [None], time.monotonic() + limit
        while not (ended := has_ended(child)) and time.monotonic() < end:
            if chunks[-1] != b"":
                chunks.append(read_some(pipe, 0.01))
            time.sleep(0.001)  # Lets many small writes come together. After the end of the pipe, just waits.
        os.killpg(child.pid, signal.SIGKILL)  # With what the plug-in has left behind.
        status = child.wait()
        # All that the program printed is in the pipe by now. A process with a session of its own may still hold
        # the pipe, and even write to it, so do not wait for the end.
        rest = b""
        while len(rest) < MOST_IN_A_PIPE and (chunk := read_some(pipe, 0)):
            rest += chunk
        output = b"".join(filter(None, chunks)) + rest
        return output.decode(errors="replace"), status if ended else None


def read_steps(output):
    """The announced total, None without one, and the texts of the steps that stand in their order.

    Text of the plug-in's own between the lines, or in front of one, is passed over.
    """
    total, texts = None, []
    for line in [line for line in output.split("\n") if ", " in line]:
        if total is None:
            match = re.search(r"total, (64|51)$", line)
            total = match and int(match[1])
        elif len(texts) < LAST_STEP:
            due = FIXED_STEPS[len(texts):len(texts) + 1] or DRAWN_STEPS
            texts += [text for text in due if line.endswith(f"{len(texts) + 1}, {text}")]
    return total, texts


def judge(output, status):
    """The verdict on a run."""
    total, texts = read_steps(output)
    step = len(texts)
    if status is None:
        return f"timed out at {step}"
    if status < 0:
        return f"killed by signal {-status} at {step}"
    if status == 7:
        return f"crashed at {step}"
    if status == 5 and output == "":
        return "refused"
    if LAST_WORDS in output:  # Text of the plug-in's own may follow them.
        return f"exited at {step} with {status}"
    if status == 3 and FAILURE.search(output):
        return "not loadable" if output == "!create and initialize failed -1\n" else f"failed at {step}"
    if (status, total, step) in [(0, 64, LAST_STEP), (1, 51, 1)]:
        return "passed" if status == 0 else "shell"
    return f"exited at {step} with {status}"


def main():
    parser = argparse.ArgumentParser(description=__doc__, formatter_class=argparse.RawDescriptionHelpFormatter)
    parser.add_argument("--limit", type=float, default=60, help="seconds that a run may take")
    parser.add_argument("program", metavar="VSTTORTURE")
    parser.add_argument("bundle", metavar="BUNDLE")
    parser.add_argument("child_id", metavar="CHILD_ID", nargs="?")
    arguments = parser.parse_args()
    command = [arguments.program, arguments.bundle] + ([arguments.child_id] if arguments.child_id else [])
    try:
        verdict = judge(*run(command, arguments.limit))
    except OSError as error:
        print(f"cannot start {arguments.program}: {error.strerror}", file=sys.stderr)
        return 3
    print(verdict)
    return 0 if verdict in ("passed", "shell") else 1


if __name__ == "__main__":
    sys.exit(main())
