# SPDX-License-Identifier: MIT
"""Runs the real vsttorture-scan with --under, --shrink and --repeat on the sample plug-ins.

    explain_test.py --scan build/release/vsttorture-scan --plugins build/release/plugins [TEST...]

Each command that a result names is run, and must show the same. What needs valgrind or gdb is skipped where these
cannot be used, or fails with VSTTORTURE_DEBUGGERS=required in the environment.
"""
import json
import pathlib
import shutil
import signal
import subprocess
import sys
import time
import unittest

sys.path.insert(0, str(pathlib.Path(__file__).resolve().parents[1] / "shared"))
import debuggers  # noqa: E402
import scan_test_case  # noqa: E402
from scan_test_case import EFFECT, ScanTest  # noqa: E402

TAIL_SIZE = "dispatch:52"  # Asked for in step 6, by test 4.


def needs(tool):
    return unittest.skipIf(not debuggers.IS_REQUIRED and debuggers.why_not(tool) is not None, debuggers.why_not(tool))


class ExplainTest(ScanTest):
    def fault(self, kind, place=TAIL_SIZE):
        return {"FAULT_KIND": kind, "FAULT_PLACE": place}

    def result(self, plugin, *arguments, status=1, **more):
        return self.results(*arguments, scan_test_case.PLUGINS / plugin, status=status, **more)[plugin]

    def run_command(self, command, environment=None):
        """A command of a result: its status and both outputs."""
        done = subprocess.run(command, env=self.environment(**(environment or {})), cwd=self.folder,
                              stdin=subprocess.DEVNULL, stdout=subprocess.PIPE, stderr=subprocess.STDOUT, text=True,
                              errors="replace", timeout=120, check=False)
        return done.returncode, done.stdout

    def report(self, *arguments, **more):
        """What people see."""
        return self.scan("--no-progress", *arguments, **more).stdout


