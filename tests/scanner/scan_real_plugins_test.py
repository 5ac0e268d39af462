# SPDX-License-Identifier: MIT
"""Tests of scan_real_plugins: nothing that is wrong or missing goes unnoticed.

A script that prints events stands in for vsttorture-scan, and folders for the packages.
"""
import contextlib
import io
import json
import os
import pathlib
import tempfile
import unittest
from unittest import mock

import scan_real_plugins

LACKS_A_LIBRARY = [{"step": 0, "stream": "stderr", "text": "libGL.so.1: cannot open shared object file"}]


def ended(path, verdict="passed", expected="passed", printed=()):
    """A plugin_ended event. expected: the verdict of its row in the list, None without a row."""
    return {"event": "plugin_ended", "plugin": {"bundle": str(path), "child": None}, "otherNames": [],
            "verdict": verdict, "cause": "a cause", "printed": list(printed),
            "expected": None if expected is None else {"verdict": expected, "isMet": verdict == expected}}


class ScanRealPlugins(unittest.TestCase):
    """Modules of unpacked packages, as fetch_i386.py leaves them."""

    def setUp(self):
        temporary = tempfile.TemporaryDirectory()
        self.addCleanup(temporary.cleanup)
        self.root = pathlib.Path(os.path.realpath(temporary.name))

    def module(self, package, name):
        path = self.root / package / "usr/lib/vst" / name
        path.parent.mkdir(parents=True, exist_ok=True)
        path.write_text("")
        return path

    def check(self, rows, events, status=0, required=""):
        """The status and the lines of a whole call."""
        events = "\n".join(map(json.dumps, events))
        scan = self.root / "scan"
        scan.write_text(f"#!/bin/sh\ncat <<'END'\n{events}\nEND\nexit {status}\n")
        scan.chmod(0o755)
        output = io.StringIO()
        arguments = ["--scan", str(scan), "--architecture", "i386", "--i386-root", str(self.root),
                     "--i386-workers", str(self.root)]
        with mock.patch("sys.argv", ["scan_real_plugins.py", *arguments]), \
             mock.patch.object(scan_real_plugins, "rows_by_package", lambda _: rows), \
             mock.patch.dict(os.environ, {"VSTTORTURE_REAL_PLUGINS": required}), \
             contextlib.redirect_stdout(output):
            ended_with = scan_real_plugins.main()
        return ended_with, output.getvalue().replace(f"{self.root}/", "").splitlines()

    def summary(self, met, wanted, deviations, status=0):
        return f"{met} plug-ins of {wanted} in the list were scanned, {deviations} deviations; status {status}"

    def test_a_verdict_as_in_the_list_is_right_and_any_other_a_deviation(self):
        a = self.module("p", "a.so")
        rows = {"p": ["a.so\tpassed"]}
        self.assertEqual(self.check(rows, [ended(a)]), (0, [self.summary(1, 1, 0)]))
        self.assertEqual(self.check(rows, [ended(a, "crashed")], 1), (1, [
            "p/usr/lib/vst/a.so: crashed, a cause; expected passed", self.summary(1, 1, 1, 1)]))

    def test_a_pass_has_no_text_on_standard_output(self):
        a = self.module("p", "a.so")
        printed = [{"step": 1, "stream": "stdout", "text": "hello"}]
        self.assertEqual(self.check({"p": ["a.so\tpassed"]}, [ended(a, printed=printed)]), (1, [
            "p/usr/lib/vst/a.so: passed, with text of its own on standard output", self.summary(1, 1, 1)]))

    def test_modules_that_the_list_or_the_package_lacks_are_deviations(self):
        a, c = self.module("p", "a.so"), self.module("p", "c.so")
        status, lines = self.check({"p": ["a.so\tpassed", "b.so\tpassed"]}, [ended(a), ended(c, expected=None)])
        self.assertEqual((status, lines[:2]), (1, ["p/usr/lib/vst/c.so is not in the list: passed",
                                                   "1 plug-ins of the list were not found"]))

    def test_a_scan_that_could_not_go_on_is_a_failure(self):
        a = self.module("p", "a.so")
        self.assertEqual(self.check({"p": ["a.so\tpassed"]}, [ended(a)], 3)[0], 1)

    def test_a_missing_package_is_named_and_fails_only_when_required(self):
        rows = {"p": ["a.so\tpassed"]}
        self.assertEqual(self.check(rows, []), (77, ["left out: p is not there"]))
        self.assertEqual(self.check(rows, [], required="required")[0], 1)

    def test_only_what_the_archive_lacked_is_left_out(self):
        a = self.module("p", "a.so")
        rows = {"p": ["a.so\tpassed"], "q": ["b.so\tpassed"]}
        events = [ended(a, "not_loadable", printed=LACKS_A_LIBRARY)]
        (self.root / "missing").write_text("q\nlibgl1\n")
        self.assertEqual(self.check(rows, events, 1, "required"), (0, [
            "left out: q is not there", "left out: p/usr/lib/vst/a.so needs a library that could not be had",
            self.summary(1, 1, 0, 1)]))
        (self.root / "missing").write_text("")
        self.assertEqual(self.check(rows, events, 1)[0], 1)

    def test_the_five_modules_that_need_no_library_are_never_left_out(self):
        names = sorted(scan_real_plugins.NEED_NO_LIBRARY["dpf-plugins-vst"])
        self.assertEqual(len(names), 5)
        rows = {"dpf-plugins-vst": [f"{name}\tpassed" for name in names]}
        (self.root / "missing").write_text("libgl1\ndpf-plugins-vst\n")
        self.assertEqual(self.check(rows, [], required="required")[0], 1)
        events = [ended(self.module("dpf-plugins-vst", name), "not_loadable", printed=LACKS_A_LIBRARY)
                  for name in names]
        self.assertEqual(self.check(rows, events, 1)[1][-1], self.summary(5, 5, 5, 1))

    def test_the_lists_name_200_modules_of_seven_packages(self):
        for architecture in ("amd64", "i386"):
            rows = scan_real_plugins.rows_by_package(architecture)
            self.assertEqual({package: len(modules) for package, modules in rows.items()}, {
                "amsynth": 1, "dpf-plugins-vst": 15, "dragonfly-reverb-vst": 4, "iem-plugin-suite-vst": 21,
                "lsp-plugins-vst": 134, "zam-plugins": 17, "zynaddsubfx-vst": 8})
            listed = {row.split("\t")[0] for row in rows["dpf-plugins-vst"]}
            self.assertLessEqual(scan_real_plugins.NEED_NO_LIBRARY["dpf-plugins-vst"], listed)


if __name__ == "__main__":
    unittest.main()
