# SPDX-License-Identifier: MIT
"""Runs vsttorture over every plug-in of some Debian packages and demands the end that expectations.tsv names.

    real_plugins.py --program build/release/vsttorture [--jobs 2] [--table] [--required] [PACKAGE...]
    real_plugins.py --program build/x86/vsttorture --root build/i386_plugins [...]

The modules come from the package manager and must be exactly those of the table. Each run has a fresh HOME,
no display, the C locale and pipes for its output. A line is printed for each deviation, then a summary; --table
prints package, module, end and seconds of each run. A package that is not installed is left out and said so, or
is a failure with --required (or VSTTORTURE_REAL_PLUGINS=required in the environment). Exits with 77 when
nothing was there to run.

With --root the modules are those of the i386 packages that fetch_i386.py has unpacked there, with the libraries
beside them, and the table is expectations_i386.tsv. What the archive did not have (ROOT/missing) is left out
and said so, and with it the modules that lack a library: no failure, as long as something was run. The five
modules that need no library are never left out.
"""
import argparse
import concurrent.futures
import csv
import os
import pathlib
import re
import signal
import subprocess
import sys
import tempfile
import time

from run_end import run_end

NOTHING_TO_RUN = 77
TIME_LIMIT_IN_SECONDS = 120
NEED_NO_LIBRARY = {"dpf-plugins-vst": {"Kars-vst.so", "MaBitcrush-vst.so", "MaFreeverb-vst.so", "MaGigaverb-vst.so",
                                       "MaPitchshift-vst.so"}}
FOLDERS = re.compile(r"(?P<folder>/usr/lib/vst|/usr/lib/lxvst|/usr/lib/[^/]+/iem-plugin-suite/vst)/(?P<module>.+)")


def expected_ends(name="expectations.tsv"):
    """{package: {module: end}} of a table beside this file."""
    ends = {}
    with open(pathlib.Path(__file__).with_name(name), newline="") as table:
        for row in csv.DictReader(table, delimiter="\t"):
            ends.setdefault(row["package"], {})[row["module"]] = row["end"]
    return ends


def exports_entry_point(path):
    symbols = subprocess.run(["nm", "-D", "--defined-only", path], stdout=subprocess.PIPE, text=True, check=True)
    return re.search(r" T (VSTPluginMain|main)$", symbols.stdout, re.MULTILINE) is not None


def modules_among(paths, root=""):
    """{module: path} of the files of a package that lies below root.

    A module is a shared object that exports an entry point; libraries that modules share do not. It is named by
    its path below the folder of its kind. A folder X.vst stands for the shared object in it; a file that is
    reached through links as well counts once.
    """
    modules = {}
    for path in paths:
        match = FOLDERS.fullmatch(path[len(root):])
        if match and path.endswith(".so") and os.path.realpath(path) == path and exports_entry_point(path):
            module = re.sub(r"(\.vst)/.*", r"\1", match["module"])
            modules[module] = f"{root}{match['folder']}/{module}"
    return modules


def installed_modules(package):
    """{module: path} of an installed package, None for a package that is not installed."""
    try:
        listed = subprocess.run(["dpkg", "-L", package], capture_output=True, text=True)
    except FileNotFoundError:
        return None
    return modules_among(listed.stdout.splitlines()) if listed.returncode == 0 else None


class UnpackedPackages:
    """What fetch_i386.py has left in a folder."""

    def __init__(self, root):
        self.root = os.path.realpath(root)
        missing = pathlib.Path(self.root, "missing")
        self.missing = missing.read_text().split() if missing.exists() else []
        libraries = f"{self.root}/libraries"
        self.library_path = f"{libraries}/usr/lib/i386-linux-gnu:{libraries}/lib/i386-linux-gnu"

    def modules(self, package):
        """{module: path} of an unpacked package, None for one that is not there."""
        folder = f"{self.root}/{package}"
        if not os.path.isdir(folder):
            return None
        return modules_among([f"{at}/{name}" for at, _, names in os.walk(folder) for name in names], folder)


