# SPDX-License-Identifier: MIT
"""Has vsttorture-scan explain what is known to be wrong with plug-ins of three Debian packages.

    explain_real_plugins.py --scan build/release/vsttorture-scan CASE...

A case whose package or tool is not installed is left out and said so; it is a failure with
VSTTORTURE_REAL_PLUGINS=required, or VSTTORTURE_DEBUGGERS=required, in the environment. Exits with 77 when nothing was
there to run.
"""
import argparse
import json
import os
import pathlib
import shutil
import subprocess
import sys

NOTHING_TO_RUN = 77
LIMIT_IN_SECONDS = 1800


def amsynth(result):
    """Takes the length of its chunk with strlen, though no zero ends that."""
    yield result["verdict"] == "passed", "it passes"
    findings = result["diagnosis"]["findings"]
    reads = [finding for finding in findings if finding["kind"] == "InvalidRead"]
    yield bool(reads), "memcheck finds an invalid read"
    yield any("0 bytes after a block" in finding["text"] and finding["frames"][0] == "strlen" and
              finding["frames"][1].startswith("amsynth_vst.so+0x") for finding in reads), \
        "strlen, called by the plug-in, reads right behind a block"


def granular_encoder(result):
    """Uses parts of itself that it has not set."""
    findings = result["diagnosis"]["findings"]
    unset = [finding for finding in findings if finding["kind"].startswith("Uninit") and finding["isInPlugin"]]
    yield bool(unset), "memcheck finds a use of memory that was never set"
    yield any("created by a heap allocation in libGranularEncoder.so+0x" in finding["text"] for finding in unset), \
        "the plug-in has allocated that memory"


def oscilloscope(result):
    """Calls through a null pointer where its bypass control should be."""
    yield result["verdict"] == "crashed" and result["request"]["name"] == "effSetBypass", "it crashes in effSetBypass"
    shrunk = result["shrunk"]
    yield (shrunk["from"], shrunk["tests"], shrunk["runs"]) == ("0,1,2,3", "3", 1), "test 3 alone crashes it"
    again = subprocess.run(shrunk["command"], stdin=subprocess.DEVNULL, capture_output=True, check=False)
    yield again.returncode == 7, "the command for that test crashes again"
    findings = result["diagnosis"]["findings"]
    yield len(findings) == 1 and findings[0]["kind"] == "SIGSEGV", "gdb stops at the signal"
    place = f"{result['place']['module']}+{result['place']['offset']}"
    yield findings[0]["frames"][0] == place, f"at {place}, as the flight record says"
    yield findings[0]["text"].endswith("at mov (%rdi),%rax with rdi = 0x0"), "the pointer is null"


# name: package, path, program of the tool, arguments, what must be in the result
CASES = {
    "amsynth": ("amsynth", "/usr/lib/vst/amsynth_vst.so", "valgrind", ["--under", "memcheck"], amsynth),
    "granular_encoder": ("iem-plugin-suite-vst",
                         "/usr/lib/x86_64-linux-gnu/iem-plugin-suite/vst/libGranularEncoder.so", "valgrind",
                         ["--under", "memcheck"], granular_encoder),
    "oscilloscope": ("lsp-plugins-vst", "/usr/lib/vst/lsp-plugins/oscilloscope-x1.so", "gdb",
                     ["--under", "gdb", "--shrink"], oscilloscope),
}


def main():
    parser = argparse.ArgumentParser(description=__doc__, formatter_class=argparse.RawDescriptionHelpFormatter)
    parser.add_argument("--scan", required=True, type=pathlib.Path)
    parser.add_argument("cases", nargs="+", metavar="CASE", choices=list(CASES))
    options = parser.parse_args()

    failures = done = 0
    for name in options.cases:
        package, path, tool, arguments, expectations = CASES[name]
        for is_missing, what, variable in [(not os.path.exists(path), package, "VSTTORTURE_REAL_PLUGINS"),
                                           (shutil.which(tool) is None, tool, "VSTTORTURE_DEBUGGERS")]:
            if is_missing:
                print(f"left out: {name} needs {what}")
                failures += os.environ.get(variable) == "required"
                break
        else:
            scan = subprocess.run([options.scan, "--no-progress", "--cache", "off", "--json", "-", *arguments, path],
                                  stdin=subprocess.DEVNULL, stdout=subprocess.PIPE, text=True, check=False,
                                  timeout=LIMIT_IN_SECONDS,
                                  env={"HOME": "/nonexistent", "LC_ALL": "C", "PATH": "/usr/bin:/bin"})
            done += 1
            events = [json.loads(line) for line in scan.stdout.splitlines()]
            result = next(event for event in events if event["event"] == "plugin_ended")
            checks = [(scan.returncode == 1, "the status is 1"), *expectations(result)]
            for is_met, sentence in checks:
                if not is_met:
                    print(f"{name}: not so: {sentence}\n{json.dumps(result['diagnosis'], indent=1)[:4000]}")
                    failures += 1
    return 1 if failures else 0 if done else NOTHING_TO_RUN


if __name__ == "__main__":
    sys.exit(main())
