# SPDX-License-Identifier: MIT
"""Runs vsttorture as the example of docs/examples does, in a home of its own. For all tests written in Python."""
import collections
import concurrent.futures
import multiprocessing
import os
import pathlib
import resource
import signal
import sys
import tempfile
import time

sys.path.insert(0, str(pathlib.Path(__file__).resolve().parents[2] / "docs" / "examples"))
import try_plugin  # noqa: E402

USUAL_STACK_IN_BYTES = 8 << 20

# status: negative for a signal, None for a run that was ended for its length. leftovers: files in its folder.
Seen = collections.namedtuple("Seen", "output errors status seconds leftovers")


def take_usual_start():
    """What each run would inherit. A shell starts what it sends to the background with SIGQUIT ignored. Without a limit of
    the stack, one that overflows takes all memory before it crashes."""
    for number in (signal.SIGQUIT, signal.SIGUSR1, signal.SIGALRM, signal.SIGXCPU, signal.SIGVTALRM):
        signal.signal(number, signal.SIG_DFL)
    _, most = resource.getrlimit(resource.RLIMIT_STACK)
    size = USUAL_STACK_IN_BYTES if most == resource.RLIM_INFINITY else min(most, USUAL_STACK_IN_BYTES)
    resource.setrlimit(resource.RLIMIT_STACK, (size, most))


def run_program(command, limit, environment=()):
    """One run, with nothing in its environment but a fresh home, the C locale, a short PATH and what is given."""
    with tempfile.TemporaryDirectory(prefix="run.", ignore_cleanup_errors=True) as home, \
         tempfile.TemporaryFile() as errors:
        surroundings = {"HOME": home, "TMPDIR": home, "LC_ALL": "C", "PATH": "/usr/bin:/bin", **dict(environment)}
        started = time.monotonic()
        output, status = try_plugin.run(command, limit, cwd=home, env=surroundings, stderr=errors)
        seconds = time.monotonic() - started
        errors.seek(0)
        return Seen(output, errors.read().decode(errors="replace"), status, seconds, os.listdir(home))


def as_printed(total, texts):
    """What a run prints that gets as far. The arguments are those that try_plugin.read_steps() gives."""
    head = "" if total is None else f"total, {total}\n"
    return head + "".join(f"{number}, {text}\n" for number, text in enumerate(texts, 1))


def in_processes(function, items, threads):
    """Yields the results of function(item), in the order of the items.

    The interpreter runs one thread at a time, so each processor gets a process of its own with its share of the threads.
    """
    context = multiprocessing.get_context("fork")  # The function may be a local one.
    count = len(os.sched_getaffinity(0))

    def work(part, pipe):
        with concurrent.futures.ThreadPoolExecutor(max(1, threads // count)) as pool:
            for result in pool.map(function, items[part::count]):
                pipe.send(result)

    receivers = []
    for part in range(count):
        receiver, sender = context.Pipe(duplex=False)
        context.Process(target=work, args=(part, sender)).start()
        sender.close()
        receivers.append(receiver)
    for number in range(len(items)):
        yield receivers[number % count].recv()
