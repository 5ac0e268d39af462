# SPDX-License-Identifier: MIT
"""Compiles the program for macOS with each of its three targets and links it where there is a linker.

The sources are those of CMake's own build for macOS (preset mac_check). Each check has controls: a fault is put in,
and the check has to find it.
"""

import json
import re
import shlex
import sys

from checks import BUILD, ROOT, doctored, report, run, verdict

HERE = ROOT / "tests" / "macos"
FOLDERS = ("worker", "describer", "driver", "describe", "host", "loader", "support", "platform", "vst2", "flight_recorder")

# What a source may include in angle brackets: headers that macOS has and that need no other library of C++ than the
# one of macOS 10.13.
HEADERS = set("""
    algorithm array atomic cctype cerrno climits cmath csignal cstdarg cstddef cstdint cstdio cstdlib cstring ctime
    cwchar exception functional initializer_list iterator limits map memory mutex new numeric optional random set
    stdexcept string string_view thread tuple type_traits typeinfo unordered_map utility vector
    fcntl.h poll.h pthread.h sys/mman.h sys/resource.h sys/stat.h sys/types.h unistd.h
    CoreFoundation/CoreFoundation.h ExceptionHandling/NSExceptionHandler.h Foundation/Foundation.h
    libkern/OSAtomic.h mach/mach.h mach/semaphore.h mach/sync_policy.h mach/task.h
    """.split())

PRESETS = "CMakePresets.json"
PRESET_OLDEST_SYSTEM = next(
    preset for preset in json.loads((ROOT / PRESETS).read_text())["configurePresets"]
    if preset["name"] == "mac_settings")["cacheVariables"]["CMAKE_OSX_DEPLOYMENT_TARGET"]

# No source of the program: it compiles where the records of the plug-in interface are laid out as plug-ins expect.
LAYOUT_CHECK = "tests/vst2/record_layout_check.cpp"

# Faults that must not compile: name, source, file with the fault, text, text with the fault, what the compiler says.
COMPILE_CONTROLS = (
    ("a misspelt function of CoreFoundation", "loader/module_loader.cpp", "loader/module_loader.cpp",
     "CFBundleLoadExecutable(bundle)", "CFBundleLoadExecutible(bundle)",
     "undeclared identifier 'CFBundleLoadExecutible'"),
    ("swapped arguments to CoreFoundation", "loader/module_loader.cpp", "loader/module_loader.cpp",
     "kCFURLPOSIXPathStyle, false", "false, kCFURLPOSIXPathStyle",
     "no matching function for call to 'CFURLCreateWithFileSystemPath'"),
    ("swapped arguments to the atomic addition", "support/recursive_mutex.cpp", "support/atomic_add.h",
     "OSAtomicAdd32Barrier(amount, target)", "OSAtomicAdd32Barrier(target, amount)",
     "no matching function for call to 'OSAtomicAdd32Barrier'"),
    ("an atomic addition without leave to use the old one", "support/recursive_mutex.cpp",
     "platform/atomic_add.h", "#define OSATOMIC_DEPRECATED 0\n", "", "'OSAtomicAdd32Barrier' is deprecated"),
    ("swapped arguments to the Mach kernel", "support/semaphore.cpp", "support/semaphore.cpp",
     "semaphore_destroy(mach_task_self(), implementation->semaphore)",
     "semaphore_destroy(implementation->semaphore)", "no matching function for call to 'semaphore_destroy'"),
    ("a misspelt method of the exception handler", "platform/macos/exception_handler.mm",
     "platform/macos/exception_handler.mm", "setExceptionHandlingMask:", "setExceptionHandlerMask:",
     "instance method '-setExceptionHandlerMask:' not found"),
    ("a missing header of a framework", "platform/macos/exception_handler.mm",
     "platform/macos/exception_handler.mm", "#import <ExceptionHandling/NSExceptionHandler.h>\n", "",
     "'NSExceptionHandler'"),
    ("two fields in each other's place", LAYOUT_CHECK, "vst2/properties.h",
     "  VstInt16 displayIndex;\n  VstInt16 category;\n", "  VstInt16 category;\n  VstInt16 displayIndex;\n",
     "static_assert failed"),
)
NEWER_LIBRARY_CONTROL = (
    "a function of C++'s library that macOS 10.13 lacks", "loader/plugin_identity.cpp",
    "loader/plugin_identity.cpp", '#include "loader/plugin_identity.h"\n',
    '#include "loader/plugin_identity.h"\n#include <charconv>\n'
    "bool fits(char* text, int number);\n"
    "bool fits(char* text, int number) { return std::to_chars(text, text + 4, number).ec == std::errc(); }\n",
    "is unavailable: introduced in macOS 10.15")


