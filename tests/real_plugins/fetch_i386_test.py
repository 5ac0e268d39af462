# SPDX-License-Identifier: MIT
"""Tests of fetch_i386: what the archive lacks is told, and keeps nothing else away.

Two shell scripts stand in for apt-get and dpkg.
"""
import contextlib
import io
import os
import pathlib
import subprocess
import tempfile
import unittest
from unittest import mock

import fetch_i386

APT_GET = """#!/bin/sh
echo "$*" >> "$SCRIPTED/calls"
case "$*" in
  *update) exit "${UPDATE_STATUS:-0}" ;;
  *--print-uris)
    for package in amsynth dpf-plugins-vst libgl1 libc6; do
      case "$* libgl1 libc6" in
        *"$package"*) echo "'http://x/$package.deb' ${package}_1_i386.deb 1 MD5Sum:0" ;;
      esac
    done ;;
  *--download-only*)
    cache=$(sed -n 's/^Dir::Cache "\\(.*\\)";/\\1/p' "$APT_CONFIG")
    for package in amsynth dpf-plugins-vst libgl1 libc6; do
      case " $NOT_IN_THE_ARCHIVE " in *" $package "*) continue ;; esac
      touch "$cache/archives/${package}_1_i386.deb"
    done ;;
esac
"""
DPKG = """#!/bin/sh
mkdir -p "$3" && basename "$2" >> "$3/unpacked"
"""


class Fetch(unittest.TestCase):
    def setUp(self):
        temporary = tempfile.TemporaryDirectory()
        self.addCleanup(temporary.cleanup)
        self.scripts = pathlib.Path(temporary.name, "bin")
        self.scripts.mkdir()
        for name, text in (("apt-get", APT_GET), ("dpkg", DPKG)):
            (self.scripts / name).write_text(text)
            (self.scripts / name).chmod(0o755)
        self.folder = pathlib.Path(temporary.name, "fetched")

    def fetch(self, **environment):
        """The exit status and the output of a call for two packages."""
        output = io.StringIO()
        surroundings = {"PATH": f"{self.scripts}:/usr/bin:/bin", "SCRIPTED": str(self.scripts), **environment}
        with mock.patch("sys.argv", ["fetch_i386.py", str(self.folder), "amsynth", "dpf-plugins-vst"]), \
             mock.patch.dict(os.environ, surroundings), contextlib.redirect_stdout(output):
            status = fetch_i386.main()
        return status, output.getvalue()

    def unpacked(self):
        return {str(file.parent.relative_to(self.folder)): file.read_text().split()
                for file in self.folder.rglob("unpacked")}

    def test_packages_and_libraries_are_unpacked_apart_and_the_runtimes_not_at_all(self):
        self.assertEqual(self.fetch()[0], 0)
        self.assertEqual(self.unpacked(), {
            "amsynth": ["amsynth_1_i386.deb"], "dpf-plugins-vst": ["dpf-plugins-vst_1_i386.deb"],
            "libraries": ["libgl1_1_i386.deb"]})
        self.assertEqual((self.folder / "missing").read_text(), "")

    def test_a_second_call_has_nothing_to_do(self):
        self.fetch()
        calls = (self.scripts / "calls").read_text()
        self.assertEqual(self.fetch(), (0, ""))
        self.assertEqual((self.scripts / "calls").read_text(), calls)

    def test_an_index_that_does_not_come_is_told_and_no_failure(self):
        status, output = self.fetch(UPDATE_STATUS="100")
        self.assertEqual(status, 0)
        self.assertIn("not every index came; going on with those that did\n", output)

    def test_what_the_archive_lacks_is_told_and_written_down(self):
        status, output = self.fetch(NOT_IN_THE_ARCHIVE="amsynth libgl1")
        self.assertEqual(status, 0)
        self.assertIn("not fetched: amsynth\nnot fetched: libgl1\n", output)
        self.assertEqual((self.folder / "missing").read_text(), "amsynth\nlibgl1\n")
        self.assertEqual(self.unpacked(), {"dpf-plugins-vst": ["dpf-plugins-vst_1_i386.deb"]})
        self.assertFalse((self.folder / "done").exists())

    def test_without_the_plugins_that_need_no_library_it_fails(self):
        with contextlib.redirect_stderr(io.StringIO()) as errors:
            status, output = self.fetch(NOT_IN_THE_ARCHIVE="dpf-plugins-vst")
        self.assertEqual(status, 1)
        self.assertIn("not fetched: dpf-plugins-vst\n", output)
        self.assertEqual(errors.getvalue(),
                         "dpf-plugins-vst did not come, so there is no 32-bit plug-in that is sure to load\n")
        self.assertFalse((self.folder / "done").exists())

    def test_apt_keeps_to_a_folder_of_its_own(self):
        apt = fetch_i386.Apt(self.folder)
        dump = subprocess.run(["apt-config", "dump"], env=apt.environment, capture_output=True, text=True)
        self.assertIn(f'Dir::State "{self.folder}";\n', dump.stdout)
        self.assertIn(f'Dir::State::status "{self.folder}/status";\n', dump.stdout)
        self.assertIn(f'Dir::Cache "{self.folder}/cache";\n', dump.stdout)
        self.assertIn('APT::Architectures:: "i386";\n', dump.stdout)
        self.assertNotIn("amd64", dump.stdout)


if __name__ == "__main__":
    unittest.main()
