# SPDX-License-Identifier: MIT
"""The rows of the fault matrix: what goes wrong, where, and what a host then has to see.

A run is described by the steps that are printed (the first N), what follows them, and the status. Nothing here is
taken from the program: the phases, and the step to which each request belongs are literals.

Which rows there are:
  - every kind of fault at every place,
  - rows for single cases: texts that are too long, faults that follow each other, whole plug-ins.
"""
import collections

PHASE_OF_DRAWN = {
    "inspect class info": "inspect class info test",
    "inspect preset info": "inspect preset info test",
    "inspect parameter info": "inspect parameter info test",
    "testing setting states": "test setting state",
    "inspect latency": "inspect latency test",
}
ALL_STEPS = 65
FIRST_DRAWN = "the first drawn inspect latency"
LAST_WORDS = "unexpected exit"
TEXT_WITHOUT_END = "a text without an end"
FLOOD = "x" * 127 + "\n"

# ----- Places.

# steps: those that are printed when the fault happens there. thrown: what becomes of something thrown: a failure
# "line" with the phase; "no instance" or "no second instance" at creation (the first drawn test is the first step that
# needs the second one); "swallowed" in parameter calls. total: 51 for a place that only a shell reaches, whose whole
# run is one step.
Place = collections.namedtuple("Place", "name steps phase thrown total", defaults=(64,))

CREATE = "create and initialize"
GATHER = "gather info"
CLASS_INFO = "inspect class info test"
PRESET_INFO = "inspect preset info test"
PARAMETER_INFO = "inspect parameter info test"
SETTING_STATE = "test setting state"
LATENCY = "inspect latency test"
RECREATE = "delete, create and initialize"
LAST_DRAWN = "the last drawn test"

