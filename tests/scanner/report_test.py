# SPDX-License-Identifier: MIT
"""Runs the real `vsttorture-scan report`, and the reports of a scan, on recorded and altered scans.

    report_test.py --scan build/release/vsttorture-scan --plugins build/release/plugins [TEST...]

The tests of the class Junit read the XML with the Python package junitparser. When these alone are asked for and the
package is missing, the status is 77.
"""
import json
import os
import pathlib
import re
import shlex
import shutil
import stat
import subprocess
import sys
import time
import unittest

import scan_program_test
import scan_test_case
from scan_program_test import NOTHING_TO_CHECK_WITH, SET_SAMPLE_RATE
from scan_test_case import EFFECT, PLAIN, ScanTest

# Another Python than Debian's can use Debian's package, but does not look there.
DEBIANS_PACKAGES = "/usr/lib/python3/dist-packages"
sys.path.append(DEBIANS_PACKAGES)
try:
    import junitparser
except ImportError:
    junitparser = None
sys.path.remove(DEBIANS_PACKAGES)

CRASH = {"FAULT_KIND": "null_store", "FAULT_PLACE": SET_SAMPLE_RATE}
EXIT = {"FAULT_KIND": "exit", "FAULT_PLACE": SET_SAMPLE_RATE}
TIMES = {"time", "wallSeconds"}


def plugins():
    return scan_test_case.PLUGINS


def without_times(event):
    return {name: value for name, value in event.items() if name not in TIMES}


class ReportTest(ScanTest):
    def record(self, name, *arguments, **more):
        """The file with the events of a scan."""
        self.scan("--json", self.folder / name, *arguments, **more)
        return self.folder / name

    def read(self, path):
        return [json.loads(line) for line in path.read_text().splitlines()]

    def rewrite(self, path, events):
        path.write_text("".join(json.dumps(event) + "\n" for event in events))
        return path

    def report(self, *arguments, **more):
        more.setdefault("stdout", subprocess.PIPE)
        more.setdefault("stdin", subprocess.DEVNULL)
        return subprocess.run([scan_test_case.SCAN, "report", *map(str, arguments)], env=self.environment(),
                              cwd=self.folder, stderr=subprocess.PIPE, text=True, timeout=60, check=False, **more)

    def merged(self, *files, status):
        """The events of the merged report, and what standard error says before the report for people."""
        result = self.report("--json", self.folder / "merged", *files)
        self.assertEqual(result.returncode, status, result.stderr)
        return self.read(self.folder / "merged"), result.stderr

    def changes(self, events):
        return {os.path.basename(event["plugin"]["bundle"]): event["comparison"]["change"] for event in events
                if event["event"] == "plugin_ended"}


