# SPDX-License-Identifier: MIT
"""Types what docs/BREAKS_MY_SESSION.md, docs/IN_YOUR_CI.md and docs/IN_YOUR_HOST.md tell their readers to type, and
compares what is seen with what the pages show.

    pages_test.py --build build/release PAGE...

The reader's machine is a folder: a home with sample plug-ins, and the programs in its path. Times, dates, offsets and
the number of processors may differ from what the page shows, and lines may be broken elsewhere. Every block of a page
is run, except for the commands in NOT_RUN. Exits with 77 when a program that the page needs is missing, or with 1 if
VSTTORTURE_PAGES=required is in the environment.
"""
import argparse
import collections
import os
import pathlib
import re
import shutil
import subprocess
import sys

SOURCE = pathlib.Path(__file__).resolve().parents[2]
sys.path.insert(0, str(SOURCE / "tests" / "shared"))
import page_commands  # noqa: E402
from short_folder import short_folder  # noqa: E402

NOTHING_TO_RUN = 77
LIMIT_IN_SECONDS = 300
PROGRAMS = ["vsttorture", "vsttorture-worker", "vsttorture-describe", "vsttorture-scan"]
MARK = "\x1e"

# What cannot be run here, and what stands in for it.
NOT_RUN = {
    "sudo apt install ./vsttorture_0.2.0_amd64.deb ./vsttorture-workers_0.2.0_amd64.deb\n":
        "scripts/check_packages.sh installs the packages",
    "git clone REPOSITORY vsttorture && cd vsttorture && ./scan\n":
        "the programs are built; tests/scripts_test.py tests ./scan",
    "git clone REPOSITORY vsttorture": "the reader's home has this checkout under that name",
}


class World:
    """A machine of one reader. Its folder is the root of what the reader sees."""

    def __init__(self, folder, build):
        self.folder, self.build = pathlib.Path(folder), pathlib.Path(build).resolve()
        self.home = self.folder / "home/me"
        self.plugins = self.home / ".vst"
        self.plugins.mkdir(parents=True)
        (self.folder / "tmp").mkdir()
        (self.folder / "usr/bin").mkdir(parents=True)
        for program in PROGRAMS:
            (self.folder / "usr/bin" / program).symlink_to(self.build / program)

    def put(self, sample, path):
        """A copy of a sample plug-in, at this path in the home."""
        path = self.home / path
        path.parent.mkdir(parents=True, exist_ok=True)
        shutil.copy(self.build / "plugins" / sample, path)

    def environment(self):
        # faulty.so crashes while it is bypassed; the other plug-ins do not look at these variables.
        return {"HOME": str(self.home), "VST_PATH": str(self.plugins), "TMPDIR": str(self.folder / "tmp"),
                "PATH": f"{self.folder}/usr/bin:/usr/bin:/bin", "LC_ALL": "C.UTF-8", "USER": "me",
                "FAULT_KIND": "null_store", "FAULT_PLACE": "dispatch:44"}

    def run(self, commands):
        """[(output, status)], of the commands typed one after the other into one shell."""
        mark = f"status=$?; printf '{MARK}%d{MARK}' $status; (exit $status)"  # The next command may ask for $?.
        script = "".join(f"{command.text}\n{mark}\n" for command in commands)
        # One processor: plug-ins then end in the same order each time.
        done = subprocess.run(["taskset", "--cpu-list", str(min(os.sched_getaffinity(0))), "bash", "-c", script],
                              cwd=self.home, env=self.environment(), text=True, errors="replace",
                              stdin=subprocess.DEVNULL, stdout=subprocess.PIPE, stderr=subprocess.STDOUT,
                              timeout=LIMIT_IN_SECONDS, check=False)
        parts = done.stdout.split(MARK)
        seen = [(self.as_the_reader_sees(output), int(status)) for output, status in zip(parts[::2], parts[1::2])]
        assert len(seen) == len(commands), f"the shell ended early:\n{done.stdout}"
        return seen

    def as_the_reader_sees(self, output):
        # A path with a blank is quoted in a command.
        output = re.sub(rf"'({re.escape(str(self.build))}/[^']*)'", r"\1", output)
        for path, name in [(self.build, "/usr/bin"), (self.folder, "")]:
            output = output.replace(str(path), name)
        return output