PLACES = [
    Place("load", 0, CREATE, "line"),
    Place("entry", 0, None, "no instance"),
    Place("dispatch:22", 0, None, "no instance"),         # identify
    Place("dispatch:10", 0, None, "no instance"),         # set the sample rate
    Place("dispatch:11", 0, None, "no instance"),         # set the block size
    Place("dispatch:0", 0, None, "no instance"),          # open
    Place("dispatch:2", 0, None, "no instance"),          # set the program
    Place("dispatch:31", 0, None, "no instance"),         # connect an input
    Place("dispatch:31:2", 0, None, "no instance"),
    Place("dispatch:32", 0, None, "no instance"),         # connect an output
    Place("dispatch:51", 0, None, "no instance"),         # can do
    Place("dispatch:35", 0, CREATE, "line"),              # category
    Place("dispatch:45", 1, GATHER, "line"),              # effect name
    Place("dispatch:48", 1, GATHER, "line"),              # product
    Place("dispatch:47", 1, GATHER, "line"),              # vendor
    Place("dispatch:58", 1, GATHER, "line"),              # version of the interface
    Place("dispatch:35:2", 1, GATHER, "line"),
    Place("dispatch:51:2", 1, GATHER, "line"),
    Place("dispatch:8", 1, GATHER, "line"),               # parameter name
    Place("dispatch:6", 1, GATHER, "line"),               # parameter label
    Place("dispatch:7", 1, GATHER, "line"),               # parameter display
    Place("dispatch:26", 1, GATHER, "line"),              # can be automated
    Place("dispatch:56", 1, GATHER, "line"),              # parameter properties
    Place("dispatch:56:3", 1, GATHER, "line"),
    Place("dispatch:70", 1, GATHER, "line", 51),          # next child of a shell
    Place("getParameter", 1, None, "swallowed"),
    Place("setParameter", 1, None, "swallowed"),
    Place("dispatch:45:2", 2, CLASS_INFO, "line"),
    Place("dispatch:33", 2, CLASS_INFO, "line"),          # input properties
    Place("dispatch:34", 2, CLASS_INFO, "line"),          # output properties
    Place("dispatch:51:9", 2, CLASS_INFO, "line"),
    Place("dispatch:3", 3, PRESET_INFO, "line"),          # which program
    Place("dispatch:5", 3, PRESET_INFO, "line"),          # program name
    Place("dispatch:29", 3, PRESET_INFO, "line"),         # program name by its number
    Place("dispatch:4", 3, PRESET_INFO, "line"),          # set the program's name
    Place("dispatch:2:2", 3, PRESET_INFO, "line"),
    Place("dispatch:3:22", 3, PRESET_INFO, "line"),
    Place("dispatch:27", 4, PARAMETER_INFO, "line"),      # value from a text
    Place("dispatch:56:6", 4, PARAMETER_INFO, "line"),
    Place("dispatch:10:2", 5, SETTING_STATE, "line"),
    Place("dispatch:11:2", 5, SETTING_STATE, "line"),
    Place("dispatch:23", 5, SETTING_STATE, "line"),       # get a program's chunk
    Place("dispatch:23:2", 5, SETTING_STATE, "line"),     # get a bank's chunk
    Place("dispatch:24", 5, SETTING_STATE, "line"),       # set a program's chunk
    Place("dispatch:24:2", 5, SETTING_STATE, "line"),     # set a bank's chunk
    Place("dispatch:12", 5, SETTING_STATE, "line"),       # on
    Place("dispatch:44", 5, SETTING_STATE, "line"),       # bypass
    Place("dispatch:44:2", 5, SETTING_STATE, "line"),
    Place("dispatch:12:2", 5, SETTING_STATE, "line"),
    Place("dispatch:52", 6, LATENCY, "line"),             # tail size
    # Steps 7 and 8, the stream format, make no request.
    Place("dispatch:52:2", 9, LATENCY, "line"),
    Place("dispatch:10:3", 10, SETTING_STATE, "line"),
    Place("dispatch:12:4", 10, SETTING_STATE, "line"),
    Place("dispatch:27:7", 11, PARAMETER_INFO, "line"),
    Place("dispatch:2:21", 12, PRESET_INFO, "line"),
    Place("dispatch:33:3", 13, CLASS_INFO, "line"),
    Place("entry:2", 14, None, "no second instance"),
    Place("dispatch:22:2", 14, None, "no second instance"),
    Place("dispatch:0:2", 14, None, "no second instance"),
    Place("dispatch:51:16", 14, None, "no second instance"),
    Place("dispatch:1", 14, RECREATE, "line"),            # close the old instance
    Place("dispatch:58:2", 15, GATHER, "line"),
    Place("dispatch:7:14", 15, GATHER, "line"),
    Place("dispatch:52:3", FIRST_DRAWN, LATENCY, "line"),
    Place("dispatch:1:2", ALL_STEPS, LAST_DRAWN, "line"),  # close at the end
]
PLACE_OF = {place.name: place for place in PLACES}

# ----- Kinds, by what they lead to.

CRASH = "crash"    # "unexpected exit", status 7
EXIT = "exit"      # "unexpected exit", the plug-in's status
GONE = "gone"      # the plug-in's status, without "unexpected exit"
KILLED = "killed"  # a signal, without "unexpected exit"
THROWN = "thrown"  # by the place
PASS = "pass"      # as if nothing had happened
LATE = "late"      # a whole run, then status 7 without "unexpected exit"
LATE_KILLED = "late killed"  # a whole run, then a signal
MUTE = "mute"      # nothing is printed any more, status 0
HANG = "hang"      # until the host kills it

# errors: the whole of standard error of a crash, None for anything.
Kind = collections.namedtuple("Kind", "name leads_to detail errors", defaults=(None, ""))

