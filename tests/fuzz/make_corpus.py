#!/usr/bin/env python3
# SPDX-License-Identifier: MIT
"""Writes the inputs that the fuzz targets start with into corpus/, one small file per case.

    tests/fuzz/make_corpus.py

Leaves inputs alone that were added by hand because a fuzzer found them.
"""
import json
import pathlib
import struct

CORPUS = pathlib.Path(__file__).parent / "corpus"


def word(number):
    return struct.pack(">i", number)


def plugin(chunks=False, programs=2, parameters=2, current=0, bits=0):
    return struct.pack(">Bbbbb", 32 if chunks else 0, programs, parameters, current, bits)


def header(form, count, magic=b"CcnK", version=1):
    return magic + word(0) + form + word(version) + b"Demo" + word(1) + word(count)


def program(name, *values):
    return header(b"FxCk", len(values)) + name.ljust(28, b"\0") + b"".join(struct.pack(">f", v) for v in values)


def bank(*programs):
    return header(b"FxBk", len(programs)) + bytes(128) + b"".join(programs)


def program_chunk(chunk, size=None, form=b"FPCh"):
    return header(form, 1) + b"Init".ljust(28, b"\0") + word(len(chunk) if size is None else size) + chunk


def bank_chunk(chunk, size=None, form=b"FBCh"):
    return header(form, 1) + bytes(128) + word(len(chunk) if size is None else size) + chunk


def stride(data, count):
    return data[:180] + word(count) + data[184:]


TWO = bank(program(b"A", 0.5, 1.0), program(b"B", -2.0, 0.25))

LOAD_PRESET = {
    "program": plugin() + program(b"Init", 0.5, 1.0),
    "program_into_chunks": plugin(chunks=True) + program(b"Init", 0.5, 1.0),
    "program_of_negative_count": plugin() + header(b"FxCk", -1) + bytes(28),
    "program_of_28_bytes": plugin() + header(b"FxCk", 0x7FFFFFFF),
    "bank": plugin() + TWO,
    "bank_last_current": plugin(current=1) + TWO,
    "bank_current_outside": plugin(current=-1) + TWO,
    "bank_without_programs": plugin(programs=0) + TWO,
    "bank_negative_counts": plugin(programs=-5, parameters=-5) + TWO,
    "bank_negative_count": plugin() + header(b"FxBk", -1),
    "bank_stride_zero_for_ever": plugin() + stride(TWO[:24] + word(0x7FFFFFFF) + TWO[28:], -14),
    "bank_stride_negative": plugin() + stride(TWO, -29),
    "bank_stride_before_the_data": plugin() + stride(TWO, -54),
    "bank_stride_far_before_the_data": plugin() + stride(TWO, -0x80000000),
    "bank_stride_above_an_int": plugin() + stride(TWO, 0x7FFFFFFF),
    "program_chunk": plugin(chunks=True) + program_chunk(b"chunk"),
    "program_chunk_reversed": plugin(chunks=True) + program_chunk(b"chunk", form=b"hCPF"),
    "program_chunk_too_large": plugin(chunks=True) + program_chunk(b"chunk", 0x7FFFFFFF),
    "program_chunk_negative": plugin(chunks=True) + program_chunk(b"chunk", -1),
    "bank_chunk": plugin(chunks=True, programs=5) + bank_chunk(b"chunk"),
    "bank_chunk_named_by_index": plugin(chunks=True, bits=1) + bank_chunk(b"chunk"),
    "bank_chunk_never_selects": plugin(chunks=True, bits=2) + bank_chunk(b"chunk"),
    "bank_chunk_reversed": plugin(chunks=True) + bank_chunk(b"chunk", form=b"hCBF"),
    "bank_chunk_without_chunks": plugin() + bank_chunk(b"chunk"),
    "reversed_chunk_magic": plugin() + header(b"FxCk", 0, magic=b"KncC") + bytes(28),
    "version_2": plugin() + header(b"FxCk", 0, version=2) + bytes(28),
}


