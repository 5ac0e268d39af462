# SPDX-License-Identifier: MIT
"""Tests of `cmake --install`: which files it puts where, below a staging folder and below prefixes of all kinds; and
that all files that name the version name the same one.

    install_test.py BUILD SAMPLE_PLUGIN

The build is the one that is being tested, so each preset installs its own program.
"""
import os
import pathlib
import re
import stat
import subprocess
import sys
import tempfile
import unittest

SOURCE = pathlib.Path(__file__).resolve().parent.parent
INSTALLED = {
    "bin/vsttorture": 0o755,
    "share/doc/vsttorture/PROTOCOL.md": 0o644,
    "share/doc/vsttorture/changelog": 0o644,
    "share/doc/vsttorture/copyright": 0o644,
    "share/doc/vsttorture/examples/try_plugin.cpp": 0o644,
    "share/doc/vsttorture/examples/try_plugin.py": 0o755,
    "share/man/man1/vsttorture.1": 0o644,
}
COPIES = {
    "share/doc/vsttorture/PROTOCOL.md": "docs/PROTOCOL.md",
    "share/doc/vsttorture/changelog": "docs/changelog",
    "share/doc/vsttorture/copyright": "docs/copyright",
    "share/doc/vsttorture/examples/try_plugin.cpp": "docs/examples/try_plugin.cpp",
    "share/doc/vsttorture/examples/try_plugin.py": "docs/examples/try_plugin.py",
    "share/man/man1/vsttorture.1": "docs/vsttorture.1",
}


class Install(unittest.TestCase):
    def setUp(self):
        temporary = tempfile.TemporaryDirectory()
        self.addCleanup(temporary.cleanup)
        self.folder = pathlib.Path(temporary.name)

    def install(self, prefix, staging=None):
        environment = {name: value for name, value in os.environ.items() if name != "DESTDIR"}
        if staging:
            environment["DESTDIR"] = str(staging)
        subprocess.run(["cmake", "--install", build, "--prefix", str(prefix)], env=environment, check=True,
                       stdout=subprocess.DEVNULL)

    def check(self, root, prefix):
        """Below the root lie the files of an installation with this prefix and no others, and the program runs."""
        found = {str(path.relative_to(root)): stat.S_IMODE(path.stat().st_mode)
                 for path in root.rglob("*") if not path.is_dir()}
        self.assertEqual(found, {f"{prefix}{name}": mode for name, mode in INSTALLED.items()})
        for name, source in COPIES.items():
            self.assertEqual((root / f"{prefix}{name}").read_bytes(), (SOURCE / source).read_bytes())
        run = subprocess.run([root / f"{prefix}bin/vsttorture", sample_plugin], stdout=subprocess.PIPE, text=True,
                             check=False)
        self.assertEqual((run.returncode, run.stdout.splitlines()[:2]), (0, ["total, 64", "1, test gathering info"]))

    def test_a_staging_folder_holds_everything_below_the_prefix(self):
        for number, prefix in enumerate(("usr/", "usr/local/", "opt/two words/")):
            with self.subTest(prefix=prefix):
                staging = self.folder / f"staging {number}"
                self.install(f"/{prefix}", staging)
                self.check(staging, prefix)

    def test_without_one_the_prefix_itself_does(self):
        self.install(self.folder / "prefix")
        self.check(self.folder / "prefix", "")

    def test_a_second_installation_replaces_the_first(self):
        self.install(self.folder)
        (self.folder / "share/doc/vsttorture/PROTOCOL.md").write_text("old")
        self.install(self.folder)
        self.check(self.folder, "")


class Version(unittest.TestCase):
    def first(self, pattern, path):
        return re.search(pattern, pathlib.Path(path).read_text(), re.MULTILINE)[1]

    def test_every_file_that_names_the_version_names_that_of_the_build(self):
        self.assertEqual({
            "docs/vsttorture.1": self.first(r'^\.TH VSTTORTURE 1 \S+ "vsttorture ([^"]+)"', SOURCE / "docs/vsttorture.1"),
            "docs/changelog": self.first(r"\Avsttorture \(([^)]+)\)", SOURCE / "docs/changelog"),
            "CHANGELOG.md": self.first(r"^## (\S+)", SOURCE / "CHANGELOG.md"),
        }, dict.fromkeys(["docs/vsttorture.1", "docs/changelog", "CHANGELOG.md"],
                         self.first(r"^CMAKE_PROJECT_VERSION:STATIC=(.*)$", pathlib.Path(build, "CMakeCache.txt"))))


if __name__ == "__main__":
    build, sample_plugin = sys.argv[1:]
    unittest.main(argv=sys.argv[:1])
