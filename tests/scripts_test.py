# SPDX-License-Identifier: MIT
"""Tests of ./run and ./check in a world of their own: a copy of the scripts, and a PATH on which apt, CMake and the
rest are doubles that write down how they are called. Nothing is built or installed.
"""
import os
import pathlib
import select
import shutil
import signal
import subprocess
import tempfile
import time
import unittest

SOURCE = pathlib.Path(__file__).resolve().parent.parent
REAL_TOOLS = ["awk", "basename", "bash", "cat", "chmod", "dirname", "env", "flock", "grep", "mkdir", "mktemp",
              "readlink", "rm", "sed", "sort", "touch", "uname"]

DOUBLES = {
    "id": "echo ${FAKE_USER_ID:-0}",
    "dpkg-query": "exit 1",
    "g++": "exit 0",
    "c++": "exit 0",
    "ninja": "exit 0",
    "pkg-config": "exit 0",
    "bwrap": "exit 0",
    "python3": "exit 0",
    "ctest": 'echo "ctest $*" >>"$FAKE_LOG"; exit ${FAKE_CTEST_STATUS:-0}',
    # What it installs are doubles that were missing.
    "apt-get": '''
        echo "apt-get $*" >>"$FAKE_LOG"
        [[ -z ${FAKE_INTERRUPTED:-} ]] || { trap "" INT; kill -INT 0; exit 100; }
        [[ $1 == update ]] || cp "$FAKE_SHOP"/* "${0%/*}"
        exit ${FAKE_APT_STATUS:-0}''',
    "sudo": 'echo "sudo $*" >>"$FAKE_LOG"; exec "$@"',
    # Its programs print their names and arguments and end with status 42.
    "cmake": '''
        [[ $1 != --version ]] || { echo "cmake version ${FAKE_CMAKE_VERSION:-3.25.1}"; exit; }
        echo "cmake $*" >>"$FAKE_LOG"
        echo "cmake speaks"
        if [[ $1 == --preset ]]; then
          folder=$4
          { echo "CMAKE_HOME_DIRECTORY:INTERNAL=$PWD"; echo "CMAKE_PROJECT_NAME:STATIC=vsttorture"
            for word; do [[ $word != -D* ]] || echo "${word/=/:BOOL=}" | sed s/^-D//; done
          } >"$folder/CMakeCache.txt"
          touch "$folder/build.ninja"
        else
          [[ -z ${FAKE_BUILD_FAILS:-} ]] || exit 1
          printf '#!/usr/bin/env bash\\necho "program $*"\\nexit 42\\n' >"$2/vsttorture"
          printf '#!/usr/bin/env bash\\necho "scan $*"\\nexit 42\\n' >"$2/vsttorture-scan"
          chmod +x "$2/vsttorture" "$2/vsttorture-scan"
        fi''',
}


class Script(unittest.TestCase):
    def setUp(self):
        temporary = tempfile.TemporaryDirectory()
        self.addCleanup(temporary.cleanup)
        self.folder = pathlib.Path(temporary.name).resolve()
        self.root = self.folder / "source"
        self.bin = self.folder / "bin"
        self.shop = self.folder / "shop"
        self.log = self.folder / "log"
        for folder in (self.root / "scripts", self.bin, self.shop):
            folder.mkdir(parents=True)
        for name in ("run", "check", "scan", "scripts/build.sh", "CMakePresets.json"):
            shutil.copy(SOURCE / name, self.root / name)
        for tool in [*REAL_TOOLS, "cp"]:
            (self.bin / tool).symlink_to(shutil.which(tool))
        for name, text in DOUBLES.items():
            self.add_double(name, text)

    def add_double(self, name, text):
        (self.bin / name).write_text(f"#!{shutil.which('bash')}\n{text}\n")
        (self.bin / name).chmod(0o755)

    def take_away(self, *tools):
        """The tools are missing, and apt has them."""
        for tool in tools:
            (self.bin / tool).rename(self.shop / tool)

    def take_away_for_good(self, *tools):
        for tool in tools:
            (self.bin / tool).unlink()

    def start(self, command, *arguments, **variables):
        """What the command prints, its messages, its status, and the calls of the doubles."""
        self.log.write_text("")
        result = subprocess.run(
            [self.root / command, *arguments], cwd=self.folder, stdin=subprocess.DEVNULL, stdout=subprocess.PIPE,
            stderr=subprocess.PIPE, text=True, check=False, start_new_session=True, timeout=60,
            env={"PATH": str(self.bin), "FAKE_LOG": str(self.log), "FAKE_SHOP": str(self.shop), **variables})
        return result.stdout, result.stderr, result.returncode, self.log.read_text().splitlines()

    def build_calls(self, build, targets, options=("-DVSTTORTURE_WERROR=OFF",)):
        return [" ".join(["cmake --preset release -B", str(build), *options]), f"cmake --build {build} {targets}"]


