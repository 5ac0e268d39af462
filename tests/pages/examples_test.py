# SPDX-License-Identifier: MIT
"""Tests of the examples in docs/examples/ that stand around the scan.

    examples_test.py --build build/release [TEST...]

The tests of the class CiFiles read YAML, with the Python package yaml. When these alone are asked for and the package
is missing, the status is 77, or 1 if VSTTORTURE_PAGES=required is in the environment.
"""
import argparse
import os
import pathlib
import shlex
import shutil
import subprocess
import sys
import tempfile
import unittest

try:
    import yaml
except ImportError:
    yaml = None

EXAMPLES = pathlib.Path(__file__).resolve().parents[2] / "docs/examples"
LIMIT_IN_SECONDS = 280
NOTHING_TO_RUN = 77
BUILD = None  # From the command line.


class Example(unittest.TestCase):
    def setUp(self):
        folder = tempfile.TemporaryDirectory(prefix="vsttorture-example-")
        self.addCleanup(folder.cleanup)
        self.folder = pathlib.Path(folder.name)
        self.plugin = self.folder / "my_plugin.so"

    def run_program(self, *command, **more):
        environment = {"HOME": str(self.folder), "PATH": f"{BUILD}:/usr/bin:/bin", "LC_ALL": "C.UTF-8",
                       "FAULT_KIND": "null_store", "FAULT_PLACE": "dispatch:44", **more}
        return subprocess.run([str(word) for word in command], cwd=self.folder, env=environment, text=True,
                              stdin=subprocess.DEVNULL, stdout=subprocess.PIPE, stderr=subprocess.STDOUT,
                              timeout=LIMIT_IN_SECONDS, check=False)

    def build_plugin(self, sample):
        """A new my_plugin.so, as a compiler leaves it."""
        self.plugin.unlink(missing_ok=True)
        shutil.copy(BUILD / "plugins" / sample, self.plugin)


class ReadScan(Example):
    @classmethod
    def setUpClass(cls):
        folder = tempfile.TemporaryDirectory(prefix="vsttorture-example-")
        cls.addClassCleanup(folder.cleanup)
        cls.program = pathlib.Path(folder.name, "read_scan")
        subprocess.run([*shlex.split(os.environ.get("CXX", "c++")), "-std=c++17", "-Wall", "-Wextra", "-Werror", "-o",
                        cls.program, EXAMPLES / "read_scan.cpp"], check=True)

    def assert_both(self, status, output, *arguments):
        for reader in ([self.program], [sys.executable, EXAMPLES / "read_scan.py"]):
            with self.subTest(reader=reader):
                done = self.run_program(*reader, *arguments)
                self.assertEqual((done.returncode, done.stdout), (status, output))

    def test_names_and_verdicts_are_printed(self):
        # Reported in the order of their paths, so all three stand in one folder.
        self.build_plugin("unruly.so")
        shell, effect = (pathlib.Path(shutil.copy(BUILD / "plugins" / name, self.folder))
                         for name in ("shell.so", "well_behaved_effect.so"))
        self.assert_both(1, f"crashed       my_plugin.so  {self.plugin}\n"
                            f"shell         Shell  {shell}\n"
                            f"passed        First child  {shell} #1001\n"
                            f"passed        Second child  {shell} #1234\n"
                            f"passed        Third child  {shell} #-7\n"
                            f"passed        Well-behaved effect  {effect}\n",
                         "vsttorture-scan", "-j", "1", "--cache", "off", self.plugin, shell, effect)

    def test_control_characters_in_texts_reach_no_terminal(self):
        place = self.folder / "a\x1b[31m\x7f\u009bé.so"
        shutil.copy(BUILD / "plugins/unruly.so", place)
        name = "a?[31m??é.so"
        self.assert_both(1, f"crashed       {name}  {self.folder}/{name}\n", "vsttorture-scan", "--cache", "off", place)

    def test_a_scan_that_cannot_be_started_or_used(self):
        self.assert_both(3, "cannot start nowhere: No such file or directory\n", "nowhere")
        self.assert_both(2, "", "vsttorture-scan", "gone.so")


