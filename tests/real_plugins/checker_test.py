# SPDX-License-Identifier: MIT
"""Tests of real_plugins and fetch_i386: nothing that is wrong or missing goes unnoticed.

A shell script stands in for vsttorture; two others for apt-get and dpkg.
"""
import contextlib
import io
import os
import pathlib
import re
import subprocess
import tempfile
import unittest
from unittest import mock

import fetch_i386
import real_plugins
from program_run import as_printed, try_plugin

PASS = as_printed(64, [*try_plugin.FIXED_STEPS, *["inspect latency"] * 50])
LACKS_A_LIBRARY = "echo 'libGL.so.1: cannot open shared object file' >&2; exit 3"


class Scripted(unittest.TestCase):
    def setUp(self):
        temporary = tempfile.TemporaryDirectory()
        self.addCleanup(temporary.cleanup)
        self.folder = pathlib.Path(os.path.realpath(temporary.name))

    def put(self, name, content=""):
        path = self.folder / name
        path.parent.mkdir(parents=True, exist_ok=True)
        path.write_text(content)
        path.chmod(0o755)

    def check(self, script, table, *arguments, packages=()):
        """The status and the output of a whole call; packages: {package: {module: path}} of those installed."""
        self.put("program", f"#!/bin/sh\n{script}\n")
        output = io.StringIO()
        with mock.patch("sys.argv", ["real_plugins.py", "--program", f"{self.folder}/program", *arguments]), \
             mock.patch.object(real_plugins, "expected_verdicts", lambda _: table), \
             mock.patch.object(real_plugins.InstalledPackages, "modules", lambda _, name: dict(packages).get(name)), \
             mock.patch.object(real_plugins, "exports_entry_point", lambda path: "helper" not in path), \
             mock.patch.dict(os.environ, {"VSTTORTURE_REAL_PLUGINS": ""}), \
             contextlib.redirect_stdout(output):
            status = real_plugins.main()
        return status, re.sub(r" in \d+ s", "", output.getvalue())


class Installed(Scripted):
    """One module, of which a pass is expected."""

    def check_one(self, script, *arguments, table=None, packages=None):
        return self.check(script, table or {"p": {"a.so": "passed"}}, *arguments,
                          packages=packages or {"p": {"a.so": "/a.so"}})

    def test_a_pass_is_the_lines_of_the_run_and_nothing_else(self):
        self.assertEqual(self.check_one(f"printf '{PASS}'"), (0, "1 plug-ins run, 0 deviations\n"))
        for output in (f"hello\n{PASS}", f"{PASS}hello\n", PASS.replace("40, ", "hello40, ")):
            self.assertEqual(self.check_one(f"printf '{output}'"), (1, (
                "p a.so: expected passed; seen passed, with text of its own\n1 plug-ins run, 1 deviations\n")))

    def test_another_verdict_is_a_deviation_and_quotes_standard_error(self):
        self.assertEqual(self.check_one(f"printf '{PASS[:40]}'; echo reason >&2; exit 7"), (1, (
            "p a.so: expected passed; seen crashed at 1\n    reason\n1 plug-ins run, 1 deviations\n")))

    def test_modules_that_the_table_or_the_package_lacks_are_deviations(self):
        table = {"p": {"a.so": "passed", "b.so": "passed"}}
        status, output = self.check_one(f"printf '{PASS}'", table=table, packages={"p": {"a.so": "/a", "c.so": "/c"}})
        self.assertEqual(status, 1)
        self.assertIn("p b.so: expected a module; seen none\np c.so: expected no such module; seen /c\n", output)

    def test_a_missing_package_is_named_and_fails_only_when_required(self):
        missing = {"q": {"a.so": "passed"}}
        self.assertEqual(self.check_one("", table=missing),
                         (77, "left out: q is not installed\n0 plug-ins run, 0 deviations\n"))
        self.assertEqual(self.check_one("", "--required", table=missing)[0], 1)