class Merging(ReportTest):
    def test_the_parts_of_a_scan_make_the_report_of_one_machine(self):
        whole = self.read(self.record("whole", "--describe", plugins()))
        started, *rest, ended = whole
        results = [event for event in rest if event["event"] == "plugin_ended"]
        parts = []
        for part in (1, 2, 3):
            mine = [event for event in results if len(event["plugin"]["bundle"]) % 3 == part - 1]
            own = sum(event["plugin"]["child"] is None for event in mine)
            unwanted = sum(not event["isWanted"] for event in mine)
            parts.append(self.rewrite(self.folder / f"part{part}", [
                {**started, "shard": {"part": part, "parts": 3}, "plugins": own, "time": part},
                *reversed(mine), {**ended, "unwanted": unwanted, "status": int(unwanted > 0)}]))
        expected, errors = self.merged(self.folder / "whole", status=1)
        self.assertEqual(errors, "")
        merged, errors = self.merged(parts[2], parts[0], parts[1], status=1)
        self.assertEqual(errors, "")
        self.assertEqual(without_times(merged[0]), without_times(expected[0]))
        self.assertEqual(merged[1:-1], expected[1:-1])
        self.assertEqual(without_times(merged[-1]), without_times(expected[-1]))
        keys = [(event["plugin"]["bundle"], event["plugin"]["child"]) for event in merged[1:-1]]
        self.assertEqual(keys, sorted(keys, key=lambda key: (key[0], key[1] is not None, key[1] or 0)))
        self.assertEqual(sorted(map(json.dumps, merged[1:-1])), sorted(map(json.dumps, results)))

    def test_real_parts_have_the_verdicts_of_the_whole(self):
        # Those whose end depends on the tests that are drawn would make two scans differ.
        random = self.write("random", "crashes_after_two_states.so\tits end depends on the order of the tests\n")
        parts = [self.record(f"part{part}", "--skip", random, "--shard", f"{part}/2", plugins()) for part in (1, 2)]
        merged, errors = self.merged(*parts, status=1)
        self.assertEqual(errors, "")
        whole = self.events("--skip", random, plugins())
        self.assertEqual({(event["plugin"]["bundle"], event["plugin"]["child"]): event["verdict"]
                          for event in merged[1:-1]},
                         {(event["plugin"]["bundle"], event["plugin"]["child"]): event["verdict"]
                          for event in whole if event["event"] == "plugin_ended"})
        self.assertEqual(merged[0]["plugins"], whole[0]["plugins"])
        self.assertEqual(merged[-1]["counts"], whole[-1]["counts"])

    def test_a_merged_report_can_be_merged_again(self):
        first, _ = self.merged(self.record("whole", plugins() / EFFECT, plugins() / "shell.so"), status=0)
        shutil.copy(self.folder / "merged", self.folder / "again")
        self.assertEqual(self.merged(self.folder / "again", status=0)[0], first)

    def test_a_missing_part_is_named_and_is_no_pass(self):
        part = self.record("part", plugins() / EFFECT)
        events = self.read(part)
        events[0]["shard"] = {"part": 2, "parts": 2}
        merged, errors = self.merged(self.rewrite(part, events), status=1)
        self.assertEqual(errors, "vsttorture-scan: missing: part 1 of 2\n")
        self.assertEqual(merged[0]["notes"], ["missing: part 1 of 2"])
        self.assertEqual(merged[-1]["status"], 1)

    def test_broken_lines_are_named_with_file_and_line(self):
        file = self.record("results", plugins() / EFFECT)
        lines = file.read_text().split("\n")
        lines.insert(1, '{"event":"plugin_ended"}')
        file.write_text("\n".join(lines) + "\x00\x1b[2J")
        result = self.report("results")
        self.assertEqual(result.returncode, 1)
        self.assertEqual(result.stderr, 'vsttorture-scan: results, line 2: "plugin" is no object\n'
                                        "vsttorture-scan: results, line 6: it is no JSON\n")

    def test_standard_input_is_read_too(self):
        file = self.record("results", plugins() / EFFECT)
        with open(file, encoding="utf-8") as stream:
            result = self.report("-", stdin=stream)
        self.assertEqual(result.returncode, 0, result.stderr)
        self.assertIn("1 result: 1 passed", result.stdout)

    def test_the_report_for_people_is_that_of_the_scan(self):
        scan = self.scan("--json", "results", plugins() / "open_crashes.so")
        report = self.report("results")
        self.assertEqual(report.stdout, scan.stdout)
        self.assertEqual((report.returncode, report.stderr), (1, ""))
        self.assertEqual(len(self.report("--quiet", self.record("good", plugins() / EFFECT)).stdout.splitlines()), 1)