def run_program(program, path, library_path=None):
    """One run: its standard output and standard error, its status (None when it was stopped), its seconds."""
    started = time.monotonic()
    libraries = {"LD_LIBRARY_PATH": library_path} if library_path else {}
    with tempfile.TemporaryDirectory(prefix="real_plugins.", ignore_cleanup_errors=True) as home:
        process = subprocess.Popen(
            [program, path], cwd=home, env={"HOME": home, "LC_ALL": "C", "PATH": "/usr/bin:/bin", **libraries},
            stdin=subprocess.DEVNULL, stdout=subprocess.PIPE, stderr=subprocess.PIPE, start_new_session=True)
        try:
            output, errors = process.communicate(timeout=TIME_LIMIT_IN_SECONDS)
            status = process.returncode
        except subprocess.TimeoutExpired:
            os.killpg(process.pid, signal.SIGKILL)
            output, errors = process.communicate()
            status = None
    seconds = time.monotonic() - started
    return output.decode(errors="replace"), errors.decode(errors="replace"), status, seconds


def run(program, path, library_path=None):
    """One run: its end, what it said on standard error, how many seconds it took."""
    output, errors, status, seconds = run_program(program, path, library_path)
    return run_end(output, status), errors, seconds


class Checker:
    """Runs packages and counts what came out."""

    def __init__(self, program, jobs, table, library_path=None, missing=()):
        self.library_path = library_path
        self.missing = missing
        self.program = os.path.abspath(program)
        self.pool = concurrent.futures.ThreadPoolExecutor(jobs)
        self.table = table
        self.run_count = 0
        self.deviation_count = 0

    def deviation(self, name, expected, seen):
        print(f"{name}: expected {expected}; seen {seen}")
        self.deviation_count += 1

    def check(self, package, expected, modules):
        for module in sorted(expected.keys() - modules.keys()):
            self.deviation(f"{package} {module}", "a module", "none")
        for module in sorted(modules.keys() - expected.keys()):
            self.deviation(f"{package} {module}", "no such module", modules[module])

        present = sorted(expected.keys() & modules.keys())
        runs = self.pool.map(lambda module: run(self.program, modules[module], self.library_path), present)
        for module, (end, errors, seconds) in zip(present, runs):
            may_lack_a_library = self.missing and module not in NEED_NO_LIBRARY.get(package, ())
            if may_lack_a_library and "cannot open shared object file" in errors and end != expected[module]:
                print(f"left out: {package} {module}, {errors.strip()}")
                continue
            self.run_count += 1
            if self.table:
                print(f"{package}\t{module}\t{end}\t{seconds:.2f}", flush=True)
            if end != expected[module]:
                self.deviation(f"{package} {module}", expected[module], end)
                print("".join(f"    {line}\n" for line in errors.splitlines()[-10:]), end="", flush=True)


def main():
    parser = argparse.ArgumentParser(description=__doc__, formatter_class=argparse.RawDescriptionHelpFormatter)
    parser.add_argument("--program", required=True, help="the vsttorture to run")
    parser.add_argument("--jobs", type=int, default=2, help="runs at a time")
    parser.add_argument("--table", action="store_true", help="print a line for each run")
    parser.add_argument("--required", action="store_true", help="let a missing package be a failure",
                        default=os.environ.get("VSTTORTURE_REAL_PLUGINS") == "required")
    parser.add_argument("--root", help="the folder that fetch_i386.py has filled")
    parser.add_argument("packages", nargs="*", metavar="PACKAGE")
    arguments = parser.parse_args()

    started = time.monotonic()
    if arguments.root:
        unpacked = UnpackedPackages(arguments.root)
        ends, modules_of = expected_ends("expectations_i386.tsv"), unpacked.modules
        checker = Checker(arguments.program, arguments.jobs, arguments.table, unpacked.library_path,
                          unpacked.missing)
    else:
        ends, modules_of = expected_ends(), installed_modules
        checker = Checker(arguments.program, arguments.jobs, arguments.table)
    for package in arguments.packages or ends:
        modules = modules_of(package)
        if modules is not None:
            checker.check(package, ends[package], modules)
        elif package in checker.missing and not (arguments.required and package in NEED_NO_LIBRARY):
            print(f"left out: {package} could not be fetched")
        elif arguments.required:
            checker.deviation(package, "an installed package", "none")
        else:
            print(f"left out: {package} is not installed")

    print(f"{checker.run_count} plug-ins run in {time.monotonic() - started:.0f} s, "
          f"{checker.deviation_count} deviations")
    if checker.deviation_count:
        return 1
    return 0 if checker.run_count else NOTHING_TO_RUN


if __name__ == "__main__":
    sys.exit(main())
