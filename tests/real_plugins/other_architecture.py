# SPDX-License-Identifier: MIT
"""Gives the program a real plug-in of the other architecture and demands the failure that a host can read.

    other_architecture.py --program PROGRAM --architecture i386 --other x86_64 FOLDER...

The plug-ins are the shared objects right in the folders, at least one. Each must end with
"!create and initialize failed -1", status 3 and one line on standard error that names both architectures.
Exits with 77 when the program or the folders are not there, or with 1 with VSTTORTURE_REAL_PLUGINS=required.
"""
import argparse
import os
import pathlib
import sys

sys.path.insert(0, str(pathlib.Path(__file__).resolve().parents[1] / "shared"))
from program_run import run_program  # noqa: E402

NOTHING_TO_RUN = 77
TIME_LIMIT_IN_SECONDS = 120


def fault(program, path, architectures):
    """What is wrong with the end of a run, None for nothing."""
    seen = run_program([program, path], TIME_LIMIT_IN_SECONDS)
    errors = f"vsttorture: {path} is for {architectures[1]}, this program is for {architectures[0]}\n"
    expected = ("!create and initialize failed -1\n", errors, 3)
    return None if (seen.output, seen.errors, seen.status) == expected else f"{path}: {seen}"


def main():
    parser = argparse.ArgumentParser(description=__doc__, formatter_class=argparse.RawDescriptionHelpFormatter)
    parser.add_argument("--program", required=True)
    parser.add_argument("--architecture", required=True, help="of the program")
    parser.add_argument("--other", required=True, help="of the plug-ins")
    parser.add_argument("folders", nargs="+", metavar="FOLDER")
    arguments = parser.parse_args()

    modules = sorted(str(path.resolve())
                     for folder in arguments.folders for path in pathlib.Path(folder).glob("*.so"))
    if not modules or not os.path.exists(arguments.program):
        print(f"left out: there is no {'plug-in' if not modules else arguments.program}")
        return 1 if os.environ.get("VSTTORTURE_REAL_PLUGINS") == "required" else NOTHING_TO_RUN
    program = os.path.abspath(arguments.program)
    architectures = (arguments.architecture, arguments.other)
    faults = [found for path in modules if (found := fault(program, path, architectures))]
    print("\n".join([*faults, f"{len(modules)} plug-ins of {arguments.other}, {len(faults)} faults"]))
    return 1 if faults else 0


if __name__ == "__main__":
    sys.exit(main())
