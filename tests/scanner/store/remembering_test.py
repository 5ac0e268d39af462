# SPDX-License-Identifier: MIT
"""Scans the sample plug-ins twice and more, and looks at what a scan takes from those before it.

    remembering_test.py --scan build/release/vsttorture-scan --plugins build/release/plugins [TEST...]
"""
import contextlib
import json
import os
import pathlib
import re
import resource
import shutil
import signal
import sqlite3
import subprocess
import sys
import time
import unittest

sys.path.insert(0, str(pathlib.Path(__file__).resolve().parent.parent))
import scan_test_case
from scan_test_case import EFFECT, ScanTest

NOBODY = 65534
CRASH = {"FAULT_KIND": "null_store", "FAULT_PLACE": "dispatch:10"}
MEMORY = str(1 << 29)  # MiB: other than the default, and no limit, since a sanitizer can have none.
HANG = {"FAULT_KIND": "hang", "FAULT_PLACE": "dispatch:10"}

# Notes each of its starts, and becomes the real program.
COUNTING_PROGRAM = r"""
#include <fcntl.h>
#include <unistd.h>
int main(int argc, char** argv) {
  (void)argc;
  int file = open(COUNTED, O_WRONLY | O_APPEND | O_CREAT, 0666);
  if (file < 0 || write(file, "x", 1) != 1) return 99;
  close(file);
  argv[0] = REAL;
  execv(REAL, argv);
  return 98;
}
"""


class RememberingTest(ScanTest):
    def setUp(self):
        super().setUp()
        self.database = self.folder / "home/.cache/vsttorture/results.sqlite"

    def scan(self, *arguments, cache=None, **more):
        """With the default database, in the home of the test."""
        return super().scan(*arguments, cache=cache, **more)

    def plugin(self, name=EFFECT, copy="plugin.so"):
        """A file of the test's own; one that was there has another time of change than before."""
        path = self.folder / copy
        if path.exists():
            self.wait_for_another_time(path)
        shutil.copy(scan_test_case.PLUGINS / name, path)
        return path

    def wait_for_another_time(self, path):
        """Until a file that is changed has another time of change than this one. The kernel's clock for files goes in
        steps of some milliseconds, and some file systems know seconds only."""
        probe, before = path.with_name("probe"), path.stat()
        while True:
            probe.touch()
            if probe.stat().st_ctime_ns != before.st_ctime_ns:
                break
            time.sleep(0.001)
        probe.unlink()

    def result(self, *arguments, **more):
        """The one result of a scan."""
        (result,) = self.results(*arguments, **more).values()
        return result

    def is_remembered(self, *arguments, **more):
        return self.result(*arguments, **more)["isRemembered"]

    def rows(self, sql, *values):
        with contextlib.closing(sqlite3.connect(f"file:{self.database}?mode=ro", uri=True)) as database:
            return database.execute(sql, values).fetchall()

    def run_sql(self, sql):
        with contextlib.closing(sqlite3.connect(self.database)) as database:
            database.executescript(sql)


