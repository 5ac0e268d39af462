#!/usr/bin/env python3
# SPDX-License-Identifier: MIT
"""Says in one sentence how the run of a plug-in ended: step, request and its arguments, signal, module and offset.

    explain_plugin.py [--limit SECONDS] [--tests LIST] WORKER BUNDLE [CHILD_ID]

Runs BUNDLE with WORKER, a vsttorture-worker, and reads the flight record that it leaves (FLIGHT_RECORD.md). The
functions may be used on records of other runs: read_record(bytes), sentence(record).

Ends with 0 when the plug-in passed, 1 when it did not, 2 when there is nothing to read.
"""
import argparse
import collections
import os
import signal
import struct
import subprocess
import sys
import tempfile
import threading

SIZE = 4096
MAGIC = b"vstflrec"
VERSION = 1
STEP_TIMES = 80
PHASES = ["not started", "loading", "creating", "running", "closing", "ended"]
VERDICTS = ["none", "passed", "shell", "failed", "failed, unknown error", "no instance", "refused"]
KINDS = ["none", "load", "entry", "dispatcher", "getParameter", "setParameter"]
STATES = ["idle", "under way", "returned", "threw"]
OPCODES = """
    effOpen effClose effSetProgram effGetProgram effSetProgramName effGetProgramName effGetParamLabel
    effGetParamDisplay effGetParamName effGetVu effSetSampleRate effSetBlockSize effMainsChanged effEditGetRect
    effEditOpen effEditClose effEditDraw effEditMouse effEditKey effEditIdle effEditTop effEditSleep effIdentify
    effGetChunk effSetChunk effProcessEvents effCanBeAutomated effString2Parameter effGetNumProgramCategories
    effGetProgramNameIndexed effCopyProgram effConnectInput effConnectOutput effGetInputProperties
    effGetOutputProperties effGetPlugCategory effGetCurrentPosition effGetDestinationBuffer effOfflineNotify
    effOfflinePrepare effOfflineRun effProcessVarIo effSetSpeakerArrangement effSetBlockSizeAndSampleRate
    effSetBypass effGetEffectName effGetErrorText effGetVendorString effGetProductString effGetVendorVersion
    effVendorSpecific effCanDo effGetTailSize effIdle effGetIcon effSetViewPosition effGetParameterProperties
    effKeysRequired effGetVstVersion effEditKeyDown effEditKeyUp effSetEditKnobMode effGetMidiProgramName
    effGetCurrentMidiProgram effGetMidiProgramCategory effHasMidiProgramsChanged effGetMidiKeyName
    effBeginSetProgram effEndSetProgram effGetSpeakerArrangement effShellGetNextPlugin effStartProcess
    effStopProcess effSetTotalSampleToProcess effSetPanLaw effBeginLoadBank effBeginLoadProgram
    effSetProcessPrecision effGetNumMidiInputChannels effGetNumMidiOutputChannels""".split()

Request = collections.namedtuple("Request", "state kind opcode index value opt")
HostRequest = collections.namedtuple("HostRequest", "count opcode index value thread")
Fault = collections.namedtuple("Fault", "signal code thread sender address program_counter module offset")
Record = collections.namedtuple(
    "Record", "process pointer_size phase verdict failure_code step step_text start_time step_times unexpected_exit "
              "requests_made request host_request thrown step_of_thrown fault bundle")


def named(names, number, what):
    if number >= len(names):
        raise ValueError(f"{what} is {number}")
    return names[number]


def text_at(data, offset, size, what):
    text, end, _ = data[offset:offset + size].partition(b"\0")
    if not end:
        raise ValueError(f"{what} has no end")
    return "".join(character if character.isprintable() else "?" for character in os.fsdecode(text))


