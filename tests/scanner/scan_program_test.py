# SPDX-License-Identifier: MIT
"""Runs the real vsttorture-scan on the sample plug-ins and looks at what its users see.

    scan_program_test.py --scan build/release/vsttorture-scan --plugins build/release/plugins [TEST...]

The tests of the class Events also check each event against docs/schema/, with the Python package jsonschema. When
these alone are asked for and the package is missing, the status is 77.
"""
import json
import os
import pathlib
import pty
import re
import resource
import shutil
import signal
import subprocess
import sys
import time
import unittest

import scan_test_case
from scan_test_case import EFFECT, PLAIN, ROOT, ScanTest

try:
    import jsonschema
except ImportError:
    jsonschema = None

NOTHING_TO_CHECK_WITH = 77
SCHEMAS = ROOT / "docs/schema"
SCAN = PLUGINS = None  # From the command line.
SET_SAMPLE_RATE = "dispatch:10"


class Surroundings(ScanTest):
    def test_as_many_run_at_a_time_as_there_are_processors_that_it_may_use(self):
        few = sorted(os.sched_getaffinity(0))[:1]
        first = self.events(PLUGINS / EFFECT, preexec_fn=lambda: os.sched_setaffinity(0, few))[0]
        self.assertEqual((first["event"], first["jobs"]), ("scan_started", 1))

    def test_a_limit_of_0_for_file_locks_which_runs_are_marked_by(self):
        locks = 10  # RLIMIT_LOCKS, which Python does not name.
        verdicts = self.verdicts(PLUGINS / EFFECT, preexec_fn=lambda: resource.setrlimit(locks, (0, 0)))
        self.assertEqual(verdicts, {EFFECT: "passed"})

    def test_two_scans_at_once_are_told_apart(self):
        folder = self.copies(20)
        arguments = [SCAN, *PLAIN, "-j", "4", "--no-progress", "--json", "-", folder]
        scans = [subprocess.Popen(arguments, env=self.environment(), stdin=subprocess.DEVNULL, stdout=subprocess.PIPE,
                                  stderr=subprocess.DEVNULL) for _ in range(2)]
        for scan in scans:
            events = [json.loads(line) for line in scan.communicate(timeout=120)[0].splitlines()]
            self.assertEqual(scan.returncode, 0)
            verdicts = [event["verdict"] for event in events if event["event"] == "plugin_ended"]
            self.assertEqual(verdicts, ["passed"] * 20)


