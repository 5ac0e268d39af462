# SPDX-License-Identifier: MIT
"""Temporary folders with short paths: for what people see of a path, which is cut or broken where it is long, and for the
paths of sockets, which have room for 107 bytes."""
import tempfile

LONGEST_PARENT = 32


def parent():
    """Where they are made: the usual place, or /tmp if that one's path is long."""
    usual = tempfile.gettempdir()
    return usual if len(usual) <= LONGEST_PARENT else "/tmp"


def short_folder(prefix):
    """A tempfile.TemporaryDirectory."""
    return tempfile.TemporaryDirectory(prefix=prefix, dir=parent())
