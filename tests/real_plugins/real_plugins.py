# SPDX-License-Identifier: MIT
"""Runs vsttorture over every plug-in of some Debian packages and demands the verdict that expectations.tsv names.

    real_plugins.py --program build/release/vsttorture [--jobs 2] [--table] [--required] [PACKAGE...]
    real_plugins.py --program build/x86/vsttorture --root build/i386_plugins [...]

The modules come from the package manager and must be exactly those of the table. A run has no display and a home of
its own. A verdict of "passed" also demands that nothing but the lines of the run was printed. Prints a line for each
deviation, then a summary; --table prints package, module, verdict and seconds of each run. A package that is not
installed is left out with a message, or is a failure with --required (or VSTTORTURE_REAL_PLUGINS=required in the
environment). Exits with 77 when there was nothing to run.

With --root the modules are those of the i386 packages that fetch_i386.py has unpacked there, with the libraries
beside them. What the archive did not have (ROOT/missing) is left out with a message, and with it the modules that lack
a library: no failure, as long as something was run. The five modules that need no library are never left out.
"""
import argparse
import concurrent.futures
import csv
import os
import pathlib
import re
import subprocess
import sys
import time

sys.path.insert(0, str(pathlib.Path(__file__).resolve().parents[1] / "shared"))
from program_run import as_printed, run_program, try_plugin  # noqa: E402

NOTHING_TO_RUN = 77
TIME_LIMIT_IN_SECONDS = 120
NEED_NO_LIBRARY = {"dpf-plugins-vst": {"Kars-vst.so", "MaBitcrush-vst.so", "MaFreeverb-vst.so", "MaGigaverb-vst.so",
                                       "MaPitchshift-vst.so"}}
FOLDERS = re.compile(r"(?P<folder>/usr/lib/vst|/usr/lib/lxvst|/usr/lib/[^/]+/iem-plugin-suite/vst)/(?P<module>.+)")


def expected_verdicts(architecture):
    """{package: {module: verdict}} of the table beside this file."""
    verdicts = {}
    with open(pathlib.Path(__file__).with_name("expectations.tsv"), newline="") as table:
        for row in csv.DictReader(table, delimiter="\t"):
            verdicts.setdefault(row["package"], {})[row["module"]] = row[architecture]
    return verdicts


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


class InstalledPackages:
    """The packages of this machine."""
    architecture, environment, missing = "amd64", {}, ()

    def modules(self, package):
        """{module: path} of a package, None for one that is not installed."""
        try:
            listed = subprocess.run(["dpkg", "-L", package], capture_output=True, text=True)
        except FileNotFoundError:
            return None
        return modules_among(listed.stdout.splitlines()) if listed.returncode == 0 else None


class UnpackedPackages:
    """What fetch_i386.py has left in a folder."""
    architecture = "i386"

    def __init__(self, root):
        self.root = os.path.realpath(root)
        missing = pathlib.Path(self.root, "missing")
        self.missing = missing.read_text().split() if missing.exists() else []
        folders = [f"{self.root}/libraries/{folder}/i386-linux-gnu" for folder in ("usr/lib", "lib")]
        self.environment = {"LD_LIBRARY_PATH": ":".join(folders)}

    def modules(self, package):
        """{module: path} of a package, None for one that is not there."""
        folder = f"{self.root}/{package}"
        if not os.path.isdir(folder):
            return None
        return modules_among([f"{at}/{name}" for at, _, names in os.walk(folder) for name in names], folder)


def verdict_on(seen):
    verdict = try_plugin.judge(seen.output, seen.status)
    is_clean = seen.output == as_printed(*try_plugin.read_steps(seen.output))
    return verdict if is_clean or verdict != "passed" else "passed, with text of its own"


class Checker:
    """Runs packages and counts what came out."""

    def __init__(self, program, packages, jobs, table):
        self.program = os.path.abspath(program)
        self.packages = packages
        self.pool = concurrent.futures.ThreadPoolExecutor(jobs)
        self.table = table
        self.run_count = 0
        self.deviation_count = 0

    def run(self, path):
        return run_program([self.program, path], TIME_LIMIT_IN_SECONDS, self.packages.environment)

    def deviation(self, name, expected, seen):
        print(f"{name}: expected {expected}; seen {seen}")
        self.deviation_count += 1

    def check(self, package, expected, modules):
        for module in sorted(expected.keys() - modules.keys()):
            self.deviation(f"{package} {module}", "a module", "none")
        for module in sorted(modules.keys() - expected.keys()):
            self.deviation(f"{package} {module}", "no such module", modules[module])

        present = sorted(expected.keys() & modules.keys())
        for module, seen in zip(present, self.pool.map(lambda module: self.run(modules[module]), present)):
            verdict = verdict_on(seen)
            may_lack_a_library = self.packages.missing and module not in NEED_NO_LIBRARY.get(package, ())
            if may_lack_a_library and "cannot open shared object file" in seen.errors and verdict != expected[module]:
                print(f"left out: {package} {module}, {seen.errors.strip()}")
                continue
            self.run_count += 1
            if self.table:
                print(f"{package}\t{module}\t{verdict}\t{seen.seconds:.2f}", flush=True)
            if verdict != expected[module]:
                self.deviation(f"{package} {module}", expected[module], verdict)
                print("".join(f"    {line}\n" for line in seen.errors.splitlines()[-10:]), end="", flush=True)


def main():
    parser = argparse.ArgumentParser(description=__doc__, formatter_class=argparse.RawDescriptionHelpFormatter)
    parser.add_argument("--program", required=True, help="the vsttorture to run")
    parser.add_argument("--jobs", type=int, default=2, help="runs at a time")
    parser.add_argument("--table", action="store_true", help="print a line for each run")
    parser.add_argument("--required", action="store_true", help="let a missing package be a failure",
                        default=os.environ.get("VSTTORTURE_REAL_PLUGINS") == "required")
    parser.add_argument("--root", help="the folder that fetch_i386.py has filled")
    parser.add_argument("names", nargs="*", metavar="PACKAGE")
    arguments = parser.parse_args()

    started = time.monotonic()
    packages = UnpackedPackages(arguments.root) if arguments.root else InstalledPackages()
    verdicts = expected_verdicts(packages.architecture)
    checker = Checker(arguments.program, packages, arguments.jobs, arguments.table)
    for package in arguments.names or verdicts:
        modules = packages.modules(package)
        if modules is not None:
            checker.check(package, verdicts[package], modules)
        elif package in packages.missing and not (arguments.required and package in NEED_NO_LIBRARY):
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