class WrongUse(ReportTest):
    def assert_ends(self, sentence, *arguments, **more):
        result = self.report(*arguments, **more)
        self.assertEqual(result.returncode, 2, result.stderr)
        self.assertIn(sentence, result.stderr)
        self.assertEqual(result.stdout, "")

    def test_what_is_no_stream_of_events(self):
        good = self.record("good", plugins() / EFFECT)
        self.write("empty", "")
        self.write("text", "passed  a.so\n")
        self.write("later", good.read_text().replace('"format":1', '"format":2'))
        self.write("headless", "".join(good.read_text().splitlines(True)[1:]))
        for file, sentence in {
                "gone": "gone: No such file or directory", ".": ".: Is a directory",
                "empty": "empty is no stream of events: it is empty",
                "text": "text is no stream of events: line 1: it is no JSON",
                "later": "later is no stream of events: line 1: its format is 2, not 1",
                "headless": "headless is no stream of events: line 1: no scan is under way there",
                "/dev/zero": "/dev/zero is no stream of events: line 1: it is longer than 16 MiB",
                "-": "standard input is no stream of events: it is empty"}.items():
            with self.subTest(file=file):
                self.assert_ends(sentence, good, file)

    def test_the_command_line(self):
        good = self.record("good", plugins() / EFFECT)
        self.assert_ends("FILE is required")
        self.assert_ends("--lunch", "--lunch", good)
        self.assert_ends("standard input can be read once only", "-", "-")
        for first, second in [("--json", "--junit"), ("--json", "--html"), ("--junit", "--html")]:
            self.assert_ends("only one report can go to standard output", first, "-", second, "-", good)
            result = self.scan(first, "-", second, "-", plugins() / EFFECT)
            self.assertEqual((result.returncode, result.stdout), (2, ""))
            self.assertIn("only one report can go to standard output", result.stderr)

    def test_every_option_of_the_help_is_completed(self):
        text = self.report("--help").stdout
        self.assertIn("vsttorture-scan report [OPTIONS] FILE...", text)
        complete = scan_program_test.Completion.completions
        self.assertEqual(set(complete(self, "report", "--")), set(re.findall(r"(?<![\w-])--[a-z]+", text)) | {"--help"})
        self.assertEqual(complete(self, "rep"), ["report"])

    def test_nothing_is_written(self):
        earlier = self.write("results.xml", "earlier\n")
        self.assert_ends("gone", "--junit", earlier, "gone")
        self.assertEqual(earlier.read_text(), "earlier\n")


class Files(ReportTest):
    def names(self):
        return sorted(path.name for path in self.folder.iterdir())

    def test_a_report_that_cannot_be_written_keeps_the_verdicts_on_the_terminal(self):
        file = self.record("results", plugins() / EFFECT)
        for target, reason in [("/proc/nowhere/x", "No such file or directory"), ("/dev/full", "No space left on device"),
                               ("home", "Is a directory")]:
            for option in ("--junit", "--json", "--html"):
                with self.subTest(option=option, target=target):
                    result = self.report(option, target, file)
                    self.assertEqual(result.returncode, 3)
                    self.assertIn("1 result: 1 passed", result.stdout)
                    self.assertEqual(result.stderr,
                                     f"vsttorture-scan: a report could not be written: {target}: {reason}\n")
            for option in ("--junit", "--html"):
                result = self.scan(option, target, plugins() / EFFECT)
                self.assertEqual(result.returncode, 3)
                self.assertIn("1 result: 1 passed", result.stdout)
                self.assertIn(f"a report could not be written: {target}: {reason}", result.stderr)
        self.assertEqual(self.names(), ["home", "results"])

    def test_a_disk_that_becomes_full_leaves_the_earlier_report(self):
        results = self.record("results", plugins())
        earlier = self.write("report.xml", "earlier\n")
        command = ["bash", "-c", 'trap "" XFSZ; ulimit -f 2; exec "$@"', "bash", scan_test_case.SCAN, "report",
                   "--junit", earlier, results]
        result = subprocess.run(command, env=self.environment(), capture_output=True, text=True, timeout=60, check=False)
        self.assertEqual(result.returncode, 3)
        self.assertIn("report.xml: File too large", result.stderr)
        self.assertEqual(earlier.read_text(), "earlier\n")
        self.assertEqual(self.names(), ["home", "report.xml", "results"])

    def test_a_report_replaces_the_earlier_one_behind_a_link_and_keeps_its_mode(self):
        results = self.record("results", plugins() / EFFECT)
        target = self.write("target.xml", "earlier\n")
        target.chmod(0o640)
        link = self.folder / "link.xml"
        link.symlink_to("target.xml")
        self.assertEqual(self.report("--junit", link, results).returncode, 0)
        self.assertTrue(link.is_symlink())
        self.assertIn("<testsuites", target.read_text())
        self.assertEqual(stat.S_IMODE(target.stat().st_mode), 0o640)
        self.assertEqual(self.names(), ["home", "link.xml", "results", "target.xml"])

    def test_a_device_stays_one(self):
        self.assertEqual(self.report("--junit", "/dev/null", self.record("a", plugins() / EFFECT)).returncode, 0)
        self.assertTrue(stat.S_ISCHR(os.stat("/dev/null").st_mode))

    def test_the_merged_events_may_replace_what_was_merged(self):
        results = self.record("results", plugins() / EFFECT)
        self.assertEqual(self.report("--json", results, results).returncode, 0)
        self.assertEqual([event["event"] for event in self.read(results)],
                         ["scan_started", "plugin_ended", "scan_ended"])

    def test_standard_output_holds_the_report_alone(self):
        file = self.record("a", plugins() / EFFECT)
        for option, whole in [("--junit", r"(?s)\A<\?xml .*</testsuites>\n\Z"),
                              ("--html", r"(?s)\A<!DOCTYPE html>.*</html>\n\Z")]:
            for result in (self.scan(option, "-", plugins() / EFFECT), self.report(option, "-", file)):
                self.assertRegex(result.stdout, whole)
                self.assertIn("1 result: 1 passed", result.stderr)
        result = self.report("--json", "-", self.folder / "a")
        self.assertEqual([json.loads(line)["event"] for line in result.stdout.splitlines()],
                         ["scan_started", "plugin_ended", "scan_ended"])

    def test_a_scan_that_nobody_reads_still_writes_its_report(self):
        result = self.scan_without_reader("-j", "1", "--junit", "report.xml", self.copies(20))
        self.assertEqual(result.returncode, 3)
        self.assertEqual((self.folder / "report.xml").read_text().count("<testcase "), 20)