class Target:
    """The program for one kind of Mac."""

    def __init__(self, architecture, source=ROOT, directory=None):
        self.name = architecture
        self.source = source
        self.directory = directory or BUILD / self.name
        self.commands = {}  # the compiler's command of each source, by its path in the project
        self.objects = []

    def configure(self, how="for macOS"):
        """Everything but the architecture comes from the preset."""
        result = run(["cmake", "--preset", "mac_check", "-B", str(self.directory),
                      f"-DVSTTORTURE_MAC_ARCHITECTURE={self.name}"], cwd=self.source)
        if result.returncode != 0:
            return report(f"{self.name}: CMake configures the build {how}", False, result.stdout)
        for entry in json.loads((self.directory / "compile_commands.json").read_text()):
            command = shlex.split(entry["command"])
            self.commands[entry["file"].removeprefix(f"{self.source}/")] = command
            self.objects.append(command[command.index("-o") + 1])
        return report(f"{self.name}: CMake configures the build {how}", True)

    def compile(self):
        result = run(["ninja", "-C", str(self.directory), "-k", "0", *self.objects])
        return report(f"{self.name}: {len(self.commands)} sources compile", result.returncode == 0, result.stdout)

    def oldest_systems(self):
        """The oldest macOS that each object file is made for."""
        headers = run(["llvm-objdump-14", "--macho", "--private-headers", *self.objects], cwd=self.directory).stdout
        return re.findall(r"^ +(?:version|minos) ([\d.]+)$", headers, re.MULTILINE)

    def check_oldest_system(self):
        oldest = "11.0" if self.name == "arm64" else PRESET_OLDEST_SYSTEM
        found = self.oldest_systems()
        report(f"{self.name}: all sources are compiled for macOS {oldest} on", found == [oldest] * len(self.objects),
               str(found))

    def compile_with_fault(self, control, output=None):
        """The compiler's answer to a source with a fault, in it or in a header of it."""
        _, source, faulty_file, before, after, _ = control
        overlay = self.directory / "faulty"
        faulty_copy = overlay / faulty_file
        faulty_copy.parent.mkdir(parents=True, exist_ok=True)
        faulty_copy.write_text(doctored(faulty_file, before, after))
        command = list(self.commands[source])
        command[command.index("-o") + 1] = str(output or self.directory / "faulty.o")
        command[command.index("-c") + 1] = str(overlay / source if source == faulty_file else ROOT / source)
        command[1:1] = [f"-I{overlay}"]
        result = run(command, cwd=self.directory)
        faulty_copy.unlink()
        return result

    def compile_controls(self):
        controls = list(COMPILE_CONTROLS)
        if self.name != "arm64":
            controls.append(NEWER_LIBRARY_CONTROL)
        missed = ""
        for control in controls:
            result = self.compile_with_fault(control)
            if result.returncode == 0 or control[-1] not in result.stdout:
                missed += f"not found: {control[0]}\n{result.stdout}\n"
        report(f"{self.name}: control: {len(controls)} faults do not compile", not missed, missed)

    def check_layout(self):
        """The records of the plug-in interface, whose offsets a compiler alone can check."""
        model = "support/exceptions.cpp"
        command = [str(ROOT / LAYOUT_CHECK) if word == str(ROOT / model) else word for word in self.commands[model]]
        command[command.index("-o") + 1] = str(self.directory / "layout.o")
        self.commands[LAYOUT_CHECK] = command
        result = run(command, cwd=self.directory)
        report(f"{self.name}: every field of the plug-in interface lies in its place", result.returncode == 0,
               result.stdout)

    # Linking. Both kinds of fault: a name that the program should not use, a name that is not offered.

    def unknown_function(self):
        """An object file that calls what glibc has and macOS lacks. It does compile."""
        faulty = self.directory / "calls_unknown_function.o"
        result = self.compile_with_fault(
            ("", "driver/report.cpp", "driver/report.cpp", "    std::fflush(stdout);\n  }\n  funlockfile",
             "    fflush_unlocked(stdout);\n  }\n  funlockfile", ""), faulty)
        return faulty if report(f"{self.name}: control: a source that calls fflush_unlocked compiles",
                                result.returncode == 0, result.stdout) else None

    def link(self):
        result = run(["ninja", "-C", str(self.directory), "vsttorture", "vsttorture-worker"])
        report(f"{self.name}: the programs link against the stubs of macOS's libraries", result.returncode == 0,
               result.stdout)

    def link_controls(self):
        commands = run(["ninja", "-C", str(self.directory), "-t", "commands", "vsttorture"]).stdout.splitlines()
        link = commands[-1].replace(" -o vsttorture ", " -o faulty_program ")
        name = f"{self.name}: control: a link without CFBundleCreate fails"
        stubs = HERE / "stubs" / "sysroot"
        fewer_stubs = self.directory / "fewer_stubs"
        run(["rm", "-rf", str(fewer_stubs)])
        run(["cp", "-r", str(stubs), str(fewer_stubs)])
        stub = fewer_stubs / "System/Library/Frameworks/CoreFoundation.framework/CoreFoundation.tbd"
        stub.write_text(doctored(stub, " _CFBundleCreate,", ""))
        result = run(link.replace(str(stubs), str(fewer_stubs)), cwd=self.directory)
        report(name, result.returncode != 0 and undefined_in(result.stdout) == {"_CFBundleCreate"}, result.stdout)

        if faulty := self.unknown_function():
            result = run(link.replace(" -o faulty_program ", f" {faulty} -o faulty_program "), cwd=self.directory)
            report(f"{self.name}: control: a link with fflush_unlocked fails",
                   result.returncode != 0 and undefined_in(result.stdout) == {"_fflush_unlocked"}, result.stdout)

    # Where there is no linker: names that no object file defines, against a list.

    def undefined(self, more=()):
        listing = run(["llvm-nm-14", *self.objects, *more], cwd=self.directory).stdout
        symbols = [line.split()[-2:] for line in listing.splitlines() if line and not line.endswith(":")]
        defined = {name for kind, name in symbols if kind not in "Uu"}
        return {name for kind, name in symbols if kind in "Uu"} - defined - {"___dso_handle"}

    def check_undefined(self):
        lines = (HERE / "i386_undefined_symbols.txt").read_text().splitlines()
        allowed = {line for line in lines if line and not line.startswith("#")}
        found = self.undefined()
        report(f"{self.name}: each of {len(found)} undefined symbols is on the list", found and found <= allowed,
               "not on the list: " + " ".join(sorted(found - allowed)))
        if faulty := self.unknown_function():
            surplus = self.undefined([str(faulty)]) - found
            report(f"{self.name}: control: fflush_unlocked is not on the list",
                   surplus == {"_fflush_unlocked"} and not surplus & allowed, str(surplus))