class Run(Script):
    def test_it_builds_the_program_and_ends_as_the_program_does(self):
        build = self.root / "build/release"
        self.assertEqual(self.start("run", "a plug-in.so", "7"),
                         ("program a plug-in.so 7\n", "cmake speaks\n" * 2, 42,
                          self.build_calls(build, "--target vsttorture")))

    def test_without_arguments_the_plug_in_is_the_sample(self):
        build = self.root / "build/release"
        output, _, status, calls = self.start("run")
        self.assertEqual((output, status), (f"program {build}/plugins/well_behaved_effect.so\n", 42))
        self.assertEqual(calls, self.build_calls(build, "--target vsttorture well_behaved_effect"))

    def test_a_second_run_does_not_configure_again(self):
        self.start("run")
        self.assertEqual(len(self.start("run")[3]), 1)

    def test_a_checkout_that_was_moved_is_configured_anew(self):
        self.start("run")
        stale = self.root / "build/release/CMakeFiles/stale"
        stale.parent.mkdir()
        stale.write_text("")
        self.root = self.root.rename(self.folder / "elsewhere")
        build = self.root / "build/release"
        _, _, status, calls = self.start("run", "x.so")
        self.assertEqual((status, calls), (42, self.build_calls(build, "--target vsttorture")))
        self.assertFalse((build / "CMakeFiles/stale").exists())

    def test_the_build_goes_where_the_user_says(self):
        for folder in (str(self.folder / "my builds"), "my builds"):
            with self.subTest(folder=folder):
                output, _, status, _ = self.start("run", "x.so", VSTTORTURE_BUILD=folder)
                self.assertEqual((output, status), ("program x.so\n", 42))
                self.assertTrue((self.folder / "my builds/release/vsttorture").exists())
                self.assertFalse((self.root / "build").exists())

    def test_a_folder_with_the_build_of_another_project_is_left_alone(self):
        build = self.folder / "builds/release"
        build.mkdir(parents=True)
        (build / "CMakeCache.txt").write_text("CMAKE_PROJECT_NAME:STATIC=other\nCMAKE_HOME_DIRECTORY:INTERNAL=/other\n")
        _, messages, status, calls = self.start("run", VSTTORTURE_BUILD=str(build.parent))
        self.assertEqual((status, calls), (125, []))
        self.assertIn(f"run: {build} holds a build of another project (other). Name another", messages)
        self.assertTrue((build / "CMakeCache.txt").exists())

    def test_a_folder_that_cannot_be_written_is_named(self):
        (self.root / "build").write_text("a file, which stops root too")
        _, messages, status, calls = self.start("run")
        self.assertEqual((status, calls), (125, []))
        self.assertIn(f"run: cannot write to {self.root}/build/release. Name another folder for the build:  "
                      f"VSTTORTURE_BUILD=/some/folder {self.root}/run\n", messages)

    def test_a_build_that_fails_is_status_125(self):
        output, messages, status, _ = self.start("run", FAKE_BUILD_FAILS="yes")
        self.assertEqual((output, status), ("", 125))
        self.assertTrue(messages.endswith("run: the program could not be built, so no plug-in was tried\n"))

    def test_a_cmake_that_is_too_old_is_named(self):
        for version, status in (("3.20.6", 125), ("3.9", 125), ("3.21", 42), ("3.21.0-rc1", 42), ("4.0.0", 42)):
            with self.subTest(version=version):
                _, messages, found, _ = self.start("run", "x.so", FAKE_CMAKE_VERSION=version)
                self.assertEqual(found, status)
                wanted = f"run: CMake 3.21 or newer is needed; {self.bin}/cmake is version {version}.\n"
                self.assertEqual(wanted in messages, status == 125)

    def test_help_builds_nothing(self):
        for option in ("-h", "--help"):
            output, messages, status, calls = self.start("run", option)
            self.assertEqual((output.splitlines()[0], messages, status, calls),
                             ("usage: ./run [BUNDLE [CHILD_ID]]", "", 0, []))