def request_at(data, offset, what):
    """Fields that a kind of request does not have are None."""
    state, kind, opcode, index, value, opt = struct.unpack_from("<IIiiqf", data, offset)
    state, kind = named(STATES, state, f"{what}'s state"), named(KINDS, kind, f"{what}'s kind")
    is_dispatcher = kind == "dispatcher"
    return Request(state, kind, opcode if is_dispatcher else None,
                   index if is_dispatcher or kind.endswith("Parameter") else None, value if is_dispatcher else None,
                   opt if is_dispatcher or kind == "setParameter" else None)


def fault_at(data):
    number, code, thread, sender, address, program_counter, base = struct.unpack_from("<iiIIQQQ", data, 224)
    module = text_at(data, 1024, 1024, "the module's path")
    if not 0 <= number <= 64:
        raise ValueError(f"the signal is {number}")
    if number == 0:
        return None
    if base > program_counter:
        raise ValueError("the module begins behind the program counter")
    is_known = module != "" and base != 0
    return Fault(number, code, thread, sender, address, program_counter, module if is_known else "",
                 program_counter - base if is_known else 0)


def times_in(data, step, start):
    """When the last steps began, in nanoseconds of CLOCK_MONOTONIC."""
    times = struct.unpack_from(f"<{STEP_TIMES}Q", data, 384)
    last = [times[number % STEP_TIMES] for number in range(max(0, step - STEP_TIMES), step)]
    if len(last) == STEP_TIMES and last[0] >= last[-1]:
        del last[0]  # overwritten by a step that did not begin any more
    if sorted([start, *last]) != [start, *last]:
        raise ValueError("the times of the steps go backwards")
    return last


def read_record(data):
    """The record in these bytes. ValueError says why there is none: a plug-in may have written over it."""
    if len(data) != SIZE:
        raise ValueError(f"it has {len(data)} bytes instead of {SIZE}")
    magic, version, size, process, pointer_size, phase, verdict, failure_code, step, start, unexpected = \
        struct.unpack_from("<8sIIIIIIiIQI", data, 0)
    if magic != MAGIC or version != VERSION or size != SIZE:
        raise ValueError("it does not begin as a record of version 1")
    if pointer_size not in (4, 8) or not 0 < process < 1 << 31 or step >= 1 << 31 or unexpected > 1:
        raise ValueError("its numbers make no sense")
    request, thrown = request_at(data, 72, "the request"), request_at(data, 192, "the request that threw")
    made, = struct.unpack_from("<Q", data, 64)
    if request.state != "idle" and (made == 0 or request.kind == "none"):
        raise ValueError("there is a request, but none was made")
    step_of_thrown, = struct.unpack_from("<I", data, 220)
    step_text = text_at(data, 320, 64, "the step's text")
    return Record(process, pointer_size, named(PHASES, phase, "the phase"), named(VERDICTS, verdict, "the verdict"),
                  failure_code, step, step_text if step else "", start, times_in(data, step, start), bool(unexpected),
                  made, request, HostRequest._make(struct.unpack_from("<QiiqI", data, 128)), thrown, step_of_thrown,
                  fault_at(data), text_at(data, 2048, 1024, "the bundle's path"))


def signal_name(number):
    try:
        return signal.Signals(number).name
    except ValueError:
        return f"signal {number}"


def request_text(request):
    """As in "effSetBypass (44) value 1"; arguments that are 0 are left out."""
    if request.kind == "load":
        return "loading the module"
    if request.kind == "entry":
        return "the entry point"
    if request.kind == "dispatcher":
        known = 0 <= request.opcode < len(OPCODES)
        words = [f"{OPCODES[request.opcode]} ({request.opcode})" if known else f"opcode {request.opcode}"]
        words += [f"{name} {number:g}" if name == "float" else f"{name} {number}"
                  for name, number in (("index", request.index), ("value", request.value), ("float", request.opt))
                  if number != 0]
        return " ".join(words)
    words = f"{request.kind} {request.index}"
    return words + (f" to {request.opt:g}" if request.kind == "setParameter" else "")


def place(fault):
    """As in "lsp-plugins-vst2-1.2.5.so+0x4f2a1"; empty where the module is not known."""
    return f"{os.path.basename(fault.module)}+{fault.offset:#x}" if fault.module else ""


