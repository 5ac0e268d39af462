#!/usr/bin/env python3
# SPDX-License-Identifier: MIT
"""Writes the inputs that the fuzz targets start with into corpus/, one small file per case.

    tests/fuzz/make_corpus.py

Leaves inputs alone that were added by hand because a fuzzer found them.
"""
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

for folder, inputs in {"load_preset": LOAD_PRESET, "read_records": READ_RECORDS}.items():
    (CORPUS / folder).mkdir(parents=True, exist_ok=True)
    for name, data in inputs.items():
        (CORPUS / folder / name).write_bytes(data)