class Installing(Script):
    def test_what_is_missing_is_announced_and_installed(self):
        self.take_away("cmake", "ninja")
        _, messages, status, calls = self.start("run", "x.so")
        self.assertEqual(messages.splitlines()[0],
                         "run: installing cmake ninja-build with apt-get, wanted to build the program")
        self.assertEqual((status, calls[:2]),
                         (42, ["apt-get update -qq",
                               "apt-get install -qq --no-install-recommends cmake ninja-build"]))

    def test_a_compiler_is_what_cmake_takes_for_one(self):
        self.take_away("g++")
        self.assertEqual(self.start("run", "x.so")[2:][0], 42)
        self.take_away("c++")
        self.assertEqual(self.start("run", "x.so", CXX=str(self.bin / "ninja"))[3][0][:5], "cmake")
        self.assertEqual(self.start("run", "x.so")[3][1], "apt-get install -qq --no-install-recommends g++")

    def test_other_users_install_through_sudo(self):
        self.take_away("ninja")
        calls = self.start("run", "x.so", FAKE_USER_ID="1000")[3]
        self.assertEqual([call for call in calls if call.startswith("sudo")],
                         ["sudo env apt-get update -qq", "sudo env DEBIAN_FRONTEND=noninteractive apt-get install -qq "
                                                         "--no-install-recommends ninja-build"])

    def test_without_rights_the_command_to_type_is_printed(self):
        self.take_away("ninja")
        self.take_away_for_good("sudo")
        _, messages, status, calls = self.start("run", "x.so", FAKE_USER_ID="1000")
        self.assertEqual((status, calls), (125, []))
        self.assertEqual(messages, "run: ninja-build missing, wanted to build the program. Type as root, then start "
                                   "again:\nrun:   apt-get update && apt-get install --no-install-recommends "
                                   "ninja-build\nrun: the program could not be built, so no plug-in was tried\n")

    def test_without_apt_what_is_missing_is_named(self):
        self.take_away_for_good("ninja", "apt-get")
        _, messages, status, calls = self.start("run", "x.so")
        self.assertEqual((status, calls), (125, []))
        self.assertIn("run: ninja-build missing, wanted to build the program (these are the names of Debian's "
                      "packages). Install them, then start again.\n", messages)

    def test_an_apt_that_fails_ends_the_script(self):
        self.take_away("ninja")
        _, messages, status, calls = self.start("run", "x.so", FAKE_APT_STATUS="100")
        self.assertEqual((status, calls), (125, ["apt-get update -qq"]))
        self.assertIn("run: apt-get failed. What it should do is:  apt-get update && apt-get install", messages)

    def test_ctrl_c_in_apt_ends_the_script_although_apt_catches_it(self):
        for command in ("run", "check"):
            with self.subTest(command=command):
                self.take_away("ninja")
                _, messages, status, calls = self.start(command, FAKE_INTERRUPTED="yes")
                self.assertEqual((status, calls), (128 + signal.SIGINT, ["apt-get update -qq"]))
                self.assertNotIn("could not be built", messages)
                (self.shop / "ninja").rename(self.bin / "ninja")


