# SPDX-License-Identifier: MIT
"""Tests of real_plugins: no deviation goes unnoticed, and a run sees a world of its own."""
import contextlib
import io
import os
import pathlib
import tempfile
import unittest
from unittest import mock

import real_plugins


class ScriptedProgram(unittest.TestCase):
    """A shell script stands in for vsttorture; its argument is the module's path."""

    def setUp(self):
        folder = tempfile.TemporaryDirectory()
        self.addCleanup(folder.cleanup)
        self.path = pathlib.Path(folder.name, "program")
        self.write("printf 'total, 64\\n1, test gathering info\\nunexpected exit'; exit 7")

    def write(self, body):
        self.path.write_text(f"#!/bin/sh\n{body}\n")
        self.path.chmod(0o755)

    def main(self, table, installed, *arguments, required=""):
        """The exit status and the output of a whole call."""
        output = io.StringIO()
        with mock.patch("sys.argv", ["real_plugins.py", "--program", str(self.path), *arguments]), \
             mock.patch.object(real_plugins, "expected_ends", lambda *_: table), \
             mock.patch.object(real_plugins, "installed_modules", installed.get), \
             mock.patch.dict(os.environ, {"VSTTORTURE_REAL_PLUGINS": required}), \
             contextlib.redirect_stdout(output):
            status = real_plugins.main()
        return status, output.getvalue()


class Main(ScriptedProgram):
    CRASH = "step 1, unexpected exit, status 7"

    def test_the_expected_end_is_no_deviation(self):
        status, output = self.main({"p": {"a.so": self.CRASH}}, {"p": {"a.so": "/a.so"}})
        self.assertEqual(status, 0)
        self.assertRegex(output, r"^1 plug-ins run in \d+ s, 0 deviations\n$")

    def test_another_end_is_a_deviation(self):
        status, output = self.main({"p": {"a.so": "passes"}}, {"p": {"a.so": "/a.so"}})
        self.assertEqual(status, 1)
        self.assertIn(f"p a.so: expected passes; seen {self.CRASH}\n", output)

    def test_a_pass_where_a_crash_is_expected_is_a_deviation(self):
        self.write("exit 0")
        self.assertEqual(self.main({"p": {"a.so": self.CRASH}}, {"p": {"a.so": "/a.so"}})[0], 1)

    def test_standard_error_is_quoted_with_a_deviation(self):
        self.write("echo reason >&2; exit 3")
        self.assertIn("    reason\n", self.main({"p": {"a.so": "passes"}}, {"p": {"a.so": "/a.so"}})[1])

    def test_a_module_that_the_package_lacks_is_a_deviation(self):
        status, output = self.main({"p": {"a.so": self.CRASH, "b.so": "passes"}}, {"p": {"a.so": "/a.so"}})
        self.assertEqual(status, 1)
        self.assertIn("p b.so: expected a module; seen none\n", output)

    def test_a_module_that_the_table_lacks_is_a_deviation(self):
        status, output = self.main({"p": {}}, {"p": {"a.so": "/a.so"}})
        self.assertEqual(status, 1)
        self.assertIn("p a.so: expected no such module; seen /a.so\n", output)

    def test_a_missing_package_is_left_out_aloud(self):
        status, output = self.main({"p": {"a.so": self.CRASH}, "q": {}}, {"p": {"a.so": "/a.so"}})
        self.assertEqual(status, 0)
        self.assertIn("left out: q is not installed\n", output)

    def test_nothing_to_run_is_neither_success_nor_failure(self):
        self.assertEqual(self.main({"p": {"a.so": "passes"}}, {})[0], 77)

    def test_a_missing_package_that_is_required_is_a_deviation(self):
        table = {"p": {"a.so": "passes"}}
        self.assertEqual(self.main(table, {}, "--required")[0], 1)
        self.assertEqual(self.main(table, {}, required="required")[0], 1)

    def test_the_table_has_a_line_for_each_run(self):
        output = self.main({"p": {"a.so": self.CRASH}}, {"p": {"a.so": "/a.so"}}, "--table")[1]
        self.assertRegex(output, rf"^p\ta.so\t{self.CRASH}\t\d+\.\d\d\n")


