# SPDX-License-Identifier: MIT
"""Which debuggers can be used here."""
import functools
import os
import shutil
import subprocess

IS_REQUIRED = os.environ.get("VSTTORTURE_DEBUGGERS") == "required"


@functools.lru_cache(maxsize=None)
def why_not(tool):
    """Why the tool cannot be used; None where it can. In some containers gdb is installed, and may trace nothing."""
    if shutil.which(tool) is None:
        return f"{tool} is not installed"
    if tool != "gdb":
        return None
    command = ["gdb", "-nx", "-batch", "-ex", "run", "--args", "true"]
    done = subprocess.run(command, env={"PATH": os.environ["PATH"], "LC_ALL": "C"}, stdin=subprocess.DEVNULL,
                          stdout=subprocess.PIPE, stderr=subprocess.STDOUT, check=False)
    return None if b"exited normally" in done.stdout else "gdb may trace no process"
