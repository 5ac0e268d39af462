# SPDX-License-Identifier: MIT
"""Tests of `cmake --install`: which files it puts where, below a staging folder and below prefixes of all kinds; and
that all files that name the version name the same one.

    install_test.py BUILD SAMPLE_PLUGIN HAS_SCAN

HAS_SCAN is 1 when vsttorture-scan is part of the build, else 0. The build is the one that is being tested, so each
preset installs its own programs.
"""
import json
import os
import pathlib
import re
import stat
import subprocess
import sys
import tempfile
import unittest

SOURCE = pathlib.Path(__file__).resolve().parent.parent
PROGRAMS = ["bin/vsttorture", "bin/vsttorture-describe", "bin/vsttorture-worker"]
COPIES = {
    "share/doc/vsttorture/FLIGHT_RECORD.md": "docs/FLIGHT_RECORD.md",
    "share/doc/vsttorture/PROTOCOL.md": "docs/PROTOCOL.md",
    "share/doc/vsttorture/WHEN_A_PLUGIN_FAILS.md": "docs/WHEN_A_PLUGIN_FAILS.md",
    "share/doc/vsttorture/changelog": "docs/changelog",
    "share/doc/vsttorture/copyright": "docs/copyright",
    "share/doc/vsttorture/examples/explain_plugin.py": "docs/examples/explain_plugin.py",
    "share/doc/vsttorture/examples/try_plugin.cpp": "docs/examples/try_plugin.cpp",
    "share/doc/vsttorture/examples/try_plugin.py": "docs/examples/try_plugin.py",
    "share/doc/vsttorture/schema/plugin-description.schema.json": "docs/schema/plugin-description.schema.json",
    "share/man/man1/vsttorture-describe.1": "docs/vsttorture-describe.1",
    "share/man/man1/vsttorture-worker.1": "docs/vsttorture-worker.1",
    "share/man/man1/vsttorture.1": "docs/vsttorture.1",
}
SCAN_PROGRAM = "bin/vsttorture-scan"
COPIES_FOR_SCAN = {
    "share/bash-completion/completions/vsttorture-scan": "completions/vsttorture-scan.bash",
    **{f"share/doc/vsttorture/{name}": f"docs/{name}" for name in (
        "BREAKS_MY_SESSION.md", "IN_YOUR_CI.md", "IN_YOUR_HOST.md", "RESULTS_DATABASE.md",
        "VERDICTS.md", "examples/ci/github-workflow.yml",
        "examples/ci/gitlab-ci.yml", "examples/ci/torture.sh", "examples/many_machines/scan_array.sh",
        "examples/many_machines/scan_on_hosts.sh", "examples/read_scan.cpp", "examples/read_scan.py")},
    "share/doc/vsttorture/schema/scan-events.schema.json": "docs/schema/scan-events.schema.json",
    "share/man/man1/vsttorture-scan.1": "docs/vsttorture-scan.1",
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
        """Below the root lie the files of an installation with this prefix and no others, and the programs run."""
        found = {str(path.relative_to(root)): stat.S_IMODE(path.stat().st_mode)
                 for path in root.rglob("*") if not path.is_dir()}
        copies = {**COPIES, **(COPIES_FOR_SCAN if has_scan else {})}
        programs = PROGRAMS + ([SCAN_PROGRAM] if has_scan else [])
        self.assertEqual(found, {f"{prefix}{name}": 0o755 if self.is_executable(name) else 0o644
                                 for name in [*programs, *copies]})
        for name, source in copies.items():
            self.assertEqual((root / f"{prefix}{name}").read_bytes(), (SOURCE / source).read_bytes())
        for program in "vsttorture", "vsttorture-worker":
            run = self.run_on_sample_plugin(root / f"{prefix}bin/{program}")
            self.assertEqual((run.returncode, run.stdout.splitlines()[:2]),
                             (0, ["total, 64", "1, test gathering info"]))
        run = self.run_on_sample_plugin(root / f"{prefix}bin/vsttorture-describe")
        self.assertEqual((run.returncode, json.loads(run.stdout)["name"]), (0, "Well-behaved effect"))
        if has_scan:  # It uses the worker that lies beside it, which in a build with a sanitizer can have no limit.
            run = self.run_on_sample_plugin(root / f"{prefix}{SCAN_PROGRAM}", "--cache", "off", "--memory", str(1 << 30))
            self.assertEqual((run.returncode, run.stdout.splitlines()[-1].split(", in ")[0]),
                             (0, "1 result: 1 passed"))

    def is_executable(self, name):
        return name.startswith("bin/") or ("/examples/" in name and name.endswith((".py", ".sh")))

    def run_on_sample_plugin(self, program, *options):
        return subprocess.run([program, *options, sample_plugin], stdout=subprocess.PIPE, text=True, check=False)

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
        found = {
            "docs/changelog": self.first(r"\Avsttorture \(([^)]+)\)", SOURCE / "docs/changelog"),
            "CHANGELOG.md": self.first(r"^## (\S+)", SOURCE / "CHANGELOG.md"),
        }
        pages = list((SOURCE / "docs").glob("*.1"))
        self.assertGreaterEqual(len(pages), len(PROGRAMS))
        for page in pages:
            found[page.name] = self.first(rf'\A\.TH {page.stem.upper()} 1 \S+ "vsttorture ([^"]+)"', page)
        self.assertEqual(found, dict.fromkeys(found, self.first(
            r"^CMAKE_PROJECT_VERSION:STATIC=(.*)$", pathlib.Path(build, "CMakeCache.txt"))))


if __name__ == "__main__":
    build, sample_plugin, has_scan = sys.argv[1:3] + [sys.argv[3] == "1"]
    unittest.main(argv=sys.argv[:1])