class Torture(Example):
    SCRIPT = EXAMPLES / "ci/torture.sh"

    def torture(self, *arguments):
        done = self.run_program(self.SCRIPT, *arguments, self.plugin)
        return done.returncode, " ".join(done.stdout.split())

    def test_on_the_day_it_breaks_it_says_what_is_new_and_how_to_have_it_again(self):
        self.build_plugin("well_behaved_effect.so")
        self.assertEqual(self.torture()[0], 0)
        for _ in range(2):  # It stays new until somebody accepts it.
            self.build_plugin("faulty.so")
            status, output = self.torture()
            self.assertEqual(status, 1)
            self.assertIn('new: it was "passed" before', output)
            self.assertIn("SIGSEGV in effSetBypass (44) value 1, in my_plugin.so+0x", output)
            self.assertRegex(output, r"shortest: \S.*/vsttorture-worker'? --tests 3 \S*/my_plugin.so")
        self.build_plugin("well_behaved_effect.so")
        self.assertEqual(self.torture()[0], 0)

    def test_what_was_accepted_fails_no_more(self):
        self.build_plugin("faulty.so")
        self.assertEqual(self.torture()[0], 1)
        self.assertEqual(self.torture("--accept")[0], 0)
        self.assertEqual(self.torture()[0], 0)
        self.build_plugin("exits_in_test.so")
        status, output = self.torture()
        self.assertEqual(status, 1)
        self.assertIn('new: it was "crashed at 5" before', output)

    def test_reports_are_made_anew_and_other_files_stay(self):
        self.build_plugin("faulty.so")
        reports = self.folder / "torture-reports"
        reports.mkdir()
        for name in ("mine", "scan.html"):
            (reports / name).write_text("old")
        self.torture()
        self.assertEqual(sorted(path.name for path in reports.iterdir()),
                         ["junit.xml", "mine", "scan.html", "scan.jsonl"])
        self.assertNotEqual((reports / "scan.html").read_text(), "old")
        self.plugin.unlink()
        self.torture()
        self.assertEqual([path.name for path in reports.iterdir()], ["mine"])

    def test_without_the_program_it_says_what_is_missing(self):
        script = self.folder / "torture.sh"
        shutil.copy(self.SCRIPT, script)
        (self.folder / "bin").mkdir()
        (self.folder / "bin/dirname").symlink_to(shutil.which("dirname"))
        done = self.run_program(script, self.plugin, PATH=str(self.folder / "bin"))
        self.assertEqual(done.returncode, 3)
        self.assertIn("torture.sh: vsttorture-scan is not installed", done.stdout)

    def test_wrong_use_and_a_plugin_that_was_not_built_change_no_baseline(self):
        self.assertEqual(self.run_program(self.SCRIPT).returncode, 2)
        self.build_plugin("well_behaved_effect.so")
        self.torture()
        baseline = (self.folder / ".torture/baseline.jsonl").read_bytes()
        self.plugin.unlink()
        self.assertEqual(self.torture("--accept")[0], 2)
        self.assertEqual((self.folder / ".torture/baseline.jsonl").read_bytes(), baseline)


@unittest.skipIf(yaml is None, "the Python package yaml is not installed")
class CiFiles(unittest.TestCase):
    """The files around torture.sh run the script that is tested here, and keep the folders that it uses."""

    CALL = ".torture/vsttorture/docs/examples/ci/torture.sh build/my_plugin.so"

    def test_github(self):
        (job,) = yaml.safe_load((EXAMPLES / "ci/github-workflow.yml").read_text())["jobs"].values()
        steps = job["steps"]
        (torture,) = [step for step in steps if "torture.sh" in step.get("run", "")]
        self.assertEqual(torture["run"].splitlines()[-1], self.CALL)
        paths = {step["uses"].split("@")[0]: (step["with"]["path"], step.get("if")) for step in steps
                 if "path" in step.get("with", {})}
        self.assertEqual(paths, {"actions/cache/restore": (".torture", None),
                                 "actions/cache/save": (".torture", "always()"),
                                 "actions/upload-artifact": ("torture-reports", "always()")})

    def test_gitlab(self):
        (job,) = yaml.safe_load((EXAMPLES / "ci/gitlab-ci.yml").read_text()).values()
        self.assertEqual(job["script"], [self.CALL])
        self.assertEqual((job["cache"]["paths"], job["cache"]["when"]), ([".torture"], "always"))
        self.assertEqual((job["artifacts"]["paths"], job["artifacts"]["when"]), (["torture-reports"], "always"))
        self.assertEqual(job["artifacts"]["reports"]["junit"], "torture-reports/junit.xml")


def main():
    global BUILD
    parser = argparse.ArgumentParser()
    parser.add_argument("--build", required=True, type=pathlib.Path)
    options, rest = parser.parse_known_args()
    BUILD = options.build.resolve()
    if yaml is None and rest == ["CiFiles"]:
        print("left out: the Python package yaml is not installed")
        sys.exit(1 if os.environ.get("VSTTORTURE_PAGES") == "required" else NOTHING_TO_RUN)
    unittest.main(argv=[sys.argv[0], *rest])


if __name__ == "__main__":
    main()