def musician(world):
    world.put("well_behaved_effect.so", ".vst/chorus.so")
    world.put("faulty.so", ".vst/delay.so")
    world.put("exits_in_test.so", ".vst/old_synth.so")
    world.put("well_behaved_instrument.so", ".vst/organ.so")
    world.put("shell.so", ".vst/rack.so")


def update_the_delay(world):
    page = (world.home / "plug-ins.html").read_text()  # Of the heading before.
    assert "old_synth.so" in page, page
    world.put("well_behaved_effect.so", ".vst/delay.so")


def maker_of_a_plugin(world):
    """What is built is good the first time and then no more."""
    (world.home / "vsttorture").symlink_to(SOURCE)
    make = world.folder / "usr/bin/make"
    make.write_text(f"""#!/bin/sh
        mkdir -p build && cd build || exit
        sample=well_behaved_effect
        [ ! -e my_plugin.so ] || sample=faulty
        cp "{world.build}/plugins/$sample.so" new && mv new my_plugin.so""")
    make.chmod(0o755)


def maker_of_a_host(world):
    musician(world)
    (world.home / "examples").symlink_to(SOURCE / "docs/examples")


# prepares: puts on the reader's machine what is there at first. tools: programs that the page needs. meanwhile: what
# happens before the commands below a heading.
Page = collections.namedtuple("Page", "prepares tools meanwhile")
PAGES = {
    "BREAKS_MY_SESSION": Page(musician, ["gdb"], {"The second time": update_the_delay}),
    "IN_YOUR_CI": Page(maker_of_a_plugin, ["gdb"], {}),
    "IN_YOUR_HOST": Page(maker_of_a_host, ["c++", "jq", "sqlite3"], {}),
}

VARIABLE = [(r"\b\d+(\.\d+)? (s|ms|min)\b", "# s"), (r"\+0x[0-9a-f]+", "+0x#"), (r"\b\d{4}-\d\d-\d\d\b", "DATE"),
            (r"\b\d\d:\d\d(:\d\d)?\b", "TIME"), (r"\b\d+ at a time", "# at a time"),
            (r"\b0\.\d+\.\d+\b", "VERSION"), (r"sandbox: (bubblewrap|none \(([^()]|\([^()]*\))*\))", "sandbox: #")]


def comparable(text):
    text = " ".join(text.split())
    for pattern, instead in VARIABLE:
        text = re.sub(pattern, instead, text)
    return text


def is_as_shown(shown, output):
    """Whether the output is what the page shows; each of its lines "..." stands for any number of lines."""
    parts = [comparable(part) for part in re.split(r"^\.\.\.$", shown, flags=re.MULTILINE)]
    pattern = ".*".join(re.escape(part) for part in parts)
    return re.fullmatch(pattern.replace(r"\ .*", r"\ ?.*"), comparable(output), re.DOTALL) is not None


def problems(name, world):
    page = PAGES[name]
    commands = page_commands.commands(SOURCE / "docs" / f"{name}.md")
    headings = list(dict.fromkeys(command.heading for command in commands))
    assert headings and not page.meanwhile.keys() - set(headings), headings
    page.prepares(world)
    for heading in headings:
        page.meanwhile.get(heading, lambda world: None)(world)
        section = [command for command in commands if command.heading == heading and command.text not in NOT_RUN]
        for command, (output, status) in zip(section, world.run(section)):
            if command.shown is not None and not is_as_shown(command.shown, output):
                yield f"{name}, {heading}: $ {command.text}\nthe page shows\n{command.shown}\nseen is\n{output}"
            if command.shown is None and status != 0:
                yield f"{name}, {heading}: status {status} of\n{command.text}\n{output}"


def main():
    parser = argparse.ArgumentParser(description=__doc__, formatter_class=argparse.RawDescriptionHelpFormatter)
    parser.add_argument("--build", required=True)
    parser.add_argument("pages", nargs="+", metavar="PAGE", choices=PAGES)
    options = parser.parse_args()
    failed = False
    for name in options.pages:
        missing = [tool for tool in PAGES[name].tools if not shutil.which(tool)]
        if missing:
            print(f"left out: {name} needs {' and '.join(missing)}")
            return 1 if os.environ.get("VSTTORTURE_PAGES") == "required" else NOTHING_TO_RUN
        with short_folder("vsttorture-page-") as folder:
            for problem in problems(name, World(folder, options.build)):
                print(problem, end="\n\n")
                failed = True
    return 1 if failed else 0


if __name__ == "__main__":
    sys.exit(main())