class WrongUse(ScanTest):
    def assert_ends(self, status, sentence, *arguments, **more):
        result = self.scan(*arguments, **more)
        self.assertEqual(result.returncode, status, result.stderr)
        self.assertIn(sentence, result.stderr)
        self.assertEqual(result.stdout, "")
        # Nothing is left where scratch folders are made.
        self.assertEqual([path for path in self.folder.iterdir() if path.name.startswith("vsttorture-scan-")], [])

    def test_a_path_that_is_not_there(self):
        self.assert_ends(2, "vsttorture-scan: gone: No such file or directory\n", "gone", PLUGINS / EFFECT)

    def test_an_empty_folder_and_one_without_plugins_say_where_it_looked(self):
        (self.folder / "empty").mkdir()
        (self.folder / "texts").mkdir()
        self.write("texts/a.so", "text")
        self.assert_ends(2, "no VST 2.x plug-in was found; looked in empty, texts\n", "empty", "texts")

    def test_without_paths_the_places_are_said(self):
        self.assert_ends(2, "no VST 2.x plug-in was found; looked in /gone, /gone2\n",
                         environment={"VST_PATH": "/gone:/gone2"})

    def test_values_that_make_no_sense(self):
        for arguments in [["-j", "0"], ["-j", "-1"], ["--step-limit", "0"], ["--step-limit", "-3"],
                          ["--step-limit", "nan"], ["--limit", "0"], ["--limit", "inf"], ["--limit", "soon"],
                          ["--memory", "0"], ["--memory", "-5"], ["--repeat", "0"], ["--shard", "0/2"],
                          ["--shard", "3/2"], ["--shard", "1"], ["--shard", "1/2x"], ["--shard", "1/-1"],
                          ["--sandbox", "perhaps"], ["--unknown"]]:
            with self.subTest(arguments=arguments):
                self.assert_ends(2, arguments[0].lstrip("-"), *arguments, PLUGINS / EFFECT, sandbox=None)

    def test_a_broken_list_names_its_line(self):
        self.write("skip", "# comment\na.so\n")
        self.write("expect", "a.so\tpassed\nb.so\tpased\n")
        self.assert_ends(2, "skip, line 2: ", "--skip", "skip", PLUGINS)
        self.assert_ends(2, 'expect, line 2: "pased" is no verdict', "--expect", "expect", PLUGINS)
        self.assert_ends(2, "gone: No such file", "--expect", "gone", PLUGINS)

    def test_earlier_results_stay_when_no_scan_begins(self):
        results = self.write("results", "earlier\n")
        self.assert_ends(2, "gone", "--json", results, "gone")
        self.assertEqual(results.read_text(), "earlier\n")

    def test_no_scratch_folder(self):
        self.assert_ends(3, "no scratch folder can be made in /proc/nowhere: ", PLUGINS / EFFECT,
                         environment={"TMPDIR": "/proc/nowhere"})

    def test_a_sandbox_that_is_required_and_not_there_or_does_not_work(self):
        self.assert_ends(3, "there is no sandbox: bubblewrap (bwrap) is not installed", PLUGINS / EFFECT,
                         sandbox="required", environment={"PATH": "/nowhere"})
        self.write("bwrap", "#!/bin/sh\necho no rights\nexit 1\n").chmod(0o755)
        for disposition in [signal.SIG_DFL, signal.SIG_IGN]:  # Whoever starts the scan may leave either.
            self.assert_ends(3, "there is no sandbox: no rights\n", PLUGINS / EFFECT, sandbox="required",
                             environment={"PATH": f"{self.folder}:/usr/bin:/bin"},
                             preexec_fn=lambda: signal.signal(signal.SIGCHLD, disposition))

    def test_a_file_for_results_that_cannot_be_made(self):
        self.assert_ends(3, "/proc/nowhere/results: No such file", "--json", "/proc/nowhere/results", PLUGINS / EFFECT)

    @unittest.skipIf(list(pathlib.Path("/usr").glob("lib/*/vsttorture/vsttorture-worker")), "workers are installed")
    def test_no_worker(self):
        if SCAN.read_bytes().startswith(b"#!"):
            self.skipTest("a script stands in front of the program, for its sanitizer")
        shutil.copy(SCAN, self.folder / "alone")
        result = subprocess.run([self.folder / "alone", PLUGINS / EFFECT], env=self.environment(), text=True,
                                capture_output=True, timeout=60, check=False)
        self.assertEqual(result.returncode, 3)
        self.assertIn(f"there is no vsttorture-worker; looked in {self.folder}", result.stderr)

    def test_help_and_version_are_no_mistakes(self):
        self.assertRegex(self.scan("--version").stdout, r"^vsttorture-scan \d+\.\d+\.\d+\n$")
        self.assertIn("--expect FILE", self.scan("--help").stdout)