KINDS = [
    Kind("null_store", CRASH),
    Kind("write_read_only", CRASH),
    Kind("stack_overflow", CRASH),
    Kind("abort", CRASH),
    Kind("terminate", CRASH, errors="terminate called without an active exception\n"),
    Kind("throw_int", THROWN, " failed 5"),
    Kind("throw_runtime_error", THROWN, " failed, unknown error"),
    Kind("throw_struct", THROWN, " failed, unknown error"),
    Kind("exit", EXIT, 9),
    Kind("_exit", GONE, 9),
    Kind("quick_exit", GONE, 9),
    Kind("raise:SIGINT", CRASH),
    Kind("raise:SIGABRT", CRASH),
    Kind("raise:SIGHUP", CRASH),
    Kind("raise:SIGSEGV", CRASH),
    Kind("raise:SIGTERM", CRASH),
    Kind("raise:SIGBUS", CRASH),
    Kind("raise:SIGILL", CRASH, errors="vsttorture: uncaught system exception: illegal instruction (SIGILL)\n"),
    Kind("raise:SIGFPE", CRASH, errors="vsttorture: uncaught system exception: arithmetic error (SIGFPE)\n"),
    Kind("raise:SIGTRAP", CRASH, errors="vsttorture: uncaught system exception: trap (SIGTRAP)\n"),
    Kind("raise:SIGSYS", CRASH, errors="vsttorture: uncaught system exception: bad system call (SIGSYS)\n"),
    Kind("raise:SIGKILL", KILLED, 9),
    Kind("divide_by_zero", CRASH, errors="vsttorture: uncaught system exception: arithmetic error (SIGFPE)\n"),
    Kind("illegal_instruction", CRASH,
         errors="vsttorture: uncaught system exception: illegal instruction (SIGILL)\n"),
    Kind("double_free", CRASH, errors=None),
    Kind("heap_corruption", CRASH, errors=None),
    Kind("crash_with_heap_lock", CRASH, errors="malloc(): unsorted double linked list corrupted\n"),
    Kind("crash_with_stdout_lock", CRASH),
    Kind("crash_with_own_stdout_lock", CRASH),
    Kind("crash_under_destructor_lock", CRASH),
    Kind("thread_crash", CRASH),
    Kind("thread_throw", CRASH, errors="terminate called after throwing an instance of 'int'\n"),
    Kind("thread_stack_overflow", KILLED, 11),
    Kind("thread_crash_behind_the_run", CRASH),
    Kind("exit_on_a_thread", EXIT, 9),
    Kind("crash_in_atexit", LATE),
    Kind("crash_in_every_atexit", LATE),
    Kind("crash_in_static_destructor", LATE),
    Kind("crash_in_atexit+null_store", CRASH),
    Kind("crash_in_atexit+abort", CRASH),
    Kind("crash_in_atexit+exit", CRASH),
    Kind("crash_in_every_atexit+null_store", CRASH),
    Kind("crash_in_static_destructor+null_store", CRASH),
    Kind("replace_handlers_then_crash", KILLED, 11),
    Kind("block_signals_then_crash", KILLED, 11),
    Kind("block_signals+crash_with_stdout_lock", CRASH),
    Kind("block_signals+raise:SIGUSR1+null_store", CRASH),
    Kind("block_signals+raise:SIGTERM+null_store", CRASH),
    Kind("close_stdout", MUTE),
    Kind("flood_stdout", PASS),
    Kind("fork_keeping_stdout", PASS),
    Kind("fork_child_goes_on", PASS),
    Kind("fork_child_exits", PASS),
    Kind("fork_child_crashes", PASS),
    Kind("vfork_child_crashes", PASS),
    Kind("change_locale_and_directory", PASS),
    Kind("trap_floating_point", PASS),
]
KIND_OF = {kind.name: kind for kind in KINDS}

# ----- What a host has to see.

# steps: number, or FIRST_DRAWN. tail: what follows the step lines. status: negative for a signal, None for a run
# that the host ends. errors: the whole of standard error, None for anything. verdict: of docs/examples, with
# {} for the number of steps.
End = collections.namedtuple("End", "steps tail status verdict errors total", defaults=(None, 64))


def crash_at(steps, errors=None, total=64):
    return End(steps, LAST_WORDS, 7, "crashed at {}", errors, total)


