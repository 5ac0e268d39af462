# SPDX-License-Identifier: MIT
"""Checks what vsttorture-describe prints: against its schema, and against a second reader of the same modules.

    check_descriptions.py --program vsttorture-describe --schema SCHEMA MODULE...
    check_descriptions.py --program vsttorture-describe --schema SCHEMA --real

With --real the modules are those of the Debian packages that the tests of real plug-ins name; where none of them
is installed the check is skipped (status 77), unless VSTTORTURE_REAL_PLUGINS=required is in the environment.

The schema is checked by the Python package jsonschema. The second reader is a Python process for each module that
loads it, calls its entry point and asks for a few things; it shares no line with the program.
"""
import argparse
import concurrent.futures
import ctypes
import glob
import json
import os
import subprocess
import sys

SKIPPED = 77
DEBIANS_PYTHON = "/usr/bin/python3"
LIMIT_IN_SECONDS = 60
REAL_PLACES = ["/usr/lib/vst/*.so", "/usr/lib/vst/*/*.so", "/usr/lib/lxvst/*.so",
               "/usr/lib/*-linux-gnu/iem-plugin-suite/vst/*.so"]
NO_PLUGINS = ["/usr/lib/vst/lsp-plugins/lsp-plugins-vst2-"]  # The library that the small modules beside it load.

HOST = ctypes.CFUNCTYPE(ctypes.c_ssize_t, ctypes.c_void_p, ctypes.c_int32, ctypes.c_int32, ctypes.c_ssize_t,
                        ctypes.c_void_p, ctypes.c_float)


class Instance(ctypes.Structure):
    """The beginning of the record that an entry point answers."""
    _fields_ = [("magic", ctypes.c_int32), ("dispatcher", HOST), ("process", ctypes.c_void_p),
                ("setParameter", ctypes.c_void_p), ("getParameter", ctypes.c_void_p),
                ("numPrograms", ctypes.c_int32), ("numParams", ctypes.c_int32), ("numInputs", ctypes.c_int32),
                ("numOutputs", ctypes.c_int32), ("flags", ctypes.c_int32), ("resvd1", ctypes.c_ssize_t),
                ("resvd2", ctypes.c_ssize_t), ("initialDelay", ctypes.c_int32), ("realQualities", ctypes.c_int32),
                ("offQualities", ctypes.c_int32), ("ioRatio", ctypes.c_float), ("object", ctypes.c_void_p),
                ("user", ctypes.c_void_p), ("uniqueID", ctypes.c_int32), ("version", ctypes.c_int32)]


def read_module(path):
    """Prints what the module says about itself, as JSON, and ends the process without closing anything."""
    module = ctypes.CDLL(path)
    host = HOST(lambda effect, opcode, index, value, ptr, opt: 2400 if opcode == 1 else 0)
    entry = getattr(module, "VSTPluginMain", None) or module.main
    entry.restype = ctypes.POINTER(Instance)
    address = entry(host)
    effect = address.contents

    def text(opcode):
        buffer = ctypes.create_string_buffer(256)
        answer = effect.dispatcher(ctypes.addressof(effect), opcode, 0, 0, ctypes.addressof(buffer), 0.0)
        return buffer.value.decode() if answer else None

    effect.dispatcher(ctypes.addressof(effect), 0, 0, 0, None, 0.0)  # effOpen
    print(json.dumps({
        "name": text(45) or text(48), "maker": text(47), "uniqueId": effect.uniqueID, "version": effect.version,
        "flags": effect.flags, "latencyInSamples": effect.initialDelay, "inputs": effect.numInputs,
        "outputs": effect.numOutputs, "programs": effect.numPrograms, "parameters": effect.numParams}), flush=True)
    os._exit(0)


def second_opinion(path):
    result = subprocess.run([sys.executable, "-B", __file__, "--read", path], stdin=subprocess.DEVNULL,
                            capture_output=True, timeout=LIMIT_IN_SECONDS, check=False)
    line = [line for line in result.stdout.decode(errors="replace").splitlines() if line.startswith('{"name"')]
    return json.loads(line[0]) if line else None


def same_in_both(description):
    shell = description["isShell"]
    return {
        "name": description["name"], "maker": description["maker"], "uniqueId": description["uniqueId"]["number"],
        "version": description["version"], "flags": description["flags"]["number"],
        "latencyInSamples": description["latencyInSamples"], "inputs": len(description["inputs"]),
        "outputs": len(description["outputs"]),
        "programs": None if shell else len(description["programs"]),
        "parameters": None if shell else len(description["parameters"])}


def problems_of(program, validator, path):
    run = subprocess.run([program, path], stdin=subprocess.DEVNULL, capture_output=True, timeout=LIMIT_IN_SECONDS,
                         check=False)
    if run.returncode not in (0, 1):
        return [f"status {run.returncode}: {run.stderr.decode(errors='replace').strip()}"]
    description = json.loads(run.stdout)
    problems = [f"{'/'.join(map(str, error.path))}: {error.message}" for error in validator.iter_errors(description)]
    second = second_opinion(path)
    if second is None:
        return [*problems, "the second reader cannot read it"]
    for key, value in same_in_both(description).items():
        if value is not None and second[key] != value and not (key == "maker" and second[key] is None):
            problems.append(f"{key} is {value!r}, the second reader says {second[key]!r}")
    return problems


def main():
    parser = argparse.ArgumentParser(description=__doc__, formatter_class=argparse.RawDescriptionHelpFormatter)
    parser.add_argument("--program")
    parser.add_argument("--schema")
    parser.add_argument("--real", action="store_true", help="the modules of Debian's packages")
    parser.add_argument("--read", metavar="MODULE", help="be the second reader")
    parser.add_argument("modules", nargs="*")
    arguments = parser.parse_args()
    if arguments.read:
        read_module(arguments.read)
    required = os.environ.get("VSTTORTURE_REAL_PLUGINS") == "required"

    try:
        import jsonschema  # pylint: disable=import-outside-toplevel
    except ImportError:
        # Debian's package belongs to Debian's Python, which need not be the first in the path.
        if os.path.exists(DEBIANS_PYTHON) and not os.path.samefile(sys.executable, DEBIANS_PYTHON):
            os.execv(DEBIANS_PYTHON, [DEBIANS_PYTHON, "-B", "-X", "utf8", *sys.argv])
        print("there is no package jsonschema for this Python (Debian: python3-jsonschema)")
        return 1 if required else SKIPPED
    with open(arguments.schema, encoding="utf-8") as file:
        schema = json.load(file)
    jsonschema.Draft202012Validator.check_schema(schema)
    validator = jsonschema.Draft202012Validator(schema)

    modules = arguments.modules
    if arguments.real:
        found = {os.path.realpath(path) for place in REAL_PLACES for path in glob.glob(place)}
        modules = sorted(path for path in found if not path.startswith(tuple(NO_PLUGINS)))
        if not modules and not required:
            print("skipped: none of the packages is installed")
            return SKIPPED
        if required and len(modules) != 200:
            print(f"{len(modules)} modules and not 200")
            return 1
    failed = 0
    with concurrent.futures.ThreadPoolExecutor(os.cpu_count()) as pool:
        checks = {path: pool.submit(problems_of, arguments.program, validator, path) for path in modules}
        for path, check in checks.items():
            problems = check.result()
            failed += bool(problems)
            for problem in problems:
                print(f"{path}: {problem}")
    print(f"{len(modules) - failed} of {len(modules)} modules described as the schema and the second reader say")
    return 1 if failed or not modules else 0


if __name__ == "__main__":
    sys.exit(main())