class Shrink(ExplainTest):
    def test_a_test_that_fails_by_itself_takes_one_run_and_its_command_fails_again(self):
        result = self.result("faulty.so", "--shrink", environment=self.fault("null_store"))
        shrunk = result["shrunk"]
        self.assertEqual({name: shrunk[name] for name in ("from", "tests", "runs", "isReproduced", "problem")},
                         {"from": "0,1,2,3,4", "tests": "4", "runs": 1, "isReproduced": True, "problem": None})
        status, output = self.run_command(shrunk["command"], self.fault("null_store"))
        self.assertEqual(status, 7)
        self.assertTrue(output.startswith("total, 2\n1, test gathering info\n2, inspect latency\n"), output)

    def test_a_failure_that_needs_a_history_of_tests_keeps_that_alone(self):
        # The sample fails in about every second random part.
        for _ in range(40):
            result = self.results("--shrink", scan_test_case.PLUGINS / "crashes_after_two_states.so")["crashes_after_two_states.so"]
            if result["verdict"] == "crashed":
                break
        self.assertEqual(result["verdict"], "crashed")
        shrunk = result["shrunk"]
        self.assertRegex(shrunk["tests"], r"^[35],[35],4$")
        self.assertLessEqual(shrunk["runs"], 30)
        # The fixed part of the run goes before the random part, with which the list ends.
        self.assertTrue(shrunk["from"].startswith("0,1,2,3,4,5,5,4,3,2,1,0," + result["tests"]), shrunk["from"])
        for _ in range(3):
            status, output = self.run_command(shrunk["command"])
            self.assertEqual(status, 7)
            self.assertIn("4, inspect latency\nunexpected exit", output)

    def test_every_way_to_fail_shrinks_to_itself(self):
        for kind, verdict in [("throw_int", "failed"), ("_exit", "exited"), ("exit", "exited"), ("hang", "hung"),
                              ("raise:SIGKILL", "killed"), ("heap_corruption", "crashed")]:
            with self.subTest(kind=kind):
                limit = ["--step-limit", "2"] if kind == "hang" else []
                result = self.result("faulty.so", *limit, "--shrink", environment=self.fault(kind))
                self.assertEqual(result["verdict"], verdict)
                self.assertEqual((result["shrunk"]["tests"], result["shrunk"]["runs"]), ("4", 1))

    def test_a_failure_before_the_first_test_has_no_list(self):
        result = self.result("open_crashes.so", "--shrink")
        self.assertEqual(result["shrunk"], {
            "from": "", "tests": "", "runs": 0, "isReproduced": False, "command": result["command"],
            "problem": "it fails before the first test, whatever the tests are"})

    def test_a_failure_when_it_is_created_a_second_time_has_no_list(self):
        # The 2nd effOpen (0).
        result = self.result("faulty.so", "--shrink", environment=self.fault("null_store", "dispatch:0:2"))
        self.assertEqual(result["step"]["number"], 14)
        self.assertIn("created a second time", result["shrunk"]["problem"])

    def test_a_failure_that_does_not_come_again_says_so(self):
        # Fails once: the file in its own folder, which is not scratch, is seen by the later runs.
        if not shutil.which("cc"):
            self.skipTest("there is no C compiler")
        plugin = self.folder / "once.so"
        source = self.write("once.c", f"""
            #include <fcntl.h>
            #include <stdlib.h>
            #include <unistd.h>
            #include <dlfcn.h>
            void *VSTPluginMain(void *host) {{
              void *(*next)(void *) = dlsym(dlopen("{scan_test_case.PLUGINS / 'faulty.so'}", RTLD_NOW), "VSTPluginMain");
              return next(host);
            }}
            __attribute__((constructor)) static void begin(void) {{
              if (open("{self.folder / 'seen'}", O_CREAT | O_EXCL, 0600) >= 0) setenv("FAULT_PLACE", "{TAIL_SIZE}", 1);
            }}""")
        subprocess.run(["cc", "-shared", "-fPIC", "-o", plugin, source, "-ldl"], check=True)
        result = self.results("--shrink", plugin, status=1, environment={"FAULT_KIND": "null_store"})["once.so"]
        self.assertEqual(result["verdict"], "crashed")
        self.assertFalse(result["shrunk"]["isReproduced"])
        self.assertEqual(result["shrunk"]["runs"], 2)
        self.assertIn("did not fail again in this way in 2 runs", result["shrunk"]["problem"])

    def test_what_passes_is_not_run_again(self):
        self.assertIsNone(self.result(EFFECT, "--shrink", status=0)["shrunk"])

    def test_people_see_the_list_and_the_command(self):
        report = self.report("--shrink", scan_test_case.PLUGINS / "faulty.so", environment=self.fault("null_store"))
        self.assertRegex(report, r"  shortest list of tests: 1 of 5, found in 1 run\n"
                                 r"  shortest: \S.*/vsttorture-worker'? --tests 4 \S.*/faulty\.so'?\n")


class Repeat(ExplainTest):
    def test_a_plugin_that_uses_fresh_memory_is_flaky_with_its_rate_and_both_ends(self):
        result = self.result("uses_fresh_memory.so", "--repeat", "5")
        self.assertEqual(result["repetitions"], {"runs": 5, "isFlaky": True, "flakeRate": 0.8,
                                                 "verdicts": {"passed": 1, "crashed at 6": 4}})
        # The run that failed speaks for it, and its command fails again.
        self.assertEqual(result["verdict"], "crashed")
        self.assertEqual(result["command"][0], "env")
        self.assertEqual(self.run_command(result["command"])[0], 7)
        self.assertIn("flaky: 80 % of the runs failed: 4 of 5 crashed at 6, 1 of 5 passed\n",
                      self.report("--repeat", "5", scan_test_case.PLUGINS / "uses_fresh_memory.so"))

    def test_an_expected_end_does_not_make_it_reliable(self):
        name = "uses_fresh_memory.so"
        expect = self.write("expect", f"{name}\tcrashed\n")
        result = self.result(name, "--repeat", "2", "--expect", expect, status=1)
        self.assertEqual((result["expected"]["isMet"], result["isWanted"]), (True, False))

    def test_its_list_is_shrunk_with_the_same_memory(self):
        shrunk = self.result("uses_fresh_memory.so", "--repeat", "2", "--shrink")["shrunk"]
        self.assertEqual(shrunk["tests"], "4")
        self.assertEqual(self.run_command(shrunk["command"])[0], 7)