def passed(errors="", total=64):
    return End(1, "", 1, "shell", errors, 51) if total == 51 else End(ALL_STEPS, "", 0, "passed", errors)


def gone_at(steps, status):
    """A plug-in that calls _exit cannot be told from a program that ends by itself."""
    if steps == 0 and status == 5:
        return End(steps, "", status, "refused", "")
    if steps == ALL_STEPS and status == 0:
        return End(steps, "", status, "passed", "")
    return End(steps, "", status, "crashed at {}" if status == 7 else f"exited at {{}} with {status}", "")


def muted_at(place):
    """At the last place no line follows, so none is missing."""
    whole_run = passed(total=place.total)
    return whole_run if place.steps == whole_run.steps else gone_at(place.steps, 0)


def thrown_at(place, said):
    if place.thrown == "no instance":
        return crash_at(0, "")
    if place.thrown == "no second instance":
        return crash_at(16, "")
    if place.thrown == "swallowed":
        return passed()
    return End(place.steps, f"!{place.phase}{said}\n", 3, "failed at {}", "")


def end_of(kind, place):
    return end_of_kind(kind, place)._replace(total=place.total)


def end_of_kind(kind, place):
    if kind.leads_to == THROWN:
        return thrown_at(place, kind.detail)
    return {
        CRASH: lambda: crash_at(place.steps, kind.errors),
        EXIT: lambda: End(place.steps, LAST_WORDS, kind.detail, f"exited at {{}} with {kind.detail}", ""),
        GONE: lambda: gone_at(place.steps, kind.detail),
        KILLED: lambda: End(place.steps, "", -kind.detail, f"killed by signal {kind.detail} at {{}}", ""),
        PASS: lambda: passed(total=place.total),
        LATE: lambda: End(passed(total=place.total).steps, "", 7, "crashed at {}", ""),
        LATE_KILLED: lambda: End(passed(total=place.total).steps, "", -kind.detail,
                                 f"killed by signal {kind.detail} at {{}}", ""),
        MUTE: lambda: muted_at(place),
        HANG: lambda: End(place.steps, "", None, "timed out at {}", ""),
    }[kind.leads_to]()


# ----- The rows.

Row = collections.namedtuple("Row", "name plugin kind place fault_status end", defaults=(9, None))


def row(kind, place, plugin="faulty", end=None):
    return Row(f"{plugin}/{kind.name}@{place.name}", plugin, kind.name, place.name, 9, end or end_of(kind, place))


def rows_of_pairs():
    for kind in KINDS:
        for place in PLACES:
            yield row(kind, place)


def rows_of_own_runtimes():
    """A C++ runtime of the plug-in's own, hidden or exported, changes nothing that a host sees."""
    for plugin in ["faulty_own_runtime", "faulty_exported_runtime"]:
        for kind in ["throw_int", "throw_runtime_error", "throw_struct"]:
            for place in PLACES:
                yield row(KIND_OF[kind], place, plugin)
        for kind in ["null_store", "thread_throw", "exit", "stack_overflow"]:
            for place in ["load", "dispatch:52"]:
                yield row(KIND_OF[kind], PLACE_OF[place], plugin)


# Text requests, and the step in which the first of them is made.
LONG_TEXTS = [
    (45, 1),  # effect name
    (47, 1),  # vendor
    (48, 1),  # product, asked for when the effect has no name
    (8, 1),   # parameter name
    (6, 1),   # parameter label
    (7, 1),   # parameter display
    (56, 1),  # parameter properties, a record with texts
    (33, 2),  # input properties, a record with texts
    (34, 2),  # output properties, a record with texts
    (5, 3),   # program name
    (29, 3),  # program name by its number, asked for when a program cannot be selected
]


