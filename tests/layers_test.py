# SPDX-License-Identifier: MIT
"""Checks what the folders of the program include (docs/ARCHITECTURE.md shows which may include which).

A folder may include itself and those below it; vst2/ may be included by host/ and above, flight_recorder/ by those
that make requests, report or load. Only platform/ asks
which operating system it is on, or includes a header that neither C++ nor POSIX has. In scanner/ a station may include
those before it, and nothing of what loads plug-ins but the layout and the reader of the flight record.

Tested on the program's own tree, and on small trees with one fault each.
"""
import pathlib
import re
import tempfile
import unittest

LAYERS = ["worker", "describer", "driver", "describe", "host", "loader", "support", "platform"]
PROGRAMS = ["worker", "describer"]  # Nobody builds on a program, the other one neither.
USERS_OF_VST2 = ["worker", "describer", "driver", "describe", "host", "vst2"]
USERS_OF_FLIGHT_RECORDER = ["worker", "describer", "driver", "host", "loader", "vst2", "flight_recorder"]
FOLDERS = [*LAYERS, "vst2", "flight_recorder"]
# Each with those that it may include beside itself.
STATIONS = {
    "system": [],
    "find": [],
    "plan": ["find"],
    "engine": ["system", "flight_recorder"],
    "judge": ["engine", "flight_recorder"],
    "events": ["find", "plan", "engine", "judge"],
    "store": ["find", "plan", "engine", "judge", "events"],
    "explain": ["find", "plan", "engine", "judge", "events"],
    "report": ["find", "plan", "engine", "judge", "events"],
    "scan": ["system", "find", "plan", "engine", "judge", "events", "store", "explain", "report"],
}
SUFFIXES = {".h", ".cpp", ".mm"}

POSIX_HEADERS = set("""
    aio.h arpa/inet.h dirent.h dlfcn.h fcntl.h fnmatch.h ftw.h glob.h grp.h iconv.h langinfo.h libgen.h mqueue.h
    net/if.h netdb.h netinet/in.h netinet/tcp.h nl_types.h poll.h pthread.h pwd.h regex.h sched.h search.h
    semaphore.h spawn.h strings.h sys/ipc.h sys/mman.h sys/msg.h sys/resource.h sys/select.h sys/sem.h sys/shm.h
    sys/socket.h sys/stat.h sys/statvfs.h sys/time.h sys/times.h sys/types.h sys/uio.h sys/un.h sys/utsname.h
    sys/wait.h syslog.h termios.h unistd.h utime.h wordexp.h
""".split())
C_HEADERS = set("""
    assert.h complex.h ctype.h errno.h fenv.h float.h inttypes.h iso646.h limits.h locale.h math.h setjmp.h
    signal.h stdalign.h stdarg.h stdbool.h stddef.h stdint.h stdio.h stdlib.h string.h tgmath.h time.h uchar.h
    wchar.h wctype.h
""".split())

# Comments, and the literals in which they cannot begin.
COMMENT = re.compile(r'"(?:\\.|[^"\\\n])*"|\'(?:\\.|[^\'\\\n])\'|//[^\n]*|/\*.*?\*/', re.DOTALL)
INCLUDE = re.compile(r'\s*#\s*(?:include|include_next|import)\s*(?:"([^"]*)"|<([^>]*)>|(\S.*))')
CONDITION = re.compile(r"\s*#\s*(?:if|ifdef|ifndef|elif)\b(.*)")
INCLUDE_QUESTION = re.compile(r"__has_include\s*\(\s*<([^>]*)>")
SYSTEM_MACRO = re.compile(
    r"\b(?:_*linux_*|_*gnu_linux_*|_*unix_*|__APPLE\w*|__MACH__|TARGET_OS_\w+|TARGET_CPU_\w+|_?WIN(?:32|64|DOWS)"
    r"|__(?:CYGWIN|MINGW32|MINGW64|ANDROID|FreeBSD|NetBSD|OpenBSD|DragonFly|sun|HAIKU)\w*)\b")


def without_comments(text):
    """The text with each comment replaced by its line breaks, and continued lines joined in their first."""
    def blank(match):
        return match[0] if match[0][0] in "\"'" else " " + "\n" * match[0].count("\n")

    text = COMMENT.sub(blank, text)
    return re.sub(r"((?:[^\n]*\\\n)+)([^\n]*)",
                  lambda match: match[0].replace("\\\n", " ") + "\n" * match[1].count("\\\n"), text)


