# SPDX-License-Identifier: MIT
"""Runs the sources of macOS on GNUstep, with a double of macOS's exception handler; in 32 bits, where there is no
GNUstep, on a double of Foundation.

First the guard alone, whose double tells each thing that is done to it; then the whole program on a plug-in that
raises an exception of Foundation, and on plug-ins with older entry points. The controls are programs with a fault;
each has to look different.
"""

import subprocess
import sys

from checks import BUILD, ROOT, report, run, verdict

ARMED = """\
handler: delegate nidu_VST_Support_ExceptionHandlerDelegate
handler: mask 1023
signal: SIGINT
signal: SIGABRT
signal: SIGHUP
signal: SIGKILL
signal: SIGSEGV
signal: SIGTERM
signal: SIGBUS
"""
GUARD = ARMED + """\
class: nidu_VST_Support_ExceptionHandlerDelegate of NSObject
class: 0 variables
class: -init
class: -dealloc
class: -shouldDisplayException:
class: -exceptionHandler:shouldLogException:mask:
class: -exceptionHandler:shouldHandleException:mask:
answer: display 0
answer: log 1
pool: drained
handler: delegate nil
end
"""
STEPS = "total, 64\n1, test gathering info\n"
RAISED = ARMED + """\
handler: log NobodyCatchesThis, mask 256
handler: log answered yes
handler: handle NobodyCatchesThis, mask 512
"""


class Build:
    """The programs of tests/macos/gnustep, in one word size."""

    def __init__(self, name, directory, flags=""):
        self.name = name
        self.directory = BUILD / directory
        self.flags = flags

    def build(self):
        languages = [f"-DCMAKE_{language}_FLAGS={self.flags}" for language in ("C", "CXX", "OBJCXX")]
        steps = (["cmake", "-G", "Ninja", "-S", str(ROOT / "tests" / "macos" / "gnustep"), "-B", str(self.directory),
                  "-DCMAKE_BUILD_TYPE=Release", *languages], ["ninja", "-C", str(self.directory)])
        for step in steps:
            result = run(step)
            if result.returncode != 0:
                return self.report("the program builds with the sources of macOS", False, result.stdout)
        return self.report("the program builds with the sources of macOS", True)

    def report(self, what, passed, details=""):
        return report(f"{self.name}: {what}", passed, details)

    def outcome(self, program, *arguments):
        """Standard output, standard error and status."""
        result = run([str(self.directory / program), *arguments], stderr=subprocess.PIPE)
        return result.stdout, result.stderr, result.returncode


BUILDS = (Build("GNUstep", "gnustep"), Build("32-bit", "gnustep_32_bit", "-m32"))


def show(found):
    return f"standard output:\n{found[0]}\nstandard error:\n{found[1]}\nstatus {found[2]}"


def check_guard(build):
    found = build.outcome("trace")
    build.report("the guard arms the handler, answers and lets go in order", found == ("", GUARD, 0), show(found))
    for program, fault, before, after in (
            ("trace_release_order", "delegate released before pool",
             "pool: drained\nhandler: delegate nil\n", "handler: delegate nil\npool: drained\n"),
            ("trace_mask", "mask 1022", "handler: mask 1023\n", "handler: mask 1022\n"),
            ("trace_guard_first", "signal guard before the delegate", ARMED,
             "\n".join(ARMED.splitlines()[2:] + ARMED.splitlines()[:2]) + "\n"),
            ("trace_stays_attached", "a delegate that stays attached", "handler: delegate nil\n", "")):
        found = build.outcome(program)
        build.report(f"control: {fault} is seen", found == ("", GUARD.replace(before, after), 0) != ("", GUARD, 0),
                 show(found))


def check_exception(build):
    plugin = str(build.directory / "raises_exception.so")
    wanted = (STEPS + "unexpected exit", RAISED, 7)
    found = build.outcome("torture", plugin)
    build.report("an exception raised in a plug-in is logged, handled and ends with status 7", found == wanted,
           show(found))
    caught = STEPS + "!gather info failed, unknown error\n"
    for program, fault, control in (
            ("torture_not_handed_on", "an exception not handed on",
             (caught, RAISED + "handler: handle answered yes\nhandler: delegate nil\n", 3)),
            ("torture_misspelt_selector", "a misspelt method of the delegate",
             (caught, RAISED[:RAISED.index("handler: handle")] + "handler: delegate nil\n", 3)),
            ("torture_not_logged", "an exception not logged",
             (wanted[0], RAISED.replace("answered yes", "answered no"), 7))):
        found = build.outcome(program, plugin)
        build.report(f"control: {fault} is seen", found == control != wanted, show(found))


def check_entry_points(build):
    """macOS's plug-ins export VSTPluginMain or main_macho. "main" is a name for Linux alone."""
    refused = ("unexpected exit", 7)
    for program, plugin, what, passes in (
            ("torture", "main_macho_entry", "the entry point main_macho is found", True),
            ("torture", "older_entry", "the entry point main is not looked for", False),
            ("torture_with_entry_name_of_linux", "older_entry", "control: with Linux's source it is found", True)):
        output, errors, status = build.outcome(program, str(build.directory / "program" / "plugins" / f"{plugin}.so"))
        passed = output.startswith(STEPS) and "\n65, " in output and status == 0
        build.report(what, passed if passes else (output, status) == refused, show((output, errors, status)))


def main():
    for build in BUILDS:
        if build.build():
            check_guard(build)
            check_exception(build)
            check_entry_points(build)
    return verdict()


if __name__ == "__main__":
    sys.exit(main())