def check_preset_control():
    """A tree that differs in the preset's deployment target alone: its object files differ in just that."""
    tree = BUILD / "other_deployment_target"
    run(["rm", "-rf", str(tree)])
    (tree / "source").mkdir(parents=True)
    for path in ROOT.iterdir():
        if path.name not in ("build", PRESETS):
            (tree / "source" / path.name).symlink_to(path)
    (tree / "source" / PRESETS).write_text(doctored(
        PRESETS, f'"CMAKE_OSX_DEPLOYMENT_TARGET": "{PRESET_OLDEST_SYSTEM}"', '"CMAKE_OSX_DEPLOYMENT_TARGET": "10.11"'))
    target = Target("x86_64", tree / "source", tree / "x86_64")
    if target.configure("with another deployment target in the preset"):
        objects = {name.rpartition("/")[2]: name for name in target.objects}
        target.objects = [objects["recursive_mutex.cpp.o"]]
        run(["ninja", "-C", str(target.directory), *target.objects])
        found = target.oldest_systems()
        report("x86_64: control: another deployment target in the preset is seen", found == ["10.11"], str(found))
        result = run(["ninja", "-C", str(target.directory), objects["exceptions.cpp.o"]])
        report("x86_64: control: a function of macOS 10.12 is refused there",
               "'uncaught_exceptions' is unavailable: introduced in macOS 10.12" in result.stdout, result.stdout)