def may_include(folder, other):
    if other in PROGRAMS:
        return folder == other
    if other == "vst2":
        return folder in USERS_OF_VST2
    if other == "flight_recorder":
        return folder in USERS_OF_FLIGHT_RECORDER
    return folder in LAYERS and other in LAYERS and LAYERS.index(other) >= LAYERS.index(folder)


def quoted_fault(folder, header):
    """What is wrong with #include "header" in a folder; None if nothing is."""
    other, slash, rest = header.partition("/")
    if not slash:
        return f'"{header}" does not name its folder'
    if not may_include(folder, other):
        return f"{folder}/ may not include {other}/"
    if other == "platform" != folder and "/" in rest:
        return f'"{header}" belongs to one operating system'
    return None


def angled_fault(folder, header):
    is_portable = re.fullmatch(r"[a-z_]+", header) or header in C_HEADERS | POSIX_HEADERS
    return None if folder == "platform" or is_portable else f"<{header}> is a header of an operating system"


def line_faults(folder, line):
    """What is wrong with one line of a source in a folder."""
    if include := INCLUDE.match(line):
        quoted, angled, computed = include.groups()
        if computed:
            yield f"#include {computed.strip()} cannot be read"
        else:
            yield quoted_fault(folder, quoted) if quoted is not None else angled_fault(folder, angled)
    if (condition := CONDITION.match(line)) and folder != "platform":
        if macro := SYSTEM_MACRO.search(condition[1]):
            yield f"{macro[0]} asks for an operating system"
        for header in INCLUDE_QUESTION.findall(condition[1]):
            yield angled_fault(folder, header)


def station_fault(station, header):
    """What is wrong with #include "header" in a station of scanner/; None if nothing is."""
    first, _, rest = header.partition("/")
    other = rest.partition("/")[0] if first == "scanner" else first
    if first not in ("scanner", "flight_recorder") or other not in [station, *STATIONS[station]]:
        return f"scanner/{station}/ may not include {header.rpartition('/')[0]}/"
    if other == "system" != station and rest.count("/") > 1:
        return f'"{header}" belongs to one operating system'
    return None


def station_faults(root):
    for station in STATIONS:
        for path in sources(root / "scanner" / station):
            for number, line in enumerate(without_comments(path.read_text()).split("\n"), 1):
                include = INCLUDE.match(line)
                fault = station_fault(station, include[1]) if include and include[1] is not None else None
                if fault:
                    yield f"{path.relative_to(root)}:{number}: {fault}"


def sources(folder):
    return sorted(path for path in folder.rglob("*") if path.suffix in SUFFIXES)


def faults(root):
    """All faults of the tree, each "folder/file:line: what"."""
    found = []
    for folder in FOLDERS:
        for path in sources(root / folder):
            for number, line in enumerate(without_comments(path.read_text()).split("\n"), 1):
                found += [f"{path.relative_to(root)}:{number}: {fault}"
                          for fault in line_faults(folder, line) if fault]
    return found + list(station_faults(root))


class TheProgram(unittest.TestCase):
    ROOT = pathlib.Path(__file__).resolve().parent.parent

    def test_no_folder_includes_what_it_may_not(self):
        self.assertEqual(faults(self.ROOT), [])

    def test_sources_of_every_folder_were_read(self):
        for folder in [*FOLDERS, *(f"scanner/{station}" for station in STATIONS)]:
            self.assertTrue(list(sources(self.ROOT / folder)), folder)
        self.assertEqual({path.name for path in (self.ROOT / "scanner").iterdir() if path.is_dir()}, set(STATIONS))


