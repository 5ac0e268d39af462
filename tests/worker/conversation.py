# SPDX-License-Identifier: MIT
"""A plug-in cannot tell vsttorture-worker from vsttorture: the same requests, lines and status.

    conversation.py --program PATH --worker PATH --plugins FOLDER [MODULE...]

The sample passes_on stands between each module and the two programs, writes every request down, and lets both draw the
same random tests. Modules are the sample plug-ins that are meant to run, and ten of Debian's packages where they are
installed; or those that are named. The worker runs with a record and with every option that limits it.
"""
import argparse
import os
import subprocess
import sys
import tempfile

SAMPLES = ["asks_host", "both_entries", "crashes_after_two_states", "excess_precision", "exits_in_test", "exits_on_open",
           "faulty", "faulty_own_runtime", "main_macho_entry", "null_instance", "older_entry", "open_crashes",
           "records_requests", "shell", "well_behaved_effect", "well_behaved_instrument"]
DEBIAN = ["amsynth_vst.so", "ZynAddSubFX.so", "ZynReverb.so", "Kars-vst.so", "MVerb-vst.so", "Nekobi-vst.so",
          "3BandEQ-vst.so", "ZamComp-vst.so", "lsp-plugins/art-delay-mono.so", "lsp-plugins/oscilloscope-x1.so"]
LIMIT_IN_SECONDS = 100


def run(command, module, folder, environment):
    """Output, status and requests of a run."""
    log = os.path.join(folder, "log")
    home = tempfile.mkdtemp(dir=folder)
    environment = {"HOME": home, "TMPDIR": home, "PATH": "/usr/bin:/bin", "LC_ALL": "C", "PASSES_ON_TO": module,
                   "PASSES_ON_LOG": log, "LSAN_OPTIONS": "detect_leaks=0", **environment}
    with open(log, "w", encoding="utf-8"):
        pass
    done = subprocess.run(command, env=environment, cwd=home, stdin=subprocess.DEVNULL, stdout=subprocess.PIPE,
                          stderr=subprocess.DEVNULL, timeout=LIMIT_IN_SECONDS, check=False)
    with open(log, encoding="utf-8") as file:
        return done.stdout, done.returncode, file.read().splitlines()


def compare(module, arguments, folder, environment):
    """What is wrong, and how many requests were compared."""
    proxy = os.path.join(arguments.plugins, "passes_on.so")
    limits = ["--record", os.path.join(folder, "record"), "--no-core", "--die-with-parent",
              "--file-size-limit", "1000000000"]
    bare = run([arguments.program, proxy], module, folder, environment)
    observed = run([arguments.worker, *limits, proxy], module, folder, environment)
    faults = [what for what, one, other in zip(("lines", "status", "requests"), bare, observed) if one != other]
    return faults, len(bare[2])


def main():
    parser = argparse.ArgumentParser(description=__doc__, formatter_class=argparse.RawDescriptionHelpFormatter)
    parser.add_argument("--program", required=True)
    parser.add_argument("--worker", required=True)
    parser.add_argument("--plugins", required=True)
    parser.add_argument("--samples-only", action="store_true", help="no plug-ins of Debian's packages")
    parser.add_argument("modules", nargs="*")
    arguments = parser.parse_args()
    for name in ("program", "worker", "plugins"):
        setattr(arguments, name, os.path.abspath(getattr(arguments, name)))

    modules = arguments.modules
    if not modules:
        modules = [os.path.join(arguments.plugins, name + ".so") for name in SAMPLES]
        if not all(map(os.path.exists, modules)):
            sys.exit(f"not all sample plug-ins are there: {modules}")
        with open(arguments.program, "rb") as program:
            is_64_bit = program.read(5) == b"\x7fELF\x02"
        if is_64_bit and not arguments.samples_only:
            modules += [path for path in (os.path.join("/usr/lib/vst", name) for name in DEBIAN) if os.path.exists(path)]
    failed = 0
    for module in modules:
        for chunks in ("0", "1") if module.endswith("/records_requests.so") else ("0",):
            with tempfile.TemporaryDirectory() as folder:
                faults, count = compare(module, arguments, folder, {"RECORDS_REQUESTS_CHUNKS": chunks})
            if faults or count == 0:
                failed += 1
            print(f"{module}: {count} requests, {'not the same ' + ', '.join(faults) if faults else 'the same'}",
                  flush=True)
    return 1 if failed else 0


if __name__ == "__main__":
    sys.exit(main())
