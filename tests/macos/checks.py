# SPDX-License-Identifier: MIT
"""What the checks of the macOS sources share: running commands and one line of result for each check."""

import os
import subprocess
from pathlib import Path

ROOT = Path(__file__).resolve().parents[2]
BUILD = ROOT / "build" / "macos_check"

failures = []


def run(command, **options):
    """Runs a command (a list, or a shell line) without LIBRARY_PATH, which the linker would obey. Standard error
    goes into the output unless asked for apart."""
    environment = {name: value for name, value in os.environ.items() if name != "LIBRARY_PATH"}
    options.setdefault("stderr", subprocess.STDOUT)
    return subprocess.run(command, shell=isinstance(command, str), stdout=subprocess.PIPE, text=True,
                          errors="replace", env=environment, timeout=1800, check=False, **options)


def report(name, passed, details=""):
    """Prints the line of one check; the details of one that failed follow it."""
    print(f"{'ok  ' if passed else 'FAIL'}  {name}", flush=True)
    if not passed:
        failures.append(name)
        print("\n".join("      " + line for line in details.strip().splitlines()[-40:]), flush=True)
    return passed


def doctored(path, before, after):
    """The text of a source of the program with a fault put in. An edit that no longer finds its place fails
    loudly: the control would prove nothing."""
    text = (ROOT / path).read_text()
    if text.count(before) != 1:
        raise SystemExit(f"FAIL  {path} does not hold {before!r} once; mend the control")
    return text.replace(before, after)


def verdict():
    """The exit status of the program."""
    return 1 if failures else 0
