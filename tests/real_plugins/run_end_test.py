# SPDX-License-Identifier: MIT
"""Tests of run_end: each way in which a run can differ from a pass shows in its words."""
import unittest

from run_end import run_end

FIXED = """total, 64
1, test gathering info
2, inspect class info
3, inspect preset info
4, inspect parameter info
5, testing setting states
6, inspect latency
7, inspect stream format
8, inspect stream format
9, inspect latency
10, testing setting states
11, inspect parameter info
12, inspect preset info
13, inspect class info
14, initialize
15, test gathering info
"""
PASS = FIXED + "".join(f"{step}, inspect latency\n" for step in range(16, 66))


class RunEnd(unittest.TestCase):
    def test_all_65_steps_and_status_0_are_a_pass(self):
        self.assertEqual(run_end(PASS, 0), "passes")

    def test_each_random_step_may_be_any_of_the_first_five_tests(self):
        for text in ["inspect class info", "inspect preset info", "inspect parameter info",
                     "testing setting states", "inspect latency"]:
            self.assertEqual(run_end(PASS.replace("40, inspect latency", f"40, {text}"), 0), "passes")

    def test_a_random_step_is_never_the_sixth_test(self):
        self.assertTrue(run_end(PASS.replace("65, inspect latency", "65, inspect stream format"), 0).startswith(
            "step 64, 65, inspect stream format"))

    def test_a_fixed_step_has_its_own_text_only(self):
        self.assertTrue(run_end(PASS.replace("14, initialize", "14, inspect latency"), 0).startswith("step 13, "))

    def test_another_status_is_no_pass(self):
        self.assertEqual(run_end(PASS, 7), "step 65, status 7")

    def test_a_signal_is_named(self):
        self.assertEqual(run_end(PASS, -11), "step 65, killed by SIGSEGV")

    def test_a_run_that_was_stopped_is_out_of_time(self):
        self.assertEqual(run_end("total, 64\n1, test gathering info\n", None), "step 1, out of time")

    def test_status_0_without_the_last_step_is_no_pass(self):
        self.assertEqual(run_end(PASS[: PASS.index("65,")], 0), "step 64, status 0")

    def test_a_last_line_without_its_newline_is_no_pass(self):
        self.assertEqual(run_end(PASS[:-1], 0), "step 65, status 0")

    def test_a_step_that_is_left_out_is_no_pass(self):
        self.assertTrue(run_end(PASS.replace("30, inspect latency\n", ""), 0).startswith("step 29, 31, "))

    def test_a_line_too_many_is_no_pass(self):
        self.assertEqual(run_end(PASS + "hello\n", 0), "step 65, hello, status 0")
        self.assertEqual(run_end(PASS + "\n", 0), "step 65, status 0")

    def test_a_crash_names_its_step(self):
        output = FIXED[: FIXED.index("6,")] + "unexpected exit"
        self.assertEqual(run_end(output, 7), "step 5, unexpected exit, status 7")

    def test_a_failure_line_is_quoted(self):
        self.assertEqual(run_end("!create and initialize failed -1\n", 3),
                         "no total, !create and initialize failed -1, status 3")

    def test_nothing_printed_is_no_pass(self):
        self.assertEqual(run_end("", 0), "no total, status 0")


if __name__ == "__main__":
    unittest.main()