def undefined_in(linker_output):
    return set(re.findall(r"undefined symbol: (\S+)", linker_output))


def forgotten(sources_on_disk, compiled):
    return sorted(set(sources_on_disk) - set(compiled))


def check_completeness(compiled):
    """Every source of the program, those for Linux left aside, is among those that the build for macOS compiles."""
    on_disk = [str(path.relative_to(ROOT)) for folder in FOLDERS for suffix in ("cpp", "mm")
               for path in (ROOT / folder).rglob(f"*.{suffix}")]
    on_disk = [path for path in on_disk if not path.startswith("platform/linux/")]
    missing = forgotten(on_disk, compiled)
    report(f"the build for macOS forgets none of the {len(on_disk)} sources", on_disk and not missing,
           "\n".join(missing))
    surplus = forgotten(compiled, on_disk)
    report("the build for macOS compiles no source for Linux", not surplus, "\n".join(surplus))
    report("control: a source that CMake does not list is found",
           forgotten(on_disk + ["host/new.cpp"], compiled) == ["host/new.cpp"])


def strange_headers(text):
    return set(re.findall(r"^\s*#\s*(?:include|import)\s*<([^>]+)>", text, re.MULTILINE)) - HEADERS


def check_headers():
    """Headers of this machine stand in for macOS's, so headers that only this one has are looked for by name."""
    files = [path for folder in FOLDERS for suffix in ("h", "cpp", "mm")
             for path in (ROOT / folder).rglob(f"*.{suffix}") if "platform/linux" not in str(path)]
    strange = [f"{path.relative_to(ROOT)}: <{header}>" for path in files
               for header in sorted(strange_headers(path.read_text()))]
    report(f"{len(files)} sources and headers include nothing that macOS lacks", files and not strange,
           "\n".join(strange))
    report("control: a header of Linux and one of a newer library are found",
           strange_headers("#include <vector>\n#include <sys/epoll.h>\n# include <filesystem>\n") ==
           {"sys/epoll.h", "filesystem"})


def main():
    targets = [Target(architecture) for architecture in ("x86_64", "i386", "arm64")]
    check_headers()
    check_preset_control()
    for target in targets:
        if not target.configure():
            continue
        if target is targets[0]:
            check_completeness(target.commands)
        if not target.compile():
            continue
        target.check_oldest_system()
        target.check_layout()
        target.compile_controls()
        if target.name == "i386":
            target.check_undefined()
        else:
            target.link()
            target.link_controls()
    return verdict()


if __name__ == "__main__":
    sys.exit(main())