class SecondScan(RememberingTest):
    def counting_workers(self):
        """A folder with programs that count their starts, and the file that is as long as there were starts."""
        if not shutil.which("cc"):
            self.skipTest("there is no C compiler")
        folder, counted = self.folder / "workers", self.folder / "counted"
        folder.mkdir()
        real = scan_test_case.PLUGINS.parent
        for name in ("vsttorture-worker", "vsttorture-describe"):
            source = self.write(f"{name}.c", COUNTING_PROGRAM)
            subprocess.run(["cc", "-o", folder / name, source, f'-DREAL="{real / name}"', f'-DCOUNTED="{counted}"'],
                           check=True)
        return folder, counted

    def test_starts_no_process_and_says_the_same(self):
        workers, counted = self.counting_workers()
        arguments = ["--workers", workers, scan_test_case.PLUGINS]
        first = self.results(*arguments, status=1)
        self.assertGreater(counted.stat().st_size, len(first) / 2)
        counted.unlink()
        events = self.events(*arguments, status=1)
        self.assertFalse(counted.exists())
        self.assertEqual([event for event in events if event["event"] == "run_started"], [])
        second = {name: event for name, event in self.results(*arguments, status=1).items()}
        self.assertEqual(set(first), set(second))
        self.assertIn("shell.so#1234", second)
        for name, event in second.items():
            self.assertTrue(event.pop("isRemembered"), name)
            first[name].pop("isRemembered")
            change = event.pop("comparison")["change"]
            self.assertEqual(change, "none" if event["isWanted"] else "still_failing", name)
            first[name].pop("comparison")
            self.assertEqual(event, first[name])

    def test_needs_no_sandbox_and_no_scratch_folder(self):
        plugin = self.plugin()
        self.scan(plugin, sandbox="auto")
        result = self.scan(plugin, sandbox="auto", environment={"TMPDIR": "/proc/nowhere", "PATH": "/nowhere"})
        self.assertEqual((result.returncode, result.stderr), (0, ""))
        self.assertRegex(result.stdout, r"\n1 result: 1 passed, in \S+ m?s; all remembered\n$")

    def test_notices_another_file_but_not_another_folder(self):
        def replace(plugin):
            shutil.copy(plugin, self.folder / "new")
            os.rename(self.folder / "new", plugin)

        def move_away_and_back(plugin):
            os.rename(plugin, self.folder / "away")
            os.rename(self.folder / "away", plugin)

        def append(plugin):
            with open(plugin, "ab") as file:
                file.write(b"\0")

        def change_and_set_the_time_back(plugin):
            before = plugin.stat()
            plugin.write_bytes(plugin.read_bytes())
            os.utime(plugin, ns=(before.st_atime_ns, before.st_mtime_ns))

        folder = self.folder / "plugins"
        folder.mkdir()
        for change, is_remembered in [(lambda plugin: os.utime(folder), True),
                                      (lambda plugin: (folder / "text").write_text("x"), True),
                                      (replace, False), (move_away_and_back, False), (append, False),
                                      (os.utime, False), (change_and_set_the_time_back, False)]:
            with self.subTest(change=getattr(change, "__name__", "")):
                plugin = self.plugin(copy="plugins/plugin.so")
                self.assertFalse(self.is_remembered(folder))
                self.wait_for_another_time(plugin)
                change(plugin)
                self.assertEqual(self.is_remembered(folder), is_remembered)
                self.assertTrue(self.is_remembered(folder))

    def test_looks_at_the_executable_of_a_folder(self):
        bundle = self.folder / "Effect.vst"
        executable = bundle / "Contents/x86_64-linux/Effect.so"
        executable.parent.mkdir(parents=True)
        shutil.copy(scan_test_case.PLUGINS / EFFECT, executable)
        self.assertFalse(self.is_remembered(bundle))
        (bundle / "Contents/preset").write_text("x")
        self.assertTrue(self.is_remembered(bundle))
        self.wait_for_another_time(executable)
        executable.write_bytes(executable.read_bytes())
        self.assertFalse(self.is_remembered(bundle))

    def test_a_plugin_that_was_moved_is_run_at_its_new_place(self):
        plugin = self.plugin()
        self.scan(plugin)
        moved = self.folder / "moved.so"
        os.rename(plugin, moved)
        self.assertFalse(self.is_remembered(moved))

    def test_names_that_are_no_utf8_are_told_apart(self):
        folder = os.fsencode(self.folder) + b"/names"
        os.mkdir(folder)
        for name in (b"/\xfe.so", b"/\xff.so"):
            shutil.copy(scan_test_case.PLUGINS / EFFECT, folder + name)

        def are_remembered():
            ended = [event for event in self.events(self.folder / "names") if event["event"] == "plugin_ended"]
            return sorted(event["isRemembered"] for event in ended)
        self.assertEqual(are_remembered(), [False, False])
        self.assertEqual(are_remembered(), [True, True])
        self.wait_for_another_time(pathlib.Path(os.fsdecode(folder + b"/\xff.so")))
        os.utime(folder + b"/\xff.so")
        self.assertEqual(are_remembered(), [False, True])

    def test_other_options_run_again_and_both_results_stay(self):
        plugin = self.plugin()
        for options in [["--step-limit", "19"], ["--limit", "60"], ["--memory", MEMORY], ["--repeat", "2"],
                        ["--describe"], ["--display"]]:
            with self.subTest(options=options):
                self.assertFalse(self.is_remembered(*options, plugin))
                self.assertTrue(self.is_remembered(*options, plugin))
        self.assertFalse(self.is_remembered(plugin))
        self.assertTrue(self.is_remembered("--memory", MEMORY, "-j", "7", "--no-progress", plugin))
        self.assertEqual(self.result("--repeat", "2", plugin)["repetitions"]["runs"], 2)
        self.assertIn("description", self.result("--describe", plugin))
        self.assertFalse(self.is_remembered(plugin, environment={"LD_LIBRARY_PATH": "/lib"}))

    def test_fresh_runs_again_and_remembers(self):
        plugin = self.plugin()
        for _ in range(2):
            self.assertFalse(self.is_remembered("--fresh", plugin))
        self.assertTrue(self.is_remembered(plugin))
        self.assertEqual(self.rows("SELECT count(*) FROM results"), [(2,)])

    def test_off_and_a_file_of_ones_own(self):
        plugin = self.plugin()
        self.assertFalse(self.is_remembered(plugin, cache="off"))
        self.assertFalse(self.database.parent.exists())
        self.assertFalse(self.is_remembered(plugin, cache="mine.sqlite"))
        self.assertTrue(self.is_remembered(plugin, cache=self.folder / "mine.sqlite"))
        self.assertFalse(self.is_remembered(plugin, environment={"XDG_CACHE_HOME": str(self.folder / "xdg")}))
        self.assertTrue((self.folder / "xdg/vsttorture/results.sqlite").exists())

    def test_lists_are_applied_to_what_is_remembered(self):
        plugin = self.plugin("open_crashes.so")
        expect = self.write("expect", "plugin.so\tcrashed\t-\tknown\n")
        self.assertFalse(self.result("--expect", expect, plugin)["isRemembered"])
        remembered = self.result(plugin, status=1)
        self.assertEqual((remembered["isRemembered"], remembered["isWanted"], remembered["expected"]),
                         (True, False, None))
        remembered = self.result("--expect", expect, plugin, status=0)
        self.assertEqual((remembered["isRemembered"], remembered["isWanted"]), (True, True))
        skip = self.write("skip", "plugin.so\tslow\n")
        self.assertEqual(self.result("--skip", skip, plugin, status=0)["verdict"], "skipped")
        self.assertTrue(self.is_remembered(plugin))

    def test_the_command_is_that_of_today(self):
        plugin = self.plugin()
        workers = pathlib.Path(self.result(plugin)["command"][0]).parent
        (self.folder / "link").symlink_to(workers)
        result = self.result("--workers", self.folder / "link", plugin)
        self.assertTrue(result["isRemembered"])
        self.assertEqual(result["command"], [str(self.folder / "link/vsttorture-worker"), str(plugin)])

    def test_a_child_that_is_not_known_is_run_alone(self):
        shell = self.plugin("shell.so")
        self.scan(shell)
        self.run_sql("DELETE FROM results WHERE child = 1234")
        results = self.results(shell, status=0)
        self.assertEqual({name: event["isRemembered"] for name, event in results.items()},
                         {"plugin.so": True, "plugin.so#1001": True, "plugin.so#1234": False, "plugin.so#-7": True})
        self.assertTrue(all(event["isRemembered"] for event in self.results(shell).values()))

    def test_what_is_skipped_of_a_known_shell_stays_skipped(self):
        shell = self.plugin("shell.so")
        self.scan(shell)
        skip = self.write("skip", "plugin.so#1234\tslow\n")
        results = self.results("--skip", skip, shell, status=0)
        self.assertEqual({name: event["verdict"] for name, event in results.items()},
                         {"plugin.so": "shell", "plugin.so#1001": "passed", "plugin.so#1234": "skipped",
                          "plugin.so#-7": "passed"})

    def test_an_event_that_cannot_be_read_or_is_of_another_plugin_is_had_again(self):
        plugin = self.plugin()
        self.scan(plugin)
        for damage in ["substr(event, 1, 100)", "replace(event, '/plugin.so', '/other.so')",
                       "replace(event, '\"passed\"', '\"failed\"')", "replace(event, ',', char(10) || ',')"]:
            with self.subTest(damage=damage):
                self.run_sql(f"UPDATE results SET event = {damage}")
                self.assertFalse(self.is_remembered(plugin, status=0))
                self.assertTrue(self.is_remembered(plugin, status=0))

    def test_an_interrupted_run_is_no_answer(self):
        plugin = self.plugin("faulty.so")
        process = subprocess.Popen([scan_test_case.SCAN, "--sandbox", "off", "--json", self.folder / "events", plugin],
                                   env=self.environment(**HANG), stdin=subprocess.DEVNULL, stdout=subprocess.DEVNULL,
                                   stderr=subprocess.DEVNULL)
        deadline = time.monotonic() + 30
        events = self.folder / "events"
        while time.monotonic() < deadline and not (events.exists() and "run_started" in events.read_text()):
            time.sleep(0.02)
        process.send_signal(signal.SIGINT)
        self.assertEqual(process.wait(30), 130)
        self.assertEqual(self.rows("SELECT count(*) FROM results"), [(0,)])
        self.assertEqual(self.rows("SELECT status, isInterrupted FROM scans"), [(130, 1)])