class Baselines(ReportTest):
    def compared(self, environment, *arguments, baseline, status):
        """The change of each plug-in in a scan, and in the report of the same results."""
        events = self.events("--baseline", baseline, *arguments, environment=environment, status=status)
        plain = self.record("plain", *arguments, environment=environment)
        result = self.report("--json", "-", "--baseline", baseline, plain)
        self.assertEqual(result.returncode, status, result.stderr)
        again = [json.loads(line) for line in result.stdout.splitlines()]
        self.assertEqual(self.changes(again), self.changes(events))
        self.assertEqual(again[-1]["unwanted"], events[-1]["unwanted"])
        self.assertEqual(again[0]["notes"], events[0]["notes"])
        return self.changes(events), events

    def test_only_what_is_new_fails(self):
        faulty = plugins() / "faulty.so"
        baseline = self.record("baseline", faulty, plugins() / EFFECT, environment=CRASH)
        changes, events = self.compared(CRASH, faulty, plugins() / EFFECT, baseline=baseline, status=0)
        self.assertEqual(changes, {"faulty.so": "still_failing", EFFECT: "none"})
        self.assertEqual(events[-1]["counts"], {"crashed": 1, "passed": 1})
        changes, _ = self.compared(EXIT, faulty, plugins() / EFFECT, baseline=baseline, status=1)
        self.assertEqual(changes, {"faulty.so": "new", EFFECT: "none"})
        changes, _ = self.compared({}, faulty, plugins() / EFFECT, baseline=baseline, status=0)
        self.assertEqual(changes, {"faulty.so": "mended", EFFECT: "none"})
        changes, events = self.compared({}, faulty, plugins() / "open_crashes.so", baseline=baseline, status=1)
        self.assertEqual(changes, {"faulty.so": "mended", "open_crashes.so": "new"})

    def test_what_is_gone_is_named(self):
        copies = self.copies(3)
        shutil.copy(plugins() / "shell.so", copies)
        baseline = self.record("baseline", copies)
        (copies / "001.so").unlink()
        _, events = self.compared({}, copies, baseline=baseline, status=0)
        self.assertEqual(events[0]["notes"], [f"gone since the baseline: {copies}/001.so"])
        # Of what is not looked for nothing is gone.
        self.assertEqual(self.events("--baseline", baseline, copies / "000.so", status=0)[0]["notes"], [])

    def test_a_folder_that_has_moved_has_the_same_plugins(self):
        # A CI system checks out into another folder for each job.
        build = self.folder / "job1/build"
        build.mkdir(parents=True)
        for name in ("faulty.so", "shell.so", EFFECT):
            shutil.copy(plugins() / name, build)
        baseline = self.record("baseline", build, environment=CRASH)
        os.rename(self.folder / "job1", self.folder / "job2")
        build = self.folder / "job2/build"
        (build / EFFECT).unlink()
        shutil.copy(plugins() / "open_crashes.so", build)
        _, events = self.compared(CRASH, build, baseline=baseline, status=1)
        changes = {(os.path.basename(event["plugin"]["bundle"]), event["plugin"]["child"]):
                   (event["comparison"]["change"], event["comparison"]["earlier"] is not None)
                   for event in events if event["event"] == "plugin_ended"}
        self.assertEqual(changes, {("faulty.so", None): ("still_failing", True),
                                   ("open_crashes.so", None): ("new", False),
                                   **{("shell.so", child): ("none", True) for child in (None, 1001, 1234, -7)}})
        self.assertEqual(events[0]["notes"], [f"gone since the baseline: {self.folder}/job1/build/{EFFECT}"])
        # A file that is named is found, too.
        changes, _ = self.compared(CRASH, build / "faulty.so", baseline=baseline, status=0)
        self.assertEqual(changes, {"faulty.so": "still_failing"})

    def test_the_children_of_a_shell_that_are_gone_are_named_at_the_end(self):
        events = self.read(self.record("baseline", plugins() / "shell.so"))
        extra = json.loads(json.dumps(events[-2]))
        extra["plugin"].update(child=42, childName="Lost")
        baseline = self.rewrite(self.folder / "baseline", [*events[:-1], extra, events[-1]])
        result = self.scan("--baseline", baseline, plugins() / "shell.so")
        self.assertEqual(result.returncode, 0)
        self.assertIn(f"gone since the baseline: {plugins()}/shell.so #42 Lost\n", result.stderr)

    def test_a_baseline_that_is_no_stream_of_events_stops_everything(self):
        good = self.record("good", plugins() / EFFECT)
        self.write("text", "lunch\n")
        for file, sentence in {"gone": "baseline: gone: No such file or directory",
                               "text": "baseline: text is no stream of events: line 1: it is no JSON"}.items():
            with self.subTest(file=file):
                for result in (self.scan("--baseline", file, "--json", "results", plugins() / EFFECT),
                               self.report("--baseline", file, "--json", "results", good)):
                    self.assertEqual((result.returncode, result.stdout), (2, ""))
                    self.assertEqual(result.stderr, f"vsttorture-scan: {sentence}\n")
                self.assertFalse((self.folder / "results").exists())

    def test_a_baseline_that_was_cut_off_serves_as_far_as_it_goes(self):
        file = self.record("baseline", plugins() / "open_crashes.so")
        self.rewrite(file, self.read(file)[:-1])
        result = self.scan("--baseline", file, plugins() / "open_crashes.so")
        self.assertEqual(result.returncode, 0, result.stderr)
        self.assert_said(f"baseline: {file} (", result.stdout)
        self.assert_said(") is cut off: the scan was killed", result.stdout)