class Workers(ScanTest):
    def test_what_is_not_ours_is_not_used_and_said(self):
        folder = self.folder / "workers"
        folder.mkdir()
        worker = folder / "vsttorture-worker"
        worker.write_text(f"#!/bin/sh\ntouch {self.folder}/was_run\n")
        worker.chmod(0o755)
        result = self.scan("--workers", folder, PLUGINS / EFFECT)
        self.assertEqual(result.returncode, 0)
        self.assert_said(f"{worker} is not used", result.stdout)
        self.assertFalse((self.folder / "was_run").exists())
        shutil.copy("/bin/cat", worker)
        self.assert_said('but says "cat', self.scan("--workers", folder, PLUGINS / EFFECT).stdout)

    def test_a_plugin_for_another_processor_is_not_run(self):
        code = bytearray((PLUGINS / EFFECT).read_bytes())
        code[18:20] = (183).to_bytes(2, "little")
        (self.folder / "arm.so").write_bytes(code)
        result = self.results(self.folder / "arm.so", status=1)["arm.so"]
        self.assertEqual(result["verdict"], "wrong_architecture")
        self.assertEqual(result["cause"], "built for Linux on aarch64, for which no worker is installed")
        self.assertEqual(result["command"], [])


class Verdicts(ScanTest):
    def test_each_sample_plugin_gets_its_word(self):
        verdicts = self.verdicts(PLUGINS, status=1)
        self.assertEqual(verdicts[EFFECT], "passed")
        self.assertEqual(verdicts["open_crashes.so"], "crashed")
        self.assertEqual(verdicts["exits_in_test.so"], "exited")
        self.assertEqual(verdicts["null_instance.so"], "no_instance")
        self.assertNotIn("no_entry.so", verdicts)

    def test_relative_paths_work(self):
        for path in [EFFECT, "./" + EFFECT, "../" + PLUGINS.name + "/" + EFFECT]:
            with self.subTest(path=path):
                result = self.results(path, cwd=PLUGINS, status=0)[EFFECT]
                self.assertEqual(result["verdict"], "passed")
                self.assertTrue(result["plugin"]["bundle"].startswith("/"))

    def test_a_home_that_cannot_be_written_to_is_not_needed(self):
        self.verdicts(PLUGINS / EFFECT, environment={"HOME": "/proc/nowhere"}, status=0)

    def test_children_of_a_shell_are_run_in_its_order(self):
        verdicts = self.verdicts("-j", "1", PLUGINS / "shell.so", status=0)
        self.assertEqual(list(verdicts.items()), [("shell.so", "shell"), ("shell.so#1001", "passed"),
                                                  ("shell.so#1234", "passed"), ("shell.so#-7", "passed")])

    def test_children_that_are_skipped_are_not_run(self):
        skip = self.write("skip", "shell.so#1234\tslow\n")
        verdicts = self.verdicts("--skip", skip, PLUGINS / "shell.so", status=0)
        self.assertEqual(verdicts["shell.so#1234"], "skipped")
        self.assertEqual(verdicts["shell.so#1001"], "passed")
        skip = self.write("skip", "shell.so\tslow\n")
        self.assertEqual(self.verdicts("--skip", skip, PLUGINS / "shell.so", status=0), {"shell.so": "skipped"})

    def test_repeated_runs_are_counted(self):
        result = self.results("--repeat", "3", PLUGINS / EFFECT, status=0)[EFFECT]
        self.assertEqual(result["repetitions"], {"runs": 3, "isFlaky": False, "flakeRate": 0, "verdicts": {"passed": 3}})


