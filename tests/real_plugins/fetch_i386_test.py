# SPDX-License-Identifier: MIT
"""Tests of fetch_i386. Two shell scripts stand in for apt-get and dpkg."""
import contextlib
import io
import os
import pathlib
import subprocess
import tempfile
import unittest
from unittest import mock

import fetch_i386


class Fetch(unittest.TestCase):
    APT_GET = """#!/bin/sh
case "$*" in
  *--print-uris) for name in amsynth dpf-plugins-vst libgl1 libc6; do echo "'http://x/' ${name}_1.deb 1 "; done ;;
  *--download-only*)
    cd "$(sed -n 's/^Dir::Cache "\\(.*\\)";/\\1/p' "$APT_CONFIG")/archives"
    for name in $IN_THE_ARCHIVE; do touch "${name}_1.deb"; done ;;
esac
"""

    def setUp(self):
        temporary = tempfile.TemporaryDirectory()
        self.addCleanup(temporary.cleanup)
        self.folder = pathlib.Path(os.path.realpath(temporary.name))

    def put(self, name, content):
        path = self.folder / name
        path.parent.mkdir(parents=True, exist_ok=True)
        path.write_text(content)
        path.chmod(0o755)

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