class WrongTools(ExplainTest):
    def test_a_tool_that_is_not_installed_is_said_before_anything_runs(self):
        for tool, sentence in [("memcheck", "there is no valgrind in PATH; Debian's package valgrind has it"),
                               ("gdb", "there is no gdb in PATH; Debian's package gdb has it"),
                               ("no-such-tool -x", "there is no program no-such-tool"), ("", "there is no command"),
                               ("sh -c 'x", "a quote is not closed in: sh -c 'x")]:
            with self.subTest(tool=tool):
                result = self.scan("--under", tool, scan_test_case.PLUGINS / EFFECT, environment={"PATH": "/nowhere"})
                self.assertEqual(result.returncode, 2)
                self.assertIn(sentence, result.stderr)
                self.assertEqual(result.stdout, "")


class Command(ExplainTest):
    def test_a_command_runs_the_worker_and_its_output_is_kept(self):
        for sandbox in ("off", "auto"):
            with self.subTest(sandbox=sandbox):
                result = self.result(EFFECT, "--under", "sh -c 'echo \"by the  tool\" >&2; exec \"$@\"' x", status=0,
                                     sandbox=sandbox)
                diagnosis = result["diagnosis"]
                self.assertEqual((diagnosis["tool"], diagnosis["findings"], diagnosis["problem"]), ("sh", [], None))
                self.assertIn("by the  tool\n", diagnosis["report"])
                status, output = self.run_command(diagnosis["command"])
                self.assertEqual(status, 0)
                self.assertIn("by the  tool\n", output)
                self.assertIn("65, ", output)

    def test_another_status_is_a_finding_and_the_verdict_stays(self):
        result = self.result(EFFECT, "--under", "sh -c '\"$@\"; exit 99' x")
        self.assertEqual((result["verdict"], result["isWanted"]), ("passed", False))
        self.assertEqual([finding["text"] for finding in result["diagnosis"]["findings"]],
                         ["The run ended with status 99; without it, it ended with status 0"])
        # A row that names it makes it known.
        expect = self.write("expect", f"{EFFECT}\tpassed\n")
        self.assertTrue(self.result(EFFECT, "--under", "false", "--expect", expect, status=0)["isWanted"])

    def test_what_failed_in_its_random_part_fails_under_the_command_too(self):
        for _ in range(40):
            result = self.results("--under", "env", scan_test_case.PLUGINS / "crashes_after_two_states.so")
            result = result["crashes_after_two_states.so"]
            if result["verdict"] == "crashed":
                break
        self.assertEqual(result["verdict"], "crashed")
        self.assertEqual(result["diagnosis"]["findings"], [])
        self.assertIn(result["tests"], result["diagnosis"]["command"][-2])

    def test_its_output_is_kept_to_the_last_64_kib(self):
        report = self.result(EFFECT, "--under", "sh -c 'yes text | head -c 300000; echo; exec \"$@\"' x",
                             status=0)["diagnosis"]["report"]
        self.assertEqual(len(report), 64 * 1024)

    def test_a_plugin_that_cannot_be_loaded_is_not_run_again(self):
        self.assertIsNone(self.result("undefined_symbol.so", "--under", "env")["diagnosis"])

    def test_a_scan_that_is_interrupted_during_the_further_run_gives_the_verdict_and_does_not_remember_it(self):
        # The tool says where it is before it waits; the next time it does not wait.
        wait = self.folder / "wait"
        tool = f"sh -c 'test -e \"{wait}\" && exit 7; touch \"{wait}\"; sleep 60' x"
        plugin, cache = scan_test_case.PLUGINS / "open_crashes.so", self.folder / "results"
        program = subprocess.Popen(
            [scan_test_case.SCAN, "--cache", cache, "--sandbox", "off", "--json", "-", "--under", tool, plugin],
            env=self.environment(), stdout=subprocess.PIPE, stderr=subprocess.DEVNULL, text=True)
        end = time.monotonic() + 60
        while not wait.exists() and time.monotonic() < end:
            time.sleep(0.01)
        program.send_signal(signal.SIGINT)
        output, _ = program.communicate(timeout=60)
        self.assertEqual(program.returncode, 130)
        ended = [json.loads(line) for line in output.splitlines()][2]
        self.assertEqual((ended["event"], ended["verdict"]), ("plugin_ended", "crashed"))
        self.assertEqual(ended["diagnosis"]["problem"], "interrupted")
        for is_remembered in (False, True):
            result = self.results("--under", tool, plugin, cache=cache)["open_crashes.so"]
            self.assertEqual((result["isRemembered"], result["diagnosis"]["problem"]), (is_remembered, None))
        # Another tool is another question.
        self.assertFalse(self.results("--under", "env", plugin, cache=cache)["open_crashes.so"]["isRemembered"])
        self.assertFalse(self.results("--shrink", plugin, cache=cache)["open_crashes.so"]["isRemembered"])

    def test_findings_of_what_passed_are_remembered(self):
        cache = self.folder / "results"
        for is_remembered in (False, True):
            result = self.result(EFFECT, "--under", "false", cache=cache)
            self.assertEqual((result["isRemembered"], result["isWanted"]), (is_remembered, False))
            self.assertIn("with findings of false", self.report("--under", "false", scan_test_case.PLUGINS / EFFECT,
                                                                cache=cache))