def text(value):
    """The text's length must be odd: the length byte is half of it."""
    assert len(value) % 2 == 1
    return b"\0" + bytes([len(value) // 2]) + value


def number(value):
    return b"\0" + word(value)


CLASS_SPEC = text(b"/a/b.vst\0") + text(b"test\0") + number(-2) + b"\0\1" + number(0x64656D6F) + text(b"Child")

READ_RECORDS = {
    "load_id": b"\0\1" + number(7),
    "child_spec": b"\0\1" + number(-7) + text(b"Child"),
    "class_spec": CLASS_SPEC,
    "longest_text": b"\0\xff" + b"x" * 511 + text(b"t"),
    "second_text_fails": text(b"/a/b.vst\0") + b"\xfe",
    "second_text_throws": text(b"/a/b.vst\0") + b"\xff",
    "child_fails": CLASS_SPEC[:-8] + b"\xfe",
    "ends_in_a_text": b"\0\x40half",
}

PLUGIN = {"bundle": "/a.so", "child": None, "childName": None, "target": {"system": "linux", "processor": "x86_64"}}
NOTHING = {"step": None, "request": None, "hostRequest": None, "status": None, "signal": None, "place": None,
           "activity": None, "hangs": None, "expected": None, "repetitions": None, "comparison": None,
           "diagnosis": None, "shrunk": None}
ENDED = {"event": "plugin_ended", "plugin": PLUGIN, "otherNames": [], "verdict": "passed", "isWanted": True,
         "cause": "", **NOTHING, "contradictions": [], "command": [], "isRemembered": False}
SEEN = {"time": 1.5, "wallSeconds": 2, "userSeconds": 0, "systemSeconds": 0, "peakMemoryInBytes": 1,
        "sandbox": "none", "steps": [{"number": 1, "text": "a", "seconds": 0.5},
                                     {"number": 2, "text": "b", "seconds": None}],
        "tests": "0,3", "printed": [{"step": 1, "stream": "stderr", "text": "a\n"}], "outputBytes": 2,
        "leftBehind": {"processes": 0, "sharedMemory": 0, "files": ["x"], "fileCount": 1, "fileBytes": 9}}
FULL = {**ENDED, **SEEN, "plugin": {**PLUGIN, "child": -7, "childName": "c"}, "verdict": "hung", "isWanted": False,
        "step": {"number": 5, "text": "testing"},
        "request": {"kind": "dispatcher", "opcode": 44, "name": "effSetBypass", "index": 0, "value": 1, "opt": 0.5},
        "hostRequest": {"opcode": 1, "name": "n", "index": 0, "value": -1, "count": 3},
        "status": 7, "signal": {"number": 11, "name": "SIGSEGV"},
        "place": {"module": "a.so", "offset": "0x1f", "address": "0x0"},
        "activity": {"processorSeconds": 1, "wallSeconds": 2, "state": "R", "systemCall": None, "sockets": 0},
        "hangs": "busy", "expected": {"verdict": "passed", "step": None, "reason": "", "isMet": False},
        "repetitions": {"runs": 2, "isFlaky": True, "verdicts": {"passed": 1, "hung at 5": 1}},
        "comparison": {"change": "new", "earlier": {"verdict": "passed", "step": None, "time": 1}},
        "diagnosis": {"tool": "gdb", "command": ["gdb"], "problem": None,
                      "findings": [{"kind": "k", "text": "t", "frames": ["f"], "isInPlugin": True}], "report": "r"},
        "shrunk": {"from": "0,3", "tests": "3", "runs": 2, "isReproduced": True, "command": ["w"], "problem": None},
        "description": {"name": "n", "children": []}}


def line(event):
    return json.dumps(event, separators=(",", ":")).encode() + b"\n"


READ_EVENT = {
    "scan_started": line({"event": "scan_started", "format": 1, "version": "0.2.0", "time": 1, "machine": "m",
                          "places": ["/"], "shard": {"part": 1, "parts": 2}, "jobs": 2,
                          "limits": {"stepInSeconds": 20, "runInSeconds": 120, "memoryInBytes": 1,
                                     "outputInBytes": 1, "filesInBytes": 1},
                          "sandbox": "none", "plugins": 1, "notes": ["n"]}),
    "run_started": line({"event": "run_started", "plugin": PLUGIN}),
    "not_run": line({**ENDED, "verdict": "skipped"}),
    "everything": line(FULL),
    "parameter": line({**ENDED, **SEEN, "request": {"kind": "setParameter", "index": 1, "opt": None}}),
    "scan_ended": line({"event": "scan_ended", "time": 1, "wallSeconds": 1, "counts": {"passed": 1}, "unwanted": 0,
                        "isInterrupted": False, "status": 0}),
    "nested": b'{"description":' + b"[" * 300 + b"]" * 300 + b"}",
}

for folder, inputs in {"load_preset": LOAD_PRESET, "read_records": READ_RECORDS, "read_event": READ_EVENT}.items():
    (CORPUS / folder).mkdir(parents=True, exist_ok=True)
    for name, data in inputs.items():
        (CORPUS / folder / name).write_bytes(data)