class Expectations(ScanTest):
    def status(self, rows, *arguments, fault=True):
        expect = self.write("expect", rows)
        environment = {"FAULT_KIND": "null_store", "FAULT_PLACE": SET_SAMPLE_RATE} if fault else {}
        result = self.scan("--expect", expect, *arguments, PLUGINS / "faulty.so", environment=environment)
        return result.returncode, result.stderr

    def test_a_failure_that_is_expected_is_wanted(self):
        step = self.results(PLUGINS / "faulty.so", status=1, environment={
            "FAULT_KIND": "null_store", "FAULT_PLACE": SET_SAMPLE_RATE})["faulty.so"]["step"]
        number = step["number"] if step else 0
        self.assertEqual(self.status("faulty.so\tcrashed\t-\tknown\n")[0], 0)
        self.assertEqual(self.status(f"faulty.so\tcrashed\t{number}\tknown\n")[0], 0)
        self.assertEqual(self.status(f"faulty.so\tcrashed\t{number + 1}\tknown\n")[0], 1)

    def test_a_failure_that_is_mended_or_another_one_is_not(self):
        self.assertEqual(self.status("faulty.so\tcrashed\n", fault=False)[0], 1)
        self.assertEqual(self.status("faulty.so\thung\n")[0], 1)

    def test_without_a_row_a_plugin_has_to_pass(self):
        self.assertEqual(self.status("# nothing\n")[0], 1)
        self.assertEqual(self.status("# nothing\n", fault=False)[0], 0)

    def test_a_plugin_that_got_lost_is_named_with_its_line(self):
        status, errors = self.status("faulty.so\tcrashed\nlost.so#3\tpassed\n")
        self.assertEqual(status, 1)
        self.assertIn("line 2: there was no such plug-in: lost.so#3", errors)
        self.assertEqual(self.status("faulty.so\tcrashed\nlost*.so\tpassed\n")[0], 0)

    def test_what_is_skipped_needs_not_end_as_expected(self):
        skip = self.write("skip", "faulty.so\tslow\n")
        self.assertEqual(self.status("faulty.so\tcrashed\n", "--skip", skip)[0], 0)


class Outputs(ScanTest):
    def test_a_full_disk_for_the_results_keeps_the_verdicts_on_the_terminal(self):
        result = self.scan("--json", "/dev/full", PLUGINS / EFFECT)
        self.assertEqual(result.returncode, 3)
        self.assertRegex(result.stdout, r"passed +[\d.]+ m?s  .*well_behaved_effect.so\n")
        self.assertIn("the results could not be written: /dev/full: No space left on device", result.stderr)

    def test_a_disk_that_becomes_full_ends_the_results_at_a_whole_line(self):
        results = self.folder / "results"
        shell = 'trap "" XFSZ; ulimit -f 16; exec "$@"'
        subprocess.run(["bash", "-c", shell, "bash", SCAN, *PLAIN, "--json", results, PLUGINS],
                       env=self.environment(), capture_output=True, timeout=60, check=False)
        lines = results.read_text().split("\n")
        self.assertEqual(lines.pop(), "")
        self.assertGreater(len(lines), 2)
        for line in lines:
            json.loads(line)

    def test_the_report_goes_to_standard_error_when_the_results_go_to_standard_output(self):
        result = self.scan("--json", "-", PLUGINS / EFFECT)
        self.assertEqual(result.returncode, 0)
        self.assertIn("1 result: 1 passed", result.stderr)
        self.assertEqual(len(result.stdout.splitlines()), 4)

    def test_a_closed_standard_output(self):
        results = self.folder / "results"
        command = [SCAN, *PLAIN, "--json", results, PLUGINS / EFFECT]
        result = subprocess.run(["sh", "-c", '"$@" >&-', "sh", *command], env=self.environment(), text=True,
                                stderr=subprocess.PIPE, timeout=60, check=False)
        self.assertEqual(result.returncode, 3)
        self.assertIn("the report could not be written: Bad file descriptor", result.stderr)
        self.assertEqual([json.loads(line)["event"] for line in results.read_text().splitlines()],
                         ["scan_started", "run_started", "plugin_ended", "scan_ended"])

    def test_a_scan_that_nobody_reads_ends_soon(self):
        result = self.scan_without_reader("-j", "1", self.copies(100))
        self.assertEqual(result.returncode, 3)
        self.assertIn("the report could not be written: Broken pipe", result.stderr)

    def test_a_scan_whose_events_nobody_reads_ends_soon(self):
        result = self.scan_without_reader("-j", "1", "--json", "-", self.copies(100))
        self.assertEqual(result.returncode, 3)
        self.assertIn("the results could not be written: standard output: Broken pipe", result.stderr)
        self.assertLess(result.stderr.count(".so\n"), 50)

    def test_quiet_shows_what_is_not_as_wanted(self):
        self.assertRegex(self.scan("--quiet", PLUGINS / EFFECT).stdout, r"^1 result: 1 passed, in .*\n$")
        self.assertIn("open_crashes.so", self.scan("--quiet", PLUGINS).stdout)

    def test_no_control_codes_without_a_terminal(self):
        self.assertNotIn("\x1b", self.scan(PLUGINS).stdout)

    def on_a_terminal(self, *arguments, **environment):
        """What a scan writes to a terminal, and how many seconds it takes."""
        ours, terminal = pty.openpty()
        started = time.monotonic()
        process = subprocess.Popen([SCAN, *PLAIN, *map(str, arguments)], stdin=subprocess.DEVNULL,
                                   stdout=terminal, stderr=terminal,
                                   env=self.environment(**{"TERM": "xterm", **environment}))
        os.close(terminal)
        text = b""
        while True:
            try:
                block = os.read(ours, 65536)
            except OSError:  # The other end is closed.
                break
            if not block:
                break
            text += block
        process.wait(60)
        os.close(ours)
        return text.decode(), time.monotonic() - started

    def test_progress_on_a_terminal_is_calm_and_names_what_runs(self):
        copies = self.copies(300)
        # However fast the machine is, the scan is seen at work while this one hangs.
        shutil.copy(PLUGINS / "faulty.so", copies / "150.so")
        text, seconds = self.on_a_terminal("-j", "2", "--step-limit", "1", copies, FAULT_KIND="hang",
                                           FAULT_PLACE=SET_SAMPLE_RATE)
        updates = re.findall(r"\r\x1b\[K(\d+)/300([^\r\n]*)", text)
        self.assertTrue(updates)
        self.assertLessEqual(len(updates), seconds * 5 + 2)
        for _, names in updates:
            self.assertLessEqual(len(re.findall(r"  \d{3}\.so", names)), 2)
        self.assertTrue(any(re.search(r"  \d{3}\.so", names) for _, names in updates))
        self.assertIn("\x1b[32mpassed", text)

    def test_progress_and_colours_can_be_switched_off(self):
        copies = self.copies(40)
        text, _ = self.on_a_terminal("--no-progress", copies, NO_COLOR="1")
        self.assertNotIn("\x1b", text)
        text, _ = self.on_a_terminal(copies, TERM="dumb")
        self.assertNotIn("\x1b", text)


