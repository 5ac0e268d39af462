# SPDX-License-Identifier: MIT
"""Runs a recipe of docs/WHEN_A_PLUGIN_FAILS.md, word for word, on the sample plug-in with a fault of its kind.

    recipes.py --program build/release/vsttorture --plugins build/release/plugins RECIPE...

A recipe is the commands below a heading of the page. The program is stripped, as it is in packages. When a tool that
the recipe needs cannot be used it exits with 77, or with 1 if VSTTORTURE_DEBUGGERS=required is in the environment.
"""
import argparse
import collections
import os
import pathlib
import re
import shutil
import subprocess
import sys
import tempfile

SOURCE = pathlib.Path(__file__).resolve().parents[2]
sys.path.insert(0, str(SOURCE / "tests" / "shared"))
import debuggers  # noqa: E402
import page_commands  # noqa: E402
PAGE = SOURCE / "docs" / "WHEN_A_PLUGIN_FAILS.md"
LIMIT_IN_SECONDS = 280  # Compiling takes long on a busy machine.
NOTHING_TO_RUN = 77

# tools: what must be installed; the scan must have been built. shows: what must be printed, in this order, as regular expressions.
Recipe = collections.namedtuple("Recipe", "heading tools kind shows")
IN_STEP_6 = "6, inspect latency\n"
DISPATCHER = r"Faulty::dispatch\("

SCAN = "vsttorture-scan"
# On a busy machine the debugger may not have started after the page's five seconds. Tried when a recipe has failed.
LONGER = ("timeout -s INT 5 ", "timeout -s INT 60 ")

RECIPES = {
    "scan": Recipe("Let the scan explain it", [SCAN, "gdb", "valgrind"], "heap_corruption",
                   [r"crashed +.*my_plugin\.so", "SIGABRT in effGetTailSize", r"gdb: SIGABRT in .*writeBehindABlock",
                    "shortest list of tests: 1 of 5, found in 1 run", "--tests 4 .*my_plugin.so",
                    "memcheck: Invalid write of size 1", "valgrind --tool=memcheck"]),
    "crash": Recipe("Find the place of a crash", ["gdb"], "null_store",
                    [IN_STEP_6, "received signal SIGSEGV", r"#0 .*storeToAddressZero\(\)", DISPATCHER]),
    "throw": Recipe("Find what is thrown", ["gdb"], "throw_int",
                    [IN_STEP_6, "exception thrown", "#0 .*__cxa_throw", DISPATCHER]),
    "exit": Recipe("Find who ends the process", ["gdb"], "exit",
                   [IN_STEP_6, "unexpected exit", "#0 .*_exit", DISPATCHER]),
    "hang": Recipe("See where it hangs", ["gdb", "timeout"], "hang", [IN_STEP_6, r"hang\(\)", DISPATCHER]),
    "core": Recipe("Keep a crash for later", ["gdb"], "null_store",
                   [IN_STEP_6, "Saved corefile my_plugin.core", r"#0 .*storeToAddressZero\(\)", DISPATCHER]),
    "address_sanitizer": Recipe("Find memory errors with the address sanitizer", ["g++"], "heap_corruption",
                                [IN_STEP_6, "ERROR: AddressSanitizer: heap-buffer-overflow",
                                 r"#0 .*writeBehindABlock\(\) .*memory_faults\.cpp:\d+", "exit status 1\n"]),
    "address_sanitizer_crash": Recipe("Find memory errors with the address sanitizer", ["g++"], "null_store",
                                      [IN_STEP_6, "ERROR: AddressSanitizer: SEGV on unknown address 0x0",
                                       r"#0 .*storeToAddressZero\(\) .*faults\.cpp:\d+", "exit status 1\n"]),
    "valgrind": Recipe("Find memory errors with valgrind", ["valgrind"], "heap_corruption",
                       [IN_STEP_6, "Invalid write of size 1", r"at .*writeBehindABlock\(\)", "exit status 99\n"]),
}