@needs("gdb")
class Gdb(ExplainTest):
    def finding(self, kind, *options, sandbox="auto"):
        result = self.result("faulty.so", *options, "--under", "gdb", environment=self.fault(kind), sandbox=sandbox)
        diagnosis = result["diagnosis"]
        self.assertIsNone(diagnosis["problem"], diagnosis["report"])
        self.assertEqual(len(diagnosis["findings"]), 1)
        return diagnosis["findings"][0], diagnosis

    def test_a_crash_has_its_instruction_and_the_way_to_it(self):
        for sandbox in ("off", "auto"):
            with self.subTest(sandbox=sandbox):
                finding, diagnosis = self.finding("null_store", sandbox=sandbox)
                self.assertEqual(finding["kind"], "SIGSEGV")
                self.assertRegex(finding["text"], r"^SIGSEGV in .*storeToAddressZero\(\) \(faulty\.so\+0x[0-9a-f]+\), "
                                                  r"at mov\S* .*\(%\w+\).* with \w+ = 0x0$")
                self.assertRegex(finding["frames"][0], r"storeToAddressZero\(\) \(faulty\.so\+0x[0-9a-f]+\)")
                self.assertTrue(any("Faulty::dispatch(" in frame for frame in finding["frames"]))
                self.assertIn("(vsttorture-worker", finding["frames"][-1])
                output = self.run_command(diagnosis["command"], self.fault("null_store"))[1]
                self.assertRegex(output, r"#0 .*storeToAddressZero\(\)")

    def test_an_exception_has_the_place_where_it_was_thrown(self):
        for plugin_kind in ("throw_int", "throw_runtime_error"):
            finding, _ = self.finding(plugin_kind)
            self.assertEqual(finding["kind"], "throw")
            self.assertIn("__cxa_throw", finding["frames"][0])
            self.assertTrue(any("Faulty::dispatch(" in frame for frame in finding["frames"]))

    def test_an_exit_has_the_place_where_it_was_called(self):
        for kind in ("exit", "_exit"):
            finding, _ = self.finding(kind)
            self.assertEqual(finding["kind"], "exit")
            self.assertTrue(any("Faulty::dispatch(" in frame for frame in finding["frames"]))

    def test_a_hang_has_the_place_where_it_waits(self):
        for sandbox in ("off", "auto"):
            with self.subTest(sandbox=sandbox):
                for limit in ("2", "20"):  # On a busy machine gdb takes longer to start.
                    finding, _ = self.finding("hang", "--step-limit", limit, sandbox=sandbox)
                    self.assertEqual(finding["kind"], "hang")
                    if "hang()" in finding["text"]:
                        break
                self.assertRegex(finding["text"], r"stopped at the limit in .*hang\(\)")

    def test_what_is_right_has_no_back_trace_and_no_further_run(self):
        self.assertIsNone(self.result(EFFECT, "--under", "gdb", status=0)["diagnosis"])

    def test_what_no_debugger_can_stop_at_says_so(self):
        result = self.result("faulty.so", "--under", "gdb", environment=self.fault("raise:SIGKILL"))
        self.assertEqual(result["diagnosis"]["problem"], "gdb cannot stop at what ended the run")

    def test_a_path_that_a_shell_would_take_apart_is_one(self):
        name = "it's a $HOME; true \\ \"x\".so"
        shutil.copy(scan_test_case.PLUGINS / "faulty.so", self.folder / name)
        result = self.results("--under", "gdb", self.folder / name, environment={"SHELL": "/nowhere",
                                                                                 **self.fault("null_store")})[name]
        self.assertEqual([finding["kind"] for finding in result["diagnosis"]["findings"]], ["SIGSEGV"])
        output = self.run_command(result["diagnosis"]["command"], self.fault("null_store"))[1]
        self.assertRegex(output, r"#0 .*storeToAddressZero\(\)")

    def test_with_the_shortest_list_it_comes_to_the_failure_sooner(self):
        result = self.result("faulty.so", "--under", "gdb", "--shrink", environment=self.fault("null_store"))
        self.assertEqual(result["diagnosis"]["command"][-3:-1], ["--tests", "4"])
        self.assertEqual(result["diagnosis"]["findings"][0]["kind"], "SIGSEGV")

    def test_files_of_the_user_are_not_read(self):
        (self.folder / "home/.gdbinit").write_text("shell touch read\n")
        self.finding("null_store", sandbox="off")
        self.assertFalse((self.folder / "read").exists())