def fault_text(record):
    fault = record.fault
    text = signal_name(fault.signal)
    if fault.code <= 0:
        text += " raised by itself" if fault.sender == record.process else f" sent by process {fault.sender}"
    elif fault.signal in (signal.SIGSEGV, signal.SIGBUS):
        text += f" at address {fault.address:#x}"
    if fault.thread not in (0, record.process):
        text += " on another thread"
    if fault.module:
        return f"{text}, in {place(fault)}"
    return f"{text}, at {fault.program_counter:#x} in no module" if fault.program_counter else text


def where(record):
    if record.step:
        return f"step {record.step}, {record.step_text}"
    if record.request.kind == "load" and record.verdict != "no instance":
        return "loading"
    return "not started" if record.phase == "not started" else "creation"


def sentence(record):
    """What the record says, in one line."""
    parts = []
    if record.request.state == "under way":
        parts.append(request_text(record.request) + " under way")
    elif record.thrown.state == "threw" and record.step_of_thrown == record.step:
        parts.append(request_text(record.thrown) + " threw an exception")
    else:
        parts.append("no request under way")
    if record.verdict == "failed":
        parts.append(f"failed {record.failure_code}")
    elif record.verdict != "none":
        parts.append("passed as a shell" if record.verdict == "shell" else record.verdict)
    if record.unexpected_exit:
        parts.append("exit() was called")
    if record.fault is not None and record.verdict != "no instance":  # it crashes on purpose then
        parts.append(fault_text(record))
    return f"{where(record)}: {', '.join(parts)}"


def run_worker(command, limit):
    """The status of the run, as subprocess has it, or None for one that was killed for its length; and what was
    printed on standard error."""
    with tempfile.TemporaryFile() as errors:
        child = subprocess.Popen(command, stdin=subprocess.DEVNULL, stdout=subprocess.DEVNULL, stderr=errors,
                                 start_new_session=True)
        out_of_time = threading.Event()
        timer = threading.Timer(limit, lambda: (out_of_time.set(), os.killpg(child.pid, signal.SIGKILL)))
        timer.start()
        os.waitid(os.P_PID, child.pid, os.WEXITED | os.WNOWAIT)  # Ended, but not reaped: its group is still its own.
        timer.cancel()
        timer.join()
        os.killpg(child.pid, signal.SIGKILL)  # What the plug-in left behind.
        status = child.wait()
        errors.seek(0)
        return None if out_of_time.is_set() else status, errors.read()


def end_text(status, limit):
    if status is None:
        return f"killed after {limit:g} seconds"
    return f"killed by {signal_name(-status)}" if status < 0 else f"status {status}"


def main():
    parser = argparse.ArgumentParser(description=__doc__, formatter_class=argparse.RawDescriptionHelpFormatter)
    parser.add_argument("--limit", type=float, default=60, help="seconds after which the run is killed (60)")
    parser.add_argument("--tests", help="the tests to run, as in 0,3,3,1")
    parser.add_argument("worker")
    parser.add_argument("bundle")
    parser.add_argument("child", nargs="?")
    arguments = parser.parse_args()

    with tempfile.TemporaryDirectory() as folder:
        path = os.path.join(folder, "record")
        command = [arguments.worker, "--record", path, "--no-core"]
        command += ["--tests", arguments.tests] if arguments.tests is not None else []
        command += ["--", arguments.bundle] + ([arguments.child] if arguments.child is not None else [])
        status, errors = run_worker(command, arguments.limit)
        if status == 64:
            sys.stderr.write(errors.decode(errors="replace"))
            return 2
        try:
            with open(path, "rb") as file:
                record = read_record(file.read())
        except (OSError, ValueError) as error:
            print(f"no record, because {error}; {end_text(status, arguments.limit)}")
            return 2
    print(f"{sentence(record)}; {end_text(status, arguments.limit)}")
    return 0 if status in (0, 1) and record.verdict in ("passed", "shell") else 1


if __name__ == "__main__":
    sys.exit(main())