class Unpacked(Scripted):
    """Packages in a folder, as fetch_i386.py leaves them."""

    def check(self, script, table, *arguments):
        return super().check(script, table, "--root", str(self.folder), *arguments)

    def test_a_module_is_a_file_with_an_entry_point_or_the_folder_around_it(self):
        for name in ("ProM.vst/ProM.so", "a.so", "x/helper.so", "notes.txt", "../ladspa/b.so"):
            self.put(f"p/usr/lib/vst/{name}")
        self.assertEqual(self.check(f"printf '{PASS}'", {"p": {"a.so": "passed", "ProM.vst": "passed"}}),
                         (0, "2 plug-ins run, 0 deviations\n"))

    def test_only_what_the_archive_lacked_is_left_out(self):
        self.put("p/usr/lib/vst/a.so")
        table = {"p": {"a.so": "passed"}, "q": {"b.so": "passed"}}
        self.put("missing", "q\nlibgl1\n")
        self.assertEqual(self.check(LACKS_A_LIBRARY, table), (77, (
            "left out: p a.so, libGL.so.1: cannot open shared object file\nleft out: q could not be fetched\n"
            "0 plug-ins run, 0 deviations\n")))
        self.put("missing")
        self.assertEqual(self.check(LACKS_A_LIBRARY, table)[0], 1)

    def test_the_five_modules_that_need_no_library_are_never_left_out(self):
        self.put("missing", "libgl1\n")
        table = {"dpf-plugins-vst": dict.fromkeys(real_plugins.NEED_NO_LIBRARY["dpf-plugins-vst"], "passed")}
        for name in table["dpf-plugins-vst"]:
            self.put(f"dpf-plugins-vst/usr/lib/vst/{name}")
        self.assertIn("5 plug-ins run, 5 deviations\n", self.check(LACKS_A_LIBRARY, table)[1])
        self.put("missing", "dpf-plugins-vst\n")
        (self.folder / "dpf-plugins-vst").rename(self.folder / "elsewhere")
        self.assertEqual(self.check("", table, "--required")[0], 1)


class Table(unittest.TestCase):
    def test_it_names_200_modules_of_seven_packages(self):
        verdicts = real_plugins.expected_verdicts("i386")
        self.assertEqual({package: len(modules) for package, modules in verdicts.items()}, {
            "amsynth": 1, "dpf-plugins-vst": 15, "dragonfly-reverb-vst": 4, "iem-plugin-suite-vst": 21,
            "lsp-plugins-vst": 134, "zam-plugins": 17, "zynaddsubfx-vst": 8})
        self.assertLessEqual(real_plugins.NEED_NO_LIBRARY["dpf-plugins-vst"], verdicts["dpf-plugins-vst"].keys())


class Fetch(Scripted):
    APT_GET = """#!/bin/sh
case "$*" in
  *--print-uris) for name in amsynth dpf-plugins-vst libgl1 libc6; do echo "'http://x/' ${name}_1.deb 1 "; done ;;
  *--download-only*)
    cd "$(sed -n 's/^Dir::Cache "\\(.*\\)";/\\1/p' "$APT_CONFIG")/archives"
    for name in $IN_THE_ARCHIVE; do touch "${name}_1.deb"; done ;;
esac
"""

    def fetch(self, in_the_archive):
        self.put("bin/apt-get", self.APT_GET)
        self.put("bin/dpkg", '#!/bin/sh\nmkdir -p "$3" && basename "$2" >> "$3/unpacked"\n')
        surroundings = {"PATH": f"{self.folder}/bin:/usr/bin:/bin", "IN_THE_ARCHIVE": in_the_archive}
        with mock.patch("sys.argv", ["fetch_i386.py", f"{self.folder}/to", "amsynth", "dpf-plugins-vst"]), \
             mock.patch.dict(os.environ, surroundings), \
             contextlib.redirect_stdout(io.StringIO()), contextlib.redirect_stderr(io.StringIO()):
            status = fetch_i386.main()
        unpacked = {file.parent.name: file.read_text().split() for file in self.folder.rglob("unpacked")}
        return status, (self.folder / "to/missing").read_text().split(), unpacked

    def test_packages_and_libraries_are_unpacked_apart_and_the_runtimes_not_at_all(self):
        self.assertEqual(self.fetch("amsynth dpf-plugins-vst libgl1 libc6"), (0, [], {
            "amsynth": ["amsynth_1.deb"], "dpf-plugins-vst": ["dpf-plugins-vst_1.deb"], "libraries": ["libgl1_1.deb"]}))

    def test_what_the_archive_lacks_is_written_down(self):
        self.assertEqual(self.fetch("dpf-plugins-vst libc6"),
                         (0, ["amsynth", "libgl1"], {"dpf-plugins-vst": ["dpf-plugins-vst_1.deb"]}))
        self.assertFalse((self.folder / "to/done").exists())

    def test_without_the_plugins_that_need_no_library_it_fails(self):
        self.assertEqual(self.fetch("amsynth libgl1 libc6")[:2], (1, ["dpf-plugins-vst"]))

    def test_apt_keeps_to_a_folder_of_its_own(self):
        apt = fetch_i386.Apt(self.folder)
        dump = subprocess.run(["apt-config", "dump"], env=apt.environment, capture_output=True, text=True).stdout
        for setting in (f'Dir::State "{self.folder}"', f'Dir::State::status "{self.folder}/status"',
                        f'Dir::Cache "{self.folder}/cache"', 'APT::Architectures:: "i386"'):
            self.assertIn(f"{setting};\n", dump)
        self.assertNotIn("amd64", dump)


if __name__ == "__main__":
    unittest.main()
