# SPDX-License-Identifier: MIT
"""Temporary folders with short and plain paths: for what people see of a path, which is broken where it is long and quoted
where it has blanks, and for the paths of sockets, which have room for 107 bytes."""
import os
import re
import tempfile

LONGEST_PARENT = 32


def parent():
    """Where they are made: the usual place without links, or /tmp if that one's path is long or not plain."""
    usual = os.path.realpath(tempfile.gettempdir())
    is_plain = re.fullmatch(r"[\w/.+-]+", usual)
    return usual if is_plain and len(usual) <= LONGEST_PARENT else os.path.realpath("/tmp")


def short_folder(prefix):
    """A tempfile.TemporaryDirectory."""
    return tempfile.TemporaryDirectory(prefix=prefix, dir=parent())