def commands_of_the_page():
    """{heading: its commands}, without headings that have none."""
    found = collections.defaultdict(str)
    for command in page_commands.commands(PAGE):
        found[command.heading] += command.text
    return dict(found)


def plugin_source():
    """The sample plug-in, faults and all, in one file."""
    folders = [SOURCE / "plugins" / name for name in ("faulty", "base", "well_behaved_effect")]
    sources = [path for folder in folders for path in sorted(folder.glob("*.cpp")) if path.name != "entry.cpp"]
    return "".join(f'#include "{path}"\n' for path in sources)


def run(recipe, commands, program, plugins):
    """All that the commands print, on both outputs in their order, and the last status."""
    with tempfile.TemporaryDirectory(prefix="recipe.") as folder:
        subprocess.run(["strip", "-o", f"{folder}/vsttorture", program], check=True)
        if SCAN in recipe.tools:
            for name in (SCAN, "vsttorture-worker", "vsttorture-describe"):
                shutil.copy(f"{os.path.dirname(program)}/{name}", folder)
        shutil.copy(f"{plugins}/faulty.so", f"{folder}/my_plugin.so")
        pathlib.Path(folder, "my_plugin.cpp").write_text(plugin_source())
        environment = {"HOME": folder, "LC_ALL": "C", "PATH": f"{folder}:/usr/bin:/bin",
                       "CPLUS_INCLUDE_PATH": str(SOURCE), "FAULT_KIND": recipe.kind, "FAULT_PLACE": "dispatch:52"}
        done = subprocess.run(["bash", "-c", f"ulimit -c 0\n{commands}"], cwd=folder, env=environment, text=True,
                              errors="replace", stdin=subprocess.DEVNULL, stdout=subprocess.PIPE,
                              stderr=subprocess.STDOUT, timeout=LIMIT_IN_SECONDS)
        return f"{done.stdout}\nexit status {done.returncode}\n"


def first_missing(shows, output):
    """The first of the expressions that does not follow the ones before it; None when all do."""
    at = 0
    for expression in shows:
        match = re.compile(expression).search(output, at)
        if match is None:
            return expression
        at = match.end()
    return None


def why_not(tool, build):
    """Why the tool cannot be used; None where it can."""
    if tool == SCAN:
        return None if os.path.exists(f"{build}/{SCAN}") else f"{SCAN} is not built"
    return debuggers.why_not(tool)


def main():
    parser = argparse.ArgumentParser(description=__doc__, formatter_class=argparse.RawDescriptionHelpFormatter)
    parser.add_argument("--program", required=True)
    parser.add_argument("--plugins", required=True, help="the folder of the sample plug-ins")
    parser.add_argument("names", nargs="+", metavar="RECIPE", choices=list(RECIPES))
    arguments = parser.parse_args()

    commands = commands_of_the_page()
    untested = commands.keys() ^ {recipe.heading for recipe in RECIPES.values()}
    if untested:
        print(f"headings without a test, or without commands: {sorted(untested)}")
        return 1
    for recipe in [RECIPES[name] for name in arguments.names]:
        program, plugins = os.path.abspath(arguments.program), os.path.abspath(arguments.plugins)
        reasons = [reason for tool in recipe.tools if (reason := why_not(tool, os.path.dirname(program)))]
        if reasons:
            print(f"left out: {recipe.heading}: {' and '.join(reasons)}")
            return 1 if debuggers.IS_REQUIRED else NOTHING_TO_RUN
        text = commands[recipe.heading]
        output = run(recipe, text, program, plugins)
        lacking = first_missing(recipe.shows, output)
        if lacking is not None and LONGER[0] in text:
            output = run(recipe, text.replace(*LONGER), program, plugins)
            lacking = first_missing(recipe.shows, output)
        if lacking is not None:
            print(f"{recipe.heading}: nothing like {lacking!r} at its place in\n{output}")
            return 1
    return 0


if __name__ == "__main__":
    sys.exit(main())