class Junit(ReportTest):
    @classmethod
    def setUpClass(cls):
        if junitparser is None:
            raise unittest.SkipTest("the Python package junitparser is not installed")

    def suite(self, path):
        suites = list(junitparser.JUnitXml.fromfile(str(path)))
        self.assertEqual(len(suites), 1)
        cases = list(suites[0])
        kinds = [type(result) for case in cases for result in case.result]
        self.assertEqual((suites[0].tests, suites[0].failures, suites[0].errors, suites[0].skipped),
                         (len(cases), kinds.count(junitparser.Failure), kinds.count(junitparser.Error),
                          kinds.count(junitparser.Skipped)))
        self.assertAlmostEqual(suites[0].time, sum(case.time for case in cases), delta=0.001 * len(cases) + 0.001)
        return suites[0], {case.name: case for case in cases}

    def test_a_reader_finds_each_plugin_once_and_why_it_failed(self):
        skip = self.write("skip", "asks_host.so\tslow\n")
        expect = self.write("expect", "open_crashes.so\tcrashed\t-\tknown\nolder_entry.so\thung\n*\tpassed\n"
                                      "shell.so\tshell\n")
        results = self.folder / "results"
        self.scan("--skip", skip, "--expect", expect, "--json", results, "--junit", "report.xml", plugins())
        suite, cases = self.suite(self.folder / "report.xml")
        ended = {}
        for event in self.read(results):
            if event["event"] == "plugin_ended":
                child, child_name = event["plugin"]["child"], event["plugin"]["childName"]
                name = os.path.basename(event["plugin"]["bundle"])
                ended[name if child is None else f"{name} #{child} {child_name}"] = event
        self.assertEqual(set(cases), set(ended))
        for name, event in ended.items():
            self.assertEqual(cases[name].classname, str(plugins()))
            failed = [type(result) for result in cases[name].result if not isinstance(result, junitparser.Skipped)]
            self.assertEqual(bool(failed), not event["isWanted"], name)
            self.assertEqual([result.type for result in cases[name].result
                              if isinstance(result, junitparser.Failure)],
                             [] if event["isWanted"] else
                             ["unexpected" if event["verdict"] in ("passed", "shell") else event["verdict"]])
        self.assertEqual([result.message for result in cases["asks_host.so"].result], ["slow"])
        self.assertIn("as expected: crashed: ", cases["open_crashes.so"].system_out)
        self.assertIn("expected: hung, but passed", cases["older_entry.so"].result[0].message)
        failure = cases["exits_in_test.so"].result[0]
        self.assertEqual(failure.message, "expected: passed, but exited at "
                         f"{ended['exits_in_test.so']['step']['number']}; {ended['exits_in_test.so']['cause']}")
        self.assertIn("again: " + shlex.join(ended["exits_in_test.so"]["command"]), failure.text)
        self.assertRegex(cases[EFFECT].system_out, r"(?m)^ +\d\.\d{6} s  14, initialize$")
        self.assertEqual(suite.hostname, self.read(results)[0]["machine"])

    def test_the_report_of_a_scan_is_that_of_its_record(self):
        self.scan("--describe", "--repeat", "2", "--json", "results", "--junit", "live.xml", plugins())
        self.assertEqual(self.report("--junit", "later.xml", "results").returncode, 1)
        self.assertEqual((self.folder / "live.xml").read_text(), (self.folder / "later.xml").read_text())

    def test_names_and_texts_of_any_bytes(self):
        folder = os.fsencode(self.folder) + b"/<&\x1b]]>\xff\xef\xbf\xbf"
        os.mkdir(folder)
        shutil.copy(plugins() / "faulty.so", folder + b"/\"'\n\x01.so")
        for kind in ("print", "long_texts"):
            self.scan("--junit", "report.xml", os.fsdecode(folder), environment={"FAULT_KIND": kind, "FAULT_PLACE": SET_SAMPLE_RATE})
            _, cases = self.suite(self.folder / "report.xml")
            self.assertEqual(list(cases), ["\"'\n\\x01.so"])
            self.assertEqual(cases["\"'\n\\x01.so"].classname, f"{self.folder}/<&\\x1b]]>\ufffd\ufffd")

    def test_an_interrupted_scan_writes_what_was_seen(self):
        process = subprocess.Popen(
            [scan_test_case.SCAN, *PLAIN, "-j", "1", "--junit", "report.xml", "--json", "results", plugins() / EFFECT,
             plugins() / "faulty.so"], cwd=self.folder, stdin=subprocess.DEVNULL, stdout=subprocess.DEVNULL,
            env=self.environment(FAULT_KIND="hang", FAULT_PLACE=SET_SAMPLE_RATE))
        results = self.folder / "results"
        while not (results.exists() and re.search("run_started.*faulty", results.read_text())):
            self.assertIsNone(process.poll())
            time.sleep(0.02)
        process.send_signal(2)
        self.assertEqual(process.wait(30), 130)
        _, cases = self.suite(self.folder / "report.xml")
        self.assertEqual(type(cases["the scan is whole"].result[0]), junitparser.Error)
        self.assertEqual(type(cases["faulty.so"].result[0]), junitparser.Error)


def main():
    rest = scan_test_case.read_arguments(sys.argv[1:])
    scan_program_test.PLUGINS = scan_test_case.PLUGINS
    if junitparser is None and rest == ["Junit"]:
        print("the Python package junitparser is not installed")
        return NOTHING_TO_CHECK_WITH
    program = unittest.main(argv=[sys.argv[0], *rest], exit=False)
    return 0 if program.result.wasSuccessful() else 1


if __name__ == "__main__":
    sys.exit(main())