def rows_of_long_texts():
    """Whether the text or the damage that it did is noticed first depends on what lay behind the buffer."""
    for opcode, step in LONG_TEXTS:
        end = crash_at(step)
        yield Row(f"faulty/long_texts:{opcode}@entry", "faulty", f"long_texts:{opcode}", "entry", 9, end)
    end = crash_at(1, total=51)
    yield Row("faulty/long_texts:70@entry", "faulty", "long_texts:70", "entry", 9, end)  # next child of a shell
    yield Row("faulty/long_texts@entry", "faulty", "long_texts", "entry", 9, crash_at(1))


def rows_of_statuses():
    """A plug-in may end the process with any status, also with those that mean something."""
    for status in [0, 1, 2, 3, 4, 5, 7, 255]:
        for place in ["load", "dispatch:58", "dispatch:52", "dispatch:1:2"]:
            steps = PLACE_OF[place].steps
            verdict = "crashed at {}" if status == 7 else f"exited at {{}} with {status}"
            ends = {
                "exit": End(steps, LAST_WORDS, status, verdict, ""),
                "_exit": gone_at(steps, status),
            }
            for kind, end in ends.items():
                yield Row(f"faulty/{kind}({status})@{place}", "faulty", kind, place, status, end)


# Faults that follow each other, and others that are not tried at every place.
COMBINATIONS = [
    Kind("flood_stdout+null_store", CRASH),
    Kind("fork_keeping_stdout+null_store", CRASH),
    Kind("print", PASS),
    Kind("print+null_store", CRASH),
    Kind("print+exit", EXIT, 9),
    Kind("crash_in_static_destructor+crash_in_atexit+raise:SIGTERM", CRASH),
    Kind("hang_in_atexit+null_store", CRASH),
    Kind("use_heap_in_atexit+crash_with_heap_lock", CRASH, errors="malloc(): unsorted double linked list corrupted\n"),
    Kind("buffer_stdout", PASS),
    Kind("buffer_stdout+print+null_store", CRASH),
    Kind("close_stderr", PASS),
    Kind("close_stderr+null_store", CRASH),
    Kind("print_when_unloaded", PASS),
    Kind("print_when_unloaded+exit", EXIT, 9),
    Kind("print_when_unloaded+null_store", CRASH),
    Kind("print_when_unloaded+throw_int", THROWN, " failed 5"),
    Kind("throw_when_unloaded+exit", CRASH, errors=None),
    Kind("throw_when_unloaded+null_store", CRASH, errors=None),
    Kind("exec", GONE, 9),
    Kind("daemon_keeping_stdout", PASS),
    Kind("daemon_keeping_stdout+null_store", CRASH),
    Kind("daemon_flooding_stdout", PASS),
    Kind("daemon_flooding_stdout+null_store", CRASH),
    Kind("wprintf", PASS),
    Kind("wprintf+null_store", CRASH),
    Kind("wcout", PASS),
    Kind("wcout+null_store", CRASH),
    Kind("buffer_stdout@load+raise:SIGKILL", KILLED, 9),
    Kind("buffer_stdout@load+_exit", GONE, 9),
    Kind("raise_in_atexit:SIGILL", LATE_KILLED, 4),
    Kind("raise_in_atexit:SIGTRAP", LATE_KILLED, 5),
    Kind("raise_in_atexit:SIGFPE", LATE_KILLED, 8),
    Kind("raise_in_atexit:SIGSYS", LATE_KILLED, 31),
    Kind("raise_in_atexit:SIGSEGV", LATE),
    Kind("raise:SIGQUIT", KILLED, 3),
    Kind("raise:SIGUSR1", KILLED, 10),
    Kind("raise:SIGPIPE", KILLED, 13),
    Kind("raise:SIGALRM", KILLED, 14),
    Kind("raise:SIGXCPU", KILLED, 24),
    Kind("raise:SIGVTALRM", KILLED, 26),
]