class Unpacked(ScriptedProgram):
    """Packages in a folder, as fetch_i386.py leaves them."""
    LACKS_A_LIBRARY = "echo 'libGL.so.1: cannot open shared object file' >&2; echo '!failed'; exit 3"

    def setUp(self):
        super().setUp()
        self.root = pathlib.Path(os.path.realpath(self.path.parent), "root")
        self.put("p/usr/lib/vst/a.so")

    def put(self, name, content=""):
        path = self.root / name
        path.parent.mkdir(parents=True, exist_ok=True)
        path.write_text(content)

    def main(self, table, *arguments):
        with mock.patch.object(real_plugins, "exports_entry_point", lambda path: "helper" not in path):
            return super().main(table, {}, "--root", str(self.root), *arguments)

    def test_modules_are_found_below_the_folder_of_their_package(self):
        self.put("p/usr/lib/vst/ProM.vst/ProM.so")
        self.put("p/usr/lib/vst/x/helper.so")
        self.put("p/usr/lib/vst/notes.txt")
        self.put("p/usr/lib/ladspa/b.so")
        with mock.patch.object(real_plugins, "exports_entry_point", lambda path: "helper" not in path):
            unpacked = real_plugins.UnpackedPackages(self.root)
            self.assertEqual(unpacked.modules("p"), {
                "a.so": f"{self.root}/p/usr/lib/vst/a.so", "ProM.vst": f"{self.root}/p/usr/lib/vst/ProM.vst"})
            self.assertIsNone(unpacked.modules("q"))

    def test_the_libraries_beside_are_found(self):
        self.write('echo "$LD_LIBRARY_PATH" >&2; exit 3')
        output = self.main({"p": {"a.so": "passes"}})[1]
        self.assertIn(f"    {self.root}/libraries/usr/lib/i386-linux-gnu:"
                      f"{self.root}/libraries/lib/i386-linux-gnu\n", output)

    def test_what_the_archive_lacked_is_left_out_aloud(self):
        self.put("missing", "q\nlibgl1\n")
        self.put("r/usr/lib/vst/c.so")
        self.write(f"case $1 in */c.so) {self.LACKS_A_LIBRARY};; esac; exit 0")
        status, output = self.main({"p": {"a.so": "no total, status 0"}, "q": {"b.so": "passes"},
                                    "r": {"c.so": "passes"}}, "--required")
        self.assertIn("left out: q could not be fetched\n", output)
        self.assertIn("left out: r c.so, libGL.so.1: cannot open shared object file\n", output)
        self.assertRegex(output, r"\n1 plug-ins run in \d+ s, 0 deviations\n$")
        self.assertEqual(status, 0)

    def test_the_five_modules_that_need_no_library_are_never_left_out(self):
        names = ["Kars-vst.so", "MaBitcrush-vst.so", "MaFreeverb-vst.so", "MaGigaverb-vst.so", "MaPitchshift-vst.so"]
        for name in [*names, "MVerb-vst.so"]:
            self.put(f"dpf-plugins-vst/usr/lib/vst/{name}")
        self.put("missing", "libgl1\n")
        self.write(self.LACKS_A_LIBRARY)
        status, output = self.main({"dpf-plugins-vst": dict.fromkeys([*names, "MVerb-vst.so"], "passes")})
        self.assertEqual(status, 1)
        for name in names:
            self.assertIn(f"dpf-plugins-vst {name}: expected passes; seen ", output)
        self.assertIn("left out: dpf-plugins-vst MVerb-vst.so, ", output)
        self.assertRegex(output, r"\n5 plug-ins run in \d+ s, 5 deviations\n$")

    def test_nor_is_their_package_when_required(self):
        self.put("missing", "dpf-plugins-vst\n")
        table = {"dpf-plugins-vst": {"Kars-vst.so": "passes"}}
        self.assertEqual(self.main(table, "--required")[0], 1)
        self.assertEqual(self.main(table)[0], 77)

    def test_the_table_names_them(self):
        modules = real_plugins.expected_ends("expectations_i386.tsv")["dpf-plugins-vst"]
        self.assertEqual(real_plugins.NEED_NO_LIBRARY["dpf-plugins-vst"] - modules.keys(), set())

    def test_a_library_that_lacks_though_everything_was_fetched_is_a_deviation(self):
        self.put("missing", "")
        self.write(self.LACKS_A_LIBRARY)
        self.assertEqual(self.main({"p": {"a.so": "passes"}})[0], 1)

    def test_a_package_that_lacks_though_the_archive_had_it_is_a_deviation_when_required(self):
        self.assertEqual(self.main({"q": {"b.so": "passes"}}, "--required")[0], 1)
        self.assertEqual(self.main({"q": {"b.so": "passes"}})[0], 77)


class Run(ScriptedProgram):
    def errors_of(self, body):
        self.write(body)
        return real_plugins.run(str(self.path), "/some/module.so")[1]

    def test_the_module_is_the_only_argument(self):
        self.assertEqual(self.errors_of('echo "$#:$1" >&2'), "1:/some/module.so\n")

    def test_home_is_an_empty_folder_of_its_own(self):
        body = 'test -z "$(ls -A "$HOME")" && touch "$HOME/file" && echo "$HOME" >&2'
        first, second = self.errors_of(body), self.errors_of(body)
        self.assertNotEqual(first, "")
        self.assertNotEqual(second, "")
        self.assertNotEqual(first, second)

    def test_there_is_no_display_and_the_locale_is_c(self):
        with mock.patch.dict(os.environ, {"DISPLAY": ":0", "LC_ALL": "de_DE.UTF-8", "XDG_CONFIG_HOME": "/etc"}):
            self.assertEqual(self.errors_of('echo "[$DISPLAY][$LC_ALL][$XDG_CONFIG_HOME]" >&2'), "[][C][]\n")

    def test_a_run_that_never_ends_is_stopped(self):
        self.write("echo total, 64; sleep 1000 & wait")
        with mock.patch.object(real_plugins, "TIME_LIMIT_IN_SECONDS", 0.5):
            self.assertEqual(real_plugins.run(str(self.path), "/a.so")[0], "step 0, out of time")


class Table(unittest.TestCase):
    def test_it_names_200_modules_of_seven_packages(self):
        ends = real_plugins.expected_ends()
        self.assertEqual({package: len(modules) for package, modules in ends.items()}, {
            "amsynth": 1, "dpf-plugins-vst": 15, "dragonfly-reverb-vst": 4, "iem-plugin-suite-vst": 21,
            "lsp-plugins-vst": 134, "zam-plugins": 17, "zynaddsubfx-vst": 8})

    def test_the_one_for_i386_names_the_same_modules(self):
        names = [{package: sorted(modules) for package, modules in ends.items()}
                 for ends in (real_plugins.expected_ends(), real_plugins.expected_ends("expectations_i386.tsv"))]
        self.assertEqual(names[0], names[1])

    def test_a_folder_stands_for_the_shared_object_in_it(self):
        self.assertIn("ProM.vst", real_plugins.expected_ends()["dpf-plugins-vst"])


if __name__ == "__main__":
    unittest.main()