class Interruption(ScanTest):
    def interrupted(self, *arguments, after, **environment):
        """Sends SIGINT when the events tell that `after` is true of them. Returns status, events, report, seconds."""
        results = self.folder / "results"
        process = subprocess.Popen([SCAN, *PLAIN, "--json", results, *map(str, arguments)],
                                   env=self.environment(**environment), stdin=subprocess.DEVNULL,
                                   stdout=subprocess.PIPE, stderr=subprocess.PIPE, text=True)
        deadline = time.monotonic() + 60
        while time.monotonic() < deadline:
            lines = results.read_text().split("\n")[:-1] if results.exists() else []
            if after([json.loads(line) for line in lines]):
                break
            time.sleep(0.02)
        sent = time.monotonic()
        process.send_signal(signal.SIGINT)
        report, _ = process.communicate(timeout=60)
        events = [json.loads(line) for line in results.read_text().split("\n")[:-1]]
        return process.returncode, events, report, time.monotonic() - sent

    def test_nothing_new_is_started_and_what_is_known_is_printed(self):
        status, events, report, seconds = self.interrupted(
            "-j", "1", "--step-limit", "100", PLUGINS / EFFECT, PLUGINS / "faulty.so", PLUGINS / "shell.so",
            after=lambda events: len(events) >= 2, FAULT_KIND="hang", FAULT_PLACE=SET_SAMPLE_RATE)
        self.assertEqual(status, 130)
        self.assertLess(seconds, 30)
        names = [os.path.basename(event["plugin"]["bundle"]) for event in events if event["event"] == "plugin_ended"]
        self.assertEqual(names, ["faulty.so"])
        self.assertEqual(events[-1]["event"], "scan_ended")
        self.assertTrue(events[-1]["isInterrupted"])
        self.assertEqual(events[-1]["status"], 130)
        self.assertIn("interrupted", report)
        self.assertNotEqual(events[-2]["verdict"], "passed")

    def test_a_plugin_between_two_of_its_runs_keeps_the_first(self):
        log = self.folder / "log"

        def is_third_run_under_way(_):
            # Each run makes the plug-in twice, the first time as instance 1.
            return log.exists() and log.read_text().count("1 entry\n") >= 3
        status, events, _, _ = self.interrupted("-j", "1", "--repeat", "10000", PLUGINS / "records_requests.so",
                                                after=is_third_run_under_way, RECORDS_REQUESTS_LOG=str(log))
        self.assertEqual(status, 130)
        ended = [event for event in events if event["event"] == "plugin_ended"]
        self.assertEqual(len(ended), 1)
        self.assertGreater(ended[0]["repetitions"]["verdicts"]["passed"], 0)