class Scan(Script):
    def setUp(self):
        super().setUp()
        self.take_away_for_good("apt-get")  # Whether this machine has the scan's libraries is of no interest.

    def test_it_builds_the_programs_and_ends_as_the_scan_does(self):
        output, _, status, calls = self.start("scan", "--quiet", "a folder")
        self.assertEqual((output, status), ("scan --quiet a folder\n", 42))
        self.assertEqual(calls, self.build_calls(
            self.root / "build/release", "--target vsttorture-scan vsttorture-worker vsttorture-describe",
            ("-DVSTTORTURE_SCAN=ON", "-DVSTTORTURE_WERROR=OFF")))

    def test_a_scan_gets_the_32_bit_workers_and_the_other_commands_do_not(self):
        worker = self.root / "build/x86/vsttorture-worker"
        worker.parent.mkdir(parents=True)
        worker.touch(mode=0o755)
        for arguments, output in [(["a folder"], f"scan --workers {worker.parent} a folder\n"),
                                  (["history"], "scan history\n"), (["report", "a"], "scan report a\n")]:
            with self.subTest(arguments=arguments):
                self.assertEqual(self.start("scan", *arguments)[0], output)

    def test_without_a_sandbox_it_says_so_and_goes_on(self):
        self.take_away_for_good("bwrap")
        _, messages, status, _ = self.start("scan")
        self.assertEqual(status, 42)
        self.assertIn("scan: plug-ins run without a sandbox\n", messages)

    def test_two_at_once_build_one_after_the_other(self):
        go_on = self.folder / "go on"
        self.add_double("cmake", 'case $1 in --version) echo "cmake version 3.25.1" ;; *) echo begin >>"$FAKE_LOG"; '
                        'until [[ -e $FAKE_GO_ON ]]; do sleep 0.01; done; echo end >>"$FAKE_LOG"; exit 1 ;; esac')
        (self.bin / "sleep").symlink_to(shutil.which("sleep"))
        environment = {"PATH": str(self.bin), "FAKE_LOG": str(self.log), "FAKE_GO_ON": str(go_on)}
        scans = [subprocess.Popen([self.root / "scan"], env=environment, stdin=subprocess.DEVNULL,
                                  stdout=subprocess.DEVNULL, stderr=subprocess.PIPE, text=True) for _ in range(3)]
        self.addCleanup(go_on.touch)
        # One builds until the two others have said that they wait.
        deadline = time.monotonic() + 60
        waiting = []
        while len(waiting) < 2 and time.monotonic() < deadline:
            for scan in select.select([scan.stderr for scan in scans if scan not in waiting], [], [], 1)[0]:
                self.assertEqual(scan.readline(), "scan: waiting for another build of this checkout\n")
                waiting += [one for one in scans if one.stderr is scan]
        go_on.touch()
        for scan in scans:
            scan.communicate(timeout=60)
        self.assertEqual(len(waiting), 2)
        self.assertEqual(self.log.read_text().splitlines(), ["begin", "end"] * 3)

    def test_a_build_that_fails_is_status_3(self):
        _, messages, status, _ = self.start("scan", FAKE_BUILD_FAILS="yes")
        self.assertEqual(status, 3)
        self.assertTrue(messages.endswith("scan: vsttorture-scan could not be built, so no plug-in was tried\n"))


class Check(Script):
    OPTIONS = ("-DBUILD_TESTING=ON", "-DVSTTORTURE_REQUIRE_TESTS=ON", "-DVSTTORTURE_SCAN=ON",
               "-DVSTTORTURE_WERROR=ON")

    def setUp(self):
        super().setUp()
        self.take_away_for_good("apt-get")  # Whether this machine has gmock's header is of no interest.

    def ctest_call(self, *arguments):
        return " ".join([f"ctest --test-dir {self.root}/build/release --output-on-failure --no-tests=error "
                         "--timeout 300 -j 2", *arguments])

    def test_it_builds_all_with_warnings_as_errors_and_runs_ctest(self):
        _, _, status, calls = self.start("check", "-R", "RunPlan")
        build = [call.rstrip() for call in self.build_calls(self.root / "build/release", "", self.OPTIONS)]
        self.assertEqual((status, [call.rstrip() for call in calls]), (0, [*build, self.ctest_call("-R RunPlan")]))

    def test_after_run_it_configures_again_and_run_keeps_that(self):
        self.start("run")
        self.assertEqual(len(self.start("check")[3]), 3)
        self.assertEqual(len(self.start("check")[3]), 2)
        self.assertEqual(len(self.start("run")[3]), 1)

    def test_the_status_is_that_of_ctest(self):
        self.assertEqual(self.start("check", FAKE_CTEST_STATUS="8")[2], 8)

    def test_a_build_that_fails_is_status_125(self):
        _, messages, status, _ = self.start("check", FAKE_BUILD_FAILS="yes")
        self.assertEqual(status, 125)
        self.assertTrue(messages.endswith("check: the tests could not be built, so none was run\n"))

    def test_help_builds_nothing(self):
        output, messages, status, calls = self.start("check", "--help")
        self.assertEqual((output.splitlines()[0], messages, status, calls),
                         ("usage: ./check [CTEST_ARGUMENT...]", "", 0, []))


if __name__ == "__main__":
    unittest.main()