@needs("valgrind")
class Memcheck(ExplainTest):
    def test_a_plugin_that_passes_by_luck_has_findings_and_is_not_as_wanted(self):
        for sandbox in ("off", "auto"):
            with self.subTest(sandbox=sandbox):
                result = self.result("uses_fresh_memory.so", "--under", "memcheck", sandbox=sandbox)
                self.assertEqual((result["verdict"], result["isWanted"]), ("passed", False))
                diagnosis = result["diagnosis"]
                self.assertIsNone(diagnosis["problem"])
                self.assertEqual(len(diagnosis["findings"]), 1)
                finding = diagnosis["findings"][0]
                self.assertEqual((finding["kind"], finding["isInPlugin"]), ("UninitCondition", True))
                self.assertIn("created by a heap allocation in ", finding["text"])
                self.assertRegex(finding["frames"][0], r"lookAtTheBlock.*\(uses_fresh_memory\.so\+0x[0-9a-f]+\)")
        _, output = self.run_command(diagnosis["command"])
        self.assertIn("Conditional jump or move depends on uninitialised value", output)

    def test_the_whole_run_is_done_and_a_clean_plugin_stays_as_wanted(self):
        result = self.result(EFFECT, "--under", "memcheck", status=0)
        self.assertEqual(result["diagnosis"]["findings"], [])
        self.assertIsNone(result["diagnosis"]["problem"])
        self.assertNotIn("--tests", result["diagnosis"]["command"])

    def test_people_see_findings_of_what_passed(self):
        report = self.report("--under", "memcheck", scan_test_case.PLUGINS / "uses_fresh_memory.so")
        self.assertIn("uses_fresh_memory.so  with findings of memcheck\n", report)
        self.assertRegex(report, r"  memcheck: Conditional jump or move depends on uninitialised value")
        self.assertIn("  under memcheck: valgrind --tool=memcheck", report)

    def test_an_error_before_a_crash_is_found_too(self):
        result = self.result("faulty.so", "--under", "memcheck", environment=self.fault("heap_corruption"))
        self.assertEqual(result["verdict"], "crashed")
        self.assertIn("InvalidWrite", [finding["kind"] for finding in result["diagnosis"]["findings"]])


if __name__ == "__main__":
    sys.exit(scan_test_case.main())