class Completion(ScanTest):
    def completions(self, *words):
        script = ROOT / "completions/vsttorture-scan.bash"
        command = (f'. "{script}"; COMP_WORDS=("$@"); COMP_CWORD=$(($# - 1)); compopt() {{ :; }}; _vsttorture_scan; '
                   'printf "%s\\n" "${COMPREPLY[@]}"')
        result = subprocess.run(["bash", "-c", command, "bash", "vsttorture-scan", *words], capture_output=True,
                                cwd=PLUGINS, text=True, check=True)
        return result.stdout.split()

    def test_options_values_and_files(self):
        self.assertEqual(self.completions("--sa"), ["--sandbox"])
        self.assertEqual(self.completions("--sandbox", "r"), ["required"])
        self.assertEqual(self.completions("--skip", "well_behaved_e"), [EFFECT])
        self.assertEqual(self.completions("well_behaved_e"), [EFFECT])
        self.assertEqual(self.completions("--repeat", ""), [])
        self.assertEqual(self.completions("hist"), ["history"])
        self.assertEqual(self.completions("history", "--"), ["--cache", "--help"])

    def test_every_option_of_the_help_is_completed_and_in_the_manual(self):
        options = set(re.findall(r"(?<![\w-])--[a-z-]+", self.scan("--help").stdout))
        self.assertEqual(set(self.completions("--")), options)
        manual = (ROOT / "docs/vsttorture-scan.1").read_text().replace("\\-", "-")
        for option in options - {"--help", "--version"}:
            self.assertIn(option, manual)