class Comparisons(RememberingTest):
    def change(self, *arguments, **more):
        comparison = self.result(*arguments, **more)["comparison"]
        return comparison and comparison["change"]

    def test_what_is_new_still_failing_and_mended(self):
        plugin = self.plugin("faulty.so")
        self.assertIsNone(self.result(plugin, status=0)["comparison"])
        plugin = self.plugin("faulty.so")
        result = self.result(plugin, environment=CRASH, status=1)
        self.assertEqual(result["comparison"]["change"], "new")
        self.assertEqual(result["comparison"]["earlier"]["verdict"], "passed")
        plugin = self.plugin("faulty.so")
        self.assertEqual(self.change(plugin, environment=CRASH, status=1), "still_failing")
        self.assertEqual(self.change(plugin, environment=CRASH, status=1), "still_failing")
        plugin = self.plugin("faulty.so")
        self.assertEqual(self.change(plugin, status=0), "mended")
        self.assertEqual(self.change(plugin, status=0), "none")
        self.assertEqual(self.change(self.plugin("open_crashes.so", "other.so"), status=1), "new")

    def test_another_end_of_the_same_file_is_flaky(self):
        plugin = self.plugin("faulty.so")
        self.scan(plugin)
        self.assertEqual(self.change("--fresh", plugin, environment=CRASH, status=1), "flaky")
        self.assertEqual(self.change("--fresh", plugin, status=0), "flaky")

    def test_findings_of_a_tool_are_new_until_they_have_been_seen(self):
        # The tool finds something while the file is there.
        found = self.folder / "found"
        under = ["--under", f"sh -c 'test -e {found} && exit 99; exec \"$@\"' x"]
        self.result(*under, self.plugin(), status=0)
        found.touch()
        for change in ("new", "still_failing"):
            self.result(self.plugin(), status=0)  # A scan without the tool says nothing about its findings.
            self.assertEqual(self.change(*under, self.plugin(), status=1), change)
        self.assertEqual(self.change(*under, self.folder / "plugin.so", status=1), "still_failing")
        found.unlink()
        self.assertEqual(self.change(*under, self.plugin(), status=0), "mended")

    def test_are_told_on_the_terminal(self):
        self.scan(self.plugin("faulty.so"))
        self.assertIn('\n  new: it was "passed" before\n', self.scan(self.plugin("faulty.so"), environment=CRASH).stdout)
        plugin = self.plugin("faulty.so")
        self.assertIn("\n  still failing\n", self.scan(plugin, environment=CRASH).stdout)
        flaky = self.scan("--fresh", plugin).stdout
        self.assertRegex(flaky, r'\n  flaky: it was "crashed[^"]*" before, and nothing has changed since\n')
        self.scan(self.plugin("faulty.so"), environment=CRASH)
        self.assertIn("\nmended: plugin.so\n1 result: 1 passed", self.scan(self.plugin("faulty.so")).stdout)