def rows_of_combinations():
    for name, place in [("hang", "load"), ("hang", "dispatch:0"), ("hang", "dispatch:52"), ("hang", "dispatch:1:2"),
                        ("spin", "dispatch:52")]:
        yield row(Kind(name, HANG), PLACE_OF[place])
    for name, place in [("hold_stdout_lock", "dispatch:52"), ("raise:SIGSTOP", "dispatch:52"),
                        ("hang_in_atexit", "dispatch:1:2"), ("hang_in_atexit+exit", "dispatch:52")]:
        yield row(Kind(name, HANG), PLACE_OF[place])
    for place, steps in [("entry", 0), ("entry:2", 16)]:
        yield Row(f"faulty/no_instance@{place}", "faulty", "no_instance", place, 9, crash_at(steps, ""))
    for place in ["load", "dispatch:52", "dispatch:1:2"]:
        steps = PLACE_OF[place].steps
        yield row(Kind("close_stdout+null_store", MUTE), PLACE_OF[place], end=End(steps, "", 7, "crashed at {}", ""))
        for kind in COMBINATIONS:
            yield row(kind, PLACE_OF[place])
    # The size of a null chunk is taken as it is, and the copy is made from the null pointer.
    yield Row("faulty/null_chunk@entry", "faulty", "null_chunk", "entry", 9, crash_at(5))
    # The forced unwinding passes through the handler of the phase, which must not end it.
    not_rethrown = "FATAL: exception not rethrown\n"
    yield Row("faulty/leave_the_thread@entry", "faulty", "leave_the_thread", "entry", 9, crash_at(0, not_rethrown))
    yield Row("faulty/leave_the_thread@dispatch:52", "faulty", "leave_the_thread", "dispatch:52", 9,
              End(6, f"!{LATENCY} failed, unknown error\n{LAST_WORDS}", 7, "crashed at {}", not_rethrown))
    yield Row("faulty/print_when_unloaded+exit(0)@dispatch:1:2", "faulty", "print_when_unloaded+exit",
              "dispatch:1:2", 0, End(ALL_STEPS, LAST_WORDS, 0, "exited at {} with 0", ""))
    # Each line is flushed, so that all of them stand although the plug-in buffers the stream and never flushes it.
    for place in ["dispatch:58", "dispatch:52", "dispatch:52:3", "dispatch:1:2"]:
        yield Row(f"faulty/buffer_stdout@load+_exit(0)@{place}", "faulty", "buffer_stdout@load+_exit", place, 0,
                  gone_at(PLACE_OF[place].steps, 0))
        yield row(Kind("buffer_stdout@load+raise:SIGKILL", KILLED, 9), PLACE_OF[place])


def rows_of_whole_plugins():
    """Plug-ins by their path: those of the build, one that is missing, one whose name is refused."""
    for plugin, end in [
        ("well_behaved_effect", passed()),
        ("well_behaved_instrument", passed()),
        ("older_entry", passed()),
        ("faulty_own_runtime", passed()),
        ("faulty_exported_runtime", passed()),
        ("shell", End(1, "", 1, "shell", "", 51)),
        ("no_entry", crash_at(0, "")),
        ("null_instance", crash_at(0, "")),
        ("entry_throws", crash_at(0, "")),
        ("open_crashes", crash_at(0, "")),
        ("exits_on_open", End(0, LAST_WORDS, 0, "exited at 0 with 0", "")),
        ("exits_in_test", End(6, LAST_WORDS, 42, "exited at 6 with 42", "")),
        ("undefined_symbol", End(0, "!create and initialize failed -1\n", 3, "not loadable")),
        ("missing", End(0, "!create and initialize failed -1\n", 3, "not loadable")),
        ("/x/Grove.vst", End(0, "", 5, "refused", "")),
    ]:
        yield Row(f"{plugin}", plugin, None, None, 9, end)


def all_rows():
    """Each row once, by its name."""
    sources = [rows_of_pairs, rows_of_own_runtimes, rows_of_long_texts, rows_of_statuses, rows_of_combinations,
               rows_of_whole_plugins]
    return list({row.name: row for source in sources for row in source()}.values())