class Events(ScanTest):
    @classmethod
    def setUpClass(cls):
        if jsonschema is None:
            raise unittest.SkipTest("the Python package jsonschema is not installed")
        events, description = [json.loads((SCHEMAS / name).read_text())
                               for name in ("scan-events.schema.json", "plugin-description.schema.json")]
        # One schema at a time: the description has one of its own.
        link = events["$defs"]["pluginEnded"]["properties"].pop("description")
        assert link["$ref"] == description["$id"]
        events["$defs"]["pluginEnded"]["properties"]["description"] = {"type": "object"}
        make = jsonschema.Draft202012Validator
        for schema in (events, description):
            make.check_schema(schema)
        cls.validators = {event: make({"$defs": events["$defs"], "$ref": f"#/$defs/{name}"})
                          for event, name in [("scan_started", "scanStarted"), ("run_started", "runStarted"),
                                              ("plugin_ended", "pluginEnded"), ("scan_ended", "scanEnded")]}
        cls.description_validator = make(description)

    def valid_events(self, *arguments, **more):
        events = self.events(*arguments, **more)
        for event in events:
            found = list(self.validators[event["event"]].iter_errors(event))
            if "description" in event:
                found += self.description_validator.iter_errors(event["description"])
            problems = [f"{list(problem.absolute_path)}: {problem.message}" for problem in found]
            self.assertEqual(problems, [], json.dumps(event)[:2000])
        return events

    def test_of_all_sample_plugins_with_descriptions_repetitions_and_lists(self):
        skip = self.write("skip", "shell.so#1234\tslow\nasks_host.so\tslow\n")
        expect = self.write("expect", "*_crashes.so\tcrashed\t-\tknown\nshell.so\tpassed\n")
        events = self.valid_events("--describe", "--repeat", "2", "--skip", skip, "--expect", expect, PLUGINS,
                                   sandbox="auto")
        self.assertEqual(events[0]["event"], "scan_started")
        self.assertEqual(events[-1]["event"], "scan_ended")
        descriptions = {os.path.basename(event["plugin"]["bundle"]): event["description"]["name"] for event in events
                        if "description" in event and event["plugin"]["child"] is None}
        self.assertIn(EFFECT, descriptions)
        self.assertIn("shell.so", descriptions)
        counts = events[-1]["counts"]
        self.assertEqual(sum(counts.values()), sum(event["event"] == "plugin_ended" for event in events))

    def test_a_run_begins_before_it_ends_and_no_more_run_than_may(self):
        running = set()
        for event in self.valid_events("-j", "2", PLUGINS):
            if event["event"] not in ("run_started", "plugin_ended"):
                continue
            key = (event["plugin"]["bundle"], event["plugin"]["child"])
            if event["event"] == "run_started":
                running.add(key)
                self.assertLessEqual(len(running), 2)
            elif event["command"]:
                running.remove(key)
        self.assertEqual(running, set())

    def test_of_faults(self):
        for kind, place, verdict in [("null_store", "dispatch:10", "crashed"), ("null_store", "load", "crashed"),
                                     ("null_store", "getParameter", "crashed"),
                                     ("null_store", "setParameter", "crashed"), ("hang", "dispatch:10", "hung"),
                                     ("spin", "dispatch:10", "hung"), ("no_instance", "entry", "no_instance"),
                                     ("raise:SIGKILL", "dispatch:10", "killed"),
                                     ("print", "dispatch:10", None), ("long_texts", "entry", None)]:
            with self.subTest(kind=kind, place=place):
                limit = ["--step-limit", "0.5"] if verdict == "hung" else []
                events = self.valid_events(*limit, PLUGINS / "faulty.so",
                                           environment={"FAULT_KIND": kind, "FAULT_PLACE": place})
                self.assertEqual(len(events), 4)
                if verdict:
                    self.assertEqual(events[2]["verdict"], verdict)

    def test_names_and_texts_that_are_no_utf8(self):
        name = os.fsencode(self.folder) + b"/\xff\xfe\n.so"
        shutil.copy(PLUGINS / EFFECT, name)
        events = self.valid_events(self.folder)
        self.assertEqual(len(events), 4)
        self.assertTrue(events[1]["plugin"]["bundle"].endswith("/\ufffd\ufffd\n.so"))

    def test_of_files_that_are_no_modules_and_other_processors(self):
        self.write("text.so", "text")
        code = bytearray((PLUGINS / EFFECT).read_bytes())
        code[18:20] = (8).to_bytes(2, "little")
        (self.folder / "other.so").write_bytes(code)
        self.assertEqual(len(self.valid_events(self.folder / "text.so", self.folder / "other.so", status=1)), 5)


def main():
    global SCAN, PLUGINS
    rest = scan_test_case.read_arguments(sys.argv[1:])
    SCAN, PLUGINS = scan_test_case.SCAN, scan_test_case.PLUGINS
    if jsonschema is None and rest == ["Events"]:
        print("the Python package jsonschema is not installed")
        return NOTHING_TO_CHECK_WITH
    program = unittest.main(argv=[sys.argv[0], *rest], exit=False)
    return 0 if program.result.wasSuccessful() else 1


if __name__ == "__main__":
    sys.exit(main())