class Databases(RememberingTest):
    def assert_scanned(self, result, sentence):
        """All is well with the scan itself, and one sentence is said."""
        self.assertEqual(result.returncode, 0, result.stderr)
        self.assertRegex(result.stdout, r"\n1 result: 1 passed")
        self.assertRegex(result.stderr, rf"^vsttorture-scan: {sentence}\n$")

    @property
    def file(self):
        """The database, as a part of a regular expression."""
        return re.escape(str(self.database))

    def test_a_damaged_one_is_renamed_and_said(self):
        plugin = self.plugin()
        self.database.parent.mkdir(parents=True)
        self.database.write_bytes(b"no database" * 1000)
        result = self.scan(plugin)
        self.assert_scanned(result, rf"{self.file} is damaged \(file is not a database\); it is now called "
                                    rf"{self.file}\.damaged-1, and a new one was begun")
        self.assertTrue(self.is_remembered(plugin))

    def test_one_of_a_newer_version_is_left_alone(self):
        plugin = self.plugin()
        self.scan(plugin)
        self.run_sql("PRAGMA user_version = 1000")
        before = self.database.read_bytes()
        self.assert_scanned(self.scan(plugin), f"nothing is remembered: {self.file} was made by a newer "
                                               r"vsttorture-scan: its tables have version 1000, and this one knows \d+")
        self.assertEqual(self.database.read_bytes(), before)

    def test_a_locked_one(self):
        plugin = self.plugin()
        self.scan(plugin)
        with contextlib.closing(sqlite3.connect(self.database, isolation_level=None)) as other:
            other.execute("PRAGMA locking_mode = EXCLUSIVE")
            other.execute("BEGIN EXCLUSIVE")
            other.execute("UPDATE scans SET machine = 'x'")
            self.assert_scanned(self.scan(plugin),
                                f"nothing is remembered: {self.file}: another program has locked it")

    def test_one_that_cannot_be_written_to_is_still_read(self):
        def become_nobody():
            if os.geteuid() == 0:
                os.setgroups([])
                os.setgid(NOBODY)
                os.setuid(NOBODY)
        plugin = self.plugin()
        self.scan(plugin)
        self.folder.chmod(0o755)
        read_only = self.folder / "read_only"
        read_only.mkdir()
        copy = read_only / "results.sqlite"
        shutil.copy(self.database, copy)
        copy.chmod(0o444)
        read_only.chmod(0o555)
        self.addCleanup(read_only.chmod, 0o755)
        try:
            result = self.scan(plugin, cache=copy, preexec_fn=become_nobody)
        except (PermissionError, subprocess.SubprocessError):
            self.skipTest("the program cannot be run by another user")
        self.assert_scanned(result, f"the results of this scan are not remembered: {re.escape(str(copy))} cannot be "
                                    "written to")
        self.assertIn("; all remembered", result.stdout)
        self.assertEqual(os.listdir(read_only), ["results.sqlite"])

    def test_a_folder_that_cannot_be_made(self):
        self.assert_scanned(self.scan(self.plugin(), environment={"HOME": "/proc/nowhere"}),
                            "nothing is remembered: /proc/nowhere: No such file or directory")

    def test_no_home(self):
        self.assert_scanned(self.scan(self.plugin(), environment={"HOME": ""}),
                            "nothing is remembered: neither XDG_CACHE_HOME nor HOME is set")

    def test_a_full_disk_keeps_the_verdicts(self):
        full = self.folder / "full"
        full.mkdir()
        script = 'mount -t tmpfs -o size=256k none "$1" || exit 77; shift; exec "$@"'
        result = subprocess.run(["unshare", "-rm", "sh", "-c", script, "sh", full, scan_test_case.SCAN, "--sandbox",
                                 "off", "-j", "1", "--cache", full / "cache", self.copies(100)],
                                env=self.environment(), capture_output=True, text=True, timeout=120, check=False)
        if result.returncode == 77 or "unshare" in result.stderr:
            self.skipTest(f"no small file system can be mounted: {result.stderr}")
        self.assertEqual(result.returncode, 0, result.stderr)
        self.assertIn("100 results: 100 passed", result.stdout)
        self.assertEqual(result.stderr, f"vsttorture-scan: results are no longer remembered: {full}/cache: the disk "
                                        "is full\n")

    def test_a_limit_for_the_size_of_files_keeps_the_verdicts(self):
        limit = 64 << 10
        result = self.scan("-j", "1", self.copies(30),
                           preexec_fn=lambda: resource.setrlimit(resource.RLIMIT_FSIZE, (limit, limit)))
        self.assertEqual(result.returncode, 0, result.stderr)
        self.assertIn("30 results: 30 passed", result.stdout)
        self.assertRegex(result.stderr, "^vsttorture-scan: results are no longer remembered: "
                                        f"{self.file}: (the disk is full|disk I/O error)\n$")
        again = self.results(self.folder / "copies", status=0)
        self.assertEqual(len(again), 30)
        remembered = sum(event["isRemembered"] for event in again.values())
        self.assertTrue(0 < remembered < 30, remembered)

    def test_two_scans_at_once_remember_all(self):
        folder = self.copies(30)
        command = [scan_test_case.SCAN, "--sandbox", "off", "--fresh", "--no-progress", "-j", "2", folder]
        scans = [subprocess.Popen(command, env=self.environment(), stdin=subprocess.DEVNULL,
                                  stdout=subprocess.DEVNULL, stderr=subprocess.PIPE) for _ in range(2)]
        for scan in scans:
            self.assertEqual((scan.communicate(timeout=120)[1], scan.returncode), (b"", 0))
        self.assertEqual(self.rows("SELECT scan, count(*) FROM results GROUP BY scan"), [(1, 30), (2, 30)])
        self.assertEqual(self.rows("PRAGMA integrity_check"), [("ok",)])

    def test_a_reader_sees_results_while_a_scan_runs(self):
        folder = self.copies(100)
        scan = subprocess.Popen([scan_test_case.SCAN, "--sandbox", "off", "--no-progress", "-j", "1", folder],
                                env=self.environment(), stdin=subprocess.DEVNULL, stdout=subprocess.DEVNULL,
                                stderr=subprocess.PIPE)
        seen = set()
        while scan.poll() is None:
            with contextlib.suppress(sqlite3.OperationalError):  # It is not there yet.
                seen.add(self.rows("SELECT count(*) FROM latest WHERE verdict = 'passed'")[0][0])
        self.assertEqual((scan.communicate()[1], scan.returncode), (b"", 0))
        self.assertGreater(len(seen - {0, 100}), 3)
        self.assertEqual(self.rows("SELECT count(*) FROM latest"), [(100,)])
        self.assertEqual(len(json.loads(self.rows("SELECT event FROM latest")[0][0])["steps"]), 65)


