# SPDX-License-Identifier: MIT
"""Runs vsttorture-scan with --expect over every plug-in of seven Debian packages.

    scan_real_plugins.py --scan build/release/vsttorture-scan
    scan_real_plugins.py --scan build/release/vsttorture-scan --architecture i386
        --i386-root build/i386_plugins --i386-workers build/x86

The expectations are those of expectations_amd64.tsv, or expectations_i386.tsv for the packages that fetch_i386.py has
unpacked below --i386-root, with their libraries in its folder "libraries". The modules must be exactly those of the
list, and one that passes must have printed nothing on standard output. A package that is not there is left out and
said so, or is a failure with VSTTORTURE_REAL_PLUGINS=required in the environment. The file "missing" in that root names
the packages that could not be had: neither their absence nor that of a library is a failure then. The five modules that
need no library are never left out. Exits with 77 when nothing was there to run.
"""
import argparse
import json
import os
import pathlib
import subprocess
import sys
import tempfile

NOTHING_TO_RUN = 77
HERE = pathlib.Path(__file__).resolve().parent
NEED_NO_LIBRARY = {"dpf-plugins-vst": {"Kars-vst.so", "MaBitcrush-vst.so", "MaFreeverb-vst.so", "MaGigaverb-vst.so",
                                       "MaPitchshift-vst.so"}}
PLACES = ["/usr/lib/vst", "/usr/lib/lxvst", "/usr/lib/x86_64-linux-gnu/iem-plugin-suite/vst"]


def rows_by_package(architecture):
    """{package: [row, ...]} of the list of one architecture."""
    rows = {}
    for line in (HERE / f"expectations_{architecture}.tsv").read_text().splitlines():
        if line.startswith("# package "):
            package = line.split()[2]
            rows[package] = []
        elif line and not line.startswith("#"):
            rows[package].append(line)
    return rows


def installed_files(package):
    """The files of an installed package, or None."""
    status = subprocess.run(["dpkg-query", "-W", "-f", "${db:Status-Status}", package], capture_output=True,
                            text=True, check=False)
    if status.stdout != "installed":
        return None
    listed = subprocess.run(["dpkg-query", "-L", package], stdout=subprocess.PIPE, text=True, check=True)
    return set(map(os.path.realpath, listed.stdout.splitlines()))


def unpacked_files(root, package):
    folder = root / package
    return {os.path.realpath(path) for path in folder.rglob("*")} if folder.is_dir() else None


def scan(program, arguments, environment):
    """The status of a scan, and its plugin_ended events. Its report goes to standard error."""
    result = subprocess.run([program, "--cache=off", "--no-progress", "--json", "-", *map(str, arguments)],
                            stdin=subprocess.DEVNULL, stdout=subprocess.PIPE, env=environment, check=False)
    events = [json.loads(line) for line in result.stdout.decode().splitlines()]
    return result.returncode, [event for event in events if event["event"] == "plugin_ended"]


def may_be_left_out(event):
    """Whether it lacks a library, and is not one of the modules that need none."""
    lacks_a_library = any("cannot open shared object file" in text["text"] for text in event.get("printed", []))
    needs_none = set().union(*NEED_NO_LIBRARY.values())
    return lacks_a_library and os.path.basename(event["plugin"]["bundle"]) not in needs_none


def prints_on_standard_output(event):
    return any(text["stream"] == "stdout" for text in event.get("printed", []))


def main():
    parser = argparse.ArgumentParser(description=__doc__, formatter_class=argparse.RawDescriptionHelpFormatter)
    parser.add_argument("--scan", required=True, type=pathlib.Path)
    parser.add_argument("--architecture", choices=["amd64", "i386"], default="amd64")
    parser.add_argument("--i386-root", type=pathlib.Path)
    parser.add_argument("--i386-workers", type=pathlib.Path)
    options = parser.parse_args()
    is_required = os.environ.get("VSTTORTURE_REAL_PLUGINS") == "required"
    environment = {"HOME": "/nonexistent", "LC_ALL": "C", "PATH": "/usr/bin:/bin"}

    arguments, places, missing = [], PLACES, []
    if options.architecture == "i386":
        root = options.i386_root.resolve()
        arguments += ["--workers", options.i386_workers.resolve()]
        libraries = root / "libraries"
        environment["LD_LIBRARY_PATH"] = f"{libraries}/usr/lib/i386-linux-gnu:{libraries}/lib/i386-linux-gnu"
        if (root / "missing").exists():
            missing = (root / "missing").read_text().split()

    wanted, files, deviations = [], set(), 0
    found_places = []
    for package, rows in rows_by_package(options.architecture).items():
        if options.architecture == "i386":
            there = unpacked_files(root, package)
            if there is not None:
                found_places.append(root / package)
        else:
            there = installed_files(package)
        if there is None:
            print(f"left out: {package} is not there", flush=True)
            deviations += is_required and (package not in missing or package in NEED_NO_LIBRARY)
            continue
        wanted += rows
        files |= there
    if not wanted:
        return 1 if deviations else NOTHING_TO_RUN

    with tempfile.NamedTemporaryFile("w", suffix=".tsv") as expect:
        expect.write("\n".join(wanted) + "\n")
        expect.flush()
        places = found_places or [place for place in places if os.path.isdir(place)]
        status, events = scan(options.scan, [*arguments, "--expect", expect.name, *places], environment)

    for event in events:
        path = event["plugin"]["bundle"]
        is_ours = any(os.path.realpath(name) in files for name in [path, *event["otherNames"]])
        if event["expected"] is None and is_ours and event["plugin"]["child"] is None:
            print(f"{path} is not in the list: {event['verdict']}")
            deviations += 1
        elif event["expected"] is not None and not event["expected"]["isMet"]:
            if missing and may_be_left_out(event):
                print(f"left out: {path} needs a library that could not be had")
                continue
            print(f"{path}: {event['verdict']}, {event['cause']}; expected {event['expected']['verdict']}")
            deviations += 1
        elif event["expected"] is not None and event["verdict"] == "passed" and prints_on_standard_output(event):
            print(f"{path}: passed, with text of its own on standard output")
            deviations += 1
    met = sum(event["expected"] is not None for event in events)
    if met < len(wanted):
        print(f"{len(wanted) - met} plug-ins of the list were not found")
        deviations += 1
    print(f"{met} plug-ins of {len(wanted)} in the list were scanned, {deviations} deviations; status {status}")
    return 0 if deviations == 0 and status in (0, 1) else 1


if __name__ == "__main__":
    sys.exit(main())