class Faults(unittest.TestCase):
    def faults_of(self, path, text):
        with tempfile.TemporaryDirectory() as root:
            file = pathlib.Path(root, path)
            file.parent.mkdir(parents=True)
            file.write_text(text)
            return faults(pathlib.Path(root))

    def assert_fine(self, path, text):
        self.assertEqual(self.faults_of(path, text), [])

    def assert_fault(self, path, text, fault):
        self.assertEqual(self.faults_of(path, text), [fault])

    def test_a_folder_may_include_those_below_and_no_other(self):
        self.assert_fine("host/a.h", '#include "loader/x.h"\n#include "vst2/x.h"\n#include "flight_recorder/x.h"\n')
        for folder, other in [("host", "describe"), ("worker", "describer"), ("support", "vst2"),
                              ("platform", "flight_recorder"), ("vst2", "host")]:
            with self.subTest(folder=folder, other=other):
                self.assert_fault(f"{folder}/a.h", f'#pragma once\n#include "{other}/x.h"\n',
                                  f"{folder}/a.h:2: {folder}/ may not include {other}/")

    def test_a_station_may_include_those_before_it_and_no_other(self):
        self.assert_fine("scanner/judge/a.h", '#include "scanner/engine/x.h"')
        self.assert_fault("scanner/engine/a.h", '#include "scanner/judge/x.h"',
                          "scanner/engine/a.h:1: scanner/engine/ may not include scanner/judge/")

    def test_the_scan_includes_nothing_that_loads_plugins(self):
        for folder in ["host", "driver", "platform", "vst2"]:
            self.assert_fault("scanner/scan/a.h", f'#include "{folder}/x.h"',
                              f"scanner/scan/a.h:1: scanner/scan/ may not include {folder}/")
        self.assert_fine("scanner/judge/a.h", '#include "flight_recorder/flight_record.h"')
        self.assert_fault("scanner/engine/a.h", '#include "scanner/system/linux/proc.h"',
                          'scanner/engine/a.h:1: "scanner/system/linux/proc.h" belongs to one operating system')
        self.assert_fault("host/a.cpp", '#include "scanner/find/module.h"',
                          "host/a.cpp:1: host/ may not include scanner/")

    def test_a_folder_outside_the_program_is_a_fault(self):
        self.assert_fault("host/a.cpp", '#include "tests/a.h"', "host/a.cpp:1: host/ may not include tests/")

    def test_an_include_without_a_folder_is_a_fault(self):
        self.assert_fault("host/a.cpp", '#include "a.h"', 'host/a.cpp:1: "a.h" does not name its folder')

    def test_includes_are_found_however_they_are_written(self):
        fault = ["host/sub/a.mm:2: host/ may not include driver/"]
        for text in ['\n#include "driver/a.h"', '\n  #  include  "driver/a.h" // why', '\n#import "driver/a.h"',
                     '\n/* x */ #include "driver/a.h"', '/*\n*/#include "driver/a.h"']:
            with self.subTest(text=text):
                self.assertEqual(self.faults_of("host/sub/a.mm", text), fault)

    def test_a_comment_opener_in_a_literal_hides_nothing(self):
        self.assert_fault("host/a.cpp", 'auto s = "/*";\n#include "driver/a.h" /* */',
                          "host/a.cpp:2: host/ may not include driver/")

    def test_an_include_by_macro_is_a_fault(self):
        self.assert_fault("host/a.cpp", "#include HEADER", "host/a.cpp:1: #include HEADER cannot be read")

    def test_the_sources_of_one_system_are_for_platform_alone(self):
        text = '#include "platform/linux/file_kind.h"'
        self.assert_fine("platform/linux/a.cpp", text)
        self.assert_fault("loader/a.cpp", text,
                          'loader/a.cpp:1: "platform/linux/file_kind.h" belongs to one operating system')

    def test_only_platform_asks_for_an_operating_system(self):
        lines = {"#ifdef __linux__": "__linux__", "#ifndef __APPLE__": "__APPLE__", "#if defined(_WIN32)": "_WIN32",
                 "#if !defined __MACH__": "__MACH__", "# if 1 && __unix__": "__unix__",
                 "#elif TARGET_OS_MAC": "TARGET_OS_MAC", "#if 0 || \\\n  defined(linux)": "linux",
                 "#if __FreeBSD__ > 9": "__FreeBSD__"}
        for line, macro in lines.items():
            with self.subTest(line=line):
                self.assert_fine("platform/a.h", line)
                self.assert_fault("support/a.h", line, f"support/a.h:1: {macro} asks for an operating system")

    def test_lines_are_counted_past_continued_ones(self):
        self.assert_fault("support/a.h", "#define A \\\n  1 \\\n  2\n#ifdef __linux__",
                          "support/a.h:4: __linux__ asks for an operating system")

    def test_only_platform_includes_headers_of_an_operating_system(self):
        for header in ["linux/futex.h", "sys/syscall.h", "sys/prctl.h", "mach/semaphore.h", "link.h", "execinfo.h",
                       "CoreFoundation/CoreFoundation.h", "libkern/OSAtomic.h", "windows.h", "malloc.h"]:
            with self.subTest(header=header):
                self.assert_fine("platform/linux/a.cpp", f"#include <{header}>")
                self.assert_fault("driver/a.cpp", f"#include <{header}>",
                                  f"driver/a.cpp:1: <{header}> is a header of an operating system")

    def test_asking_whether_such_a_header_exists_is_a_fault(self):
        self.assert_fault("driver/a.cpp", "#if __has_include(<mach/mach.h>)",
                          "driver/a.cpp:1: <mach/mach.h> is a header of an operating system")


if __name__ == "__main__":
    unittest.main()
