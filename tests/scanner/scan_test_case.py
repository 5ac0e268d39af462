# SPDX-License-Identifier: MIT
"""What the tests of the real vsttorture-scan have in common."""
import argparse
import json
import os
import pathlib
import shutil
import subprocess
import sys
import tempfile
import unittest

ROOT = pathlib.Path(__file__).resolve().parent.parent.parent
SCAN = PLUGINS = None  # From the command line: the program, and the folder of the sample plug-ins.
EFFECT = "well_behaved_effect.so"
PLAIN = ["--cache", "off", "--sandbox", "off"]


def read_arguments(arguments):
    """Sets SCAN and PLUGINS; returns what is left for unittest."""
    global SCAN, PLUGINS
    parser = argparse.ArgumentParser()
    parser.add_argument("--scan", required=True, type=pathlib.Path)
    parser.add_argument("--plugins", required=True, type=pathlib.Path)
    options, rest = parser.parse_known_args(arguments)
    SCAN, PLUGINS = options.scan.resolve(), options.plugins.resolve()
    return rest


def main():
    program = unittest.main(module="__main__", argv=[sys.argv[0], *read_arguments(sys.argv[1:])], exit=False)
    return 0 if program.result.wasSuccessful() else 1


class ScanTest(unittest.TestCase):
    def setUp(self):
        folder = tempfile.TemporaryDirectory(prefix="vsttorture-scan-test-")
        self.addCleanup(folder.cleanup)
        self.folder = pathlib.Path(folder.name).resolve()
        (self.folder / "home").mkdir()

    def environment(self, **more):
        return {"HOME": str(self.folder / "home"), "PATH": "/usr/bin:/bin", "LC_ALL": "C",
                "TMPDIR": str(self.folder), **more}

    def scan(self, *arguments, environment=None, sandbox="off", cache="off", **more):
        """One scan: its status, standard output and standard error. Nothing is remembered unless `cache` names a
        file, or is None for the default one, which is in a home of the test's own."""
        if sandbox:
            arguments = ["--sandbox", sandbox, *arguments]
        if cache:
            arguments = ["--cache", cache, *arguments]
        more.setdefault("stdout", subprocess.PIPE)
        more.setdefault("cwd", self.folder)
        return subprocess.run([SCAN, *map(str, arguments)], env=self.environment(**(environment or {})),
                              stdin=subprocess.DEVNULL, stderr=subprocess.PIPE, text=True, errors="surrogateescape",
                              timeout=120, check=False, **more)

    def scan_without_reader(self, *arguments):
        """A scan whose standard output is a pipe that nobody reads any more."""
        reading, writing = os.pipe()
        os.close(reading)
        with open(writing, "wb") as output:
            return self.scan(*arguments, stdout=output)

    def events(self, *arguments, status=None, **more):
        """The events of one scan."""
        result = self.scan("--json", "-", *arguments, **more)
        if status is not None:
            self.assertEqual(result.returncode, status, result.stderr)
        return [json.loads(line) for line in result.stdout.split("\n")[:-1]]

    def results(self, *arguments, **more):
        """{name: plugin_ended}, the name being that of the file, with #CHILD."""
        results = {}
        for event in self.events(*arguments, **more):
            if event["event"] == "plugin_ended":
                child = event["plugin"]["child"]
                name = os.path.basename(event["plugin"]["bundle"]) + (f"#{child}" if child is not None else "")
                self.assertNotIn(name, results)
                results[name] = event
        return results

    def verdicts(self, *arguments, **more):
        return {name: event["verdict"] for name, event in self.results(*arguments, **more).items()}

    def assert_said(self, sentence, report):
        """A report breaks its long lines, a long path in the middle."""
        self.assertIn("".join(sentence.split()), "".join(report.split()), report)

    def write(self, name, text):
        path = self.folder / name
        path.write_text(text)
        return path

    def copies(self, count):
        """A folder with copies of the effect, each a file of its own."""
        folder = self.folder / "copies"
        folder.mkdir()
        for number in range(count):
            shutil.copy(PLUGINS / EFFECT, folder / f"{number:03}.so")
        return folder