class History(RememberingTest):
    def history(self, *arguments, status=0):
        result = subprocess.run([scan_test_case.SCAN, "history", *map(str, arguments)],
                                env=self.environment(TZ="UTC"), cwd=self.folder, capture_output=True, text=True,
                                timeout=60, check=False)
        self.assertEqual(result.returncode, status, result.stderr)
        return result.stdout if status == 0 else result.stderr

    def test_of_scans(self):
        self.scan(self.plugin("faulty.so"), self.plugin("open_crashes.so", "other.so"))
        self.scan(self.folder / "plugin.so", self.folder / "other.so")
        self.scan(self.plugin("faulty.so"), environment=CRASH)
        when = r"\d{4}-\d\d-\d\d \d\d:\d\d  \S+  \d+\.\d+\.\d+  "
        self.assertRegex(self.history(), rf"^{when}1 crashed; 1 new\n{when}1 passed, 1 crashed; 1 still failing\n"
                                         rf"{when}1 passed, 1 crashed\n$")

    def test_of_a_plugin(self):
        plugin = self.plugin("faulty.so")
        self.scan(plugin, self.plugin())
        self.scan(self.plugin("faulty.so"), environment=CRASH)
        when = r"  \d{4}-\d\d-\d\d \d\d:\d\d  "
        expected = (rf"^{re.escape(str(plugin))} \(x86_64\)\n{when}crashed +[\d.]+ m?s  \d+\.\d+\.\d+  .*SIGSEGV.*\n"
                    rf"{when}passed +[\d.]+ m?s  \d+\.\d+\.\d+\n$")
        for name in (plugin, "plugin.so", "./plugin.so", "plugin"):
            with self.subTest(name=name):
                self.assertRegex(self.history(name), expected)

    def test_of_the_children_of_a_shell(self):
        self.scan(self.plugin("shell.so"))
        text = self.history("plugin.so")
        for child in (" (x86_64)\n", " #1001 ", " #1234 ", " #-7 "):
            self.assertIn(f"plugin.so{child}", text)

    def test_of_a_scan_that_was_killed(self):
        self.scan(self.plugin())
        self.run_sql("UPDATE scans SET endedAt = NULL, counts = NULL")
        self.assertRegex(self.history(), r"  1 passed; did not end\n$")

    def test_says_why_there_is_nothing(self):
        self.assertEqual(self.history(status=2), "vsttorture-scan: nothing is remembered yet: there is no "
                                                 f"{self.database}\n")
        self.scan(self.plugin())
        self.assertEqual(self.history("other", status=2), 'vsttorture-scan: no result of a plug-in called "other" is '
                                                          f"remembered in {self.database}\n")
        self.assertIn("--nonsense", self.history("--nonsense", status=2))
        self.run_sql("PRAGMA user_version = 1000")
        self.assertIn("was made by a newer vsttorture-scan", self.history(status=3))
        self.database.write_text("no database" * 1000)
        self.assertEqual(self.history(status=3), f"vsttorture-scan: {self.database} cannot be read: it is damaged "
                                                 "(file is not a database)\n")
        self.assertEqual(self.database.read_text(), "no database" * 1000)

    def test_of_a_file_of_ones_own(self):
        self.scan(self.plugin(), cache="mine.sqlite")
        self.assertIn("1 passed", self.history("--cache", "mine.sqlite"))
        self.assertEqual(sorted(path.name for path in self.folder.glob("mine*")), ["mine.sqlite"])

    def test_that_cannot_be_written(self):
        self.scan(self.plugin())
        with open("/dev/full", "w", encoding="utf-8") as full:
            result = subprocess.run([scan_test_case.SCAN, "history"], env=self.environment(), stdout=full,
                                    stderr=subprocess.PIPE, text=True, timeout=60, check=False)
        self.assertEqual((result.returncode, result.stderr),
                         (3, "vsttorture-scan: standard output: No space left on device\n"))

    def test_shows_no_control_codes_of_others(self):
        name = self.folder / "\x1b[31mred.so"
        shutil.copy(scan_test_case.PLUGINS / EFFECT, name)
        self.scan(name)
        self.assertNotIn("\x1b", self.history("red.so"))


if __name__ == "__main__":
    sys.exit(scan_test_case.main())
