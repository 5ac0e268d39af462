# SPDX-License-Identifier: MIT
"""Event streams of scans that never were, for tests of reports: whole events with whatever a test is about."""
import json

STEP_TEXTS = ["test gathering info", "inspect class info", "inspect preset info", "inspect parameter info",
              "testing setting states", "inspect latency", "inspect stream format"]
GOOD = ("passed", "shell", "skipped")


def scan_started(**more):
    return {"event": "scan_started", "format": 1, "version": "0.2.0", "time": 1795302622.1, "machine": "studio",
            "places": ["/usr/lib/vst"], "shard": {"part": 1, "parts": 1}, "jobs": 2,
            "limits": {"stepInSeconds": 20.0, "runInSeconds": 120.0, "memoryInBytes": 1 << 32,
                       "outputInBytes": 1 << 26, "filesInBytes": 1 << 30},
            "sandbox": "bubblewrap", "plugins": 0, "notes": [], **more}


def steps(count, seconds=0.001):
    return [{"number": n + 1, "text": STEP_TEXTS[n % len(STEP_TEXTS)], "seconds": seconds} for n in range(count)]


def plugin_ended(bundle, verdict="passed", child=None, child_name=None, change=None, earlier=None, step=5, **more):
    """A result. `step` is that of a failure, None for one before the first; `more` replaces members of the event."""
    is_good = verdict in GOOD
    failed_step = None if is_good or step is None else {"number": step, "text": STEP_TEXTS[(step - 1) % 7]}
    event = {
        "event": "plugin_ended",
        "plugin": {"bundle": bundle, "child": child, "childName": child_name,
                   "target": {"system": "linux", "processor": "x86_64"}},
        "otherNames": [], "verdict": verdict, "isWanted": is_good,
        "cause": "" if is_good else f"step {step}, {STEP_TEXTS[((step or 1) - 1) % 7]}: SIGSEGV in effSetBypass (44)",
        "step": failed_step, "request": None, "hostRequest": None, "status": None, "signal": None, "place": None,
        "activity": None, "hangs": None, "contradictions": [], "expected": None, "repetitions": None,
        "command": ["vsttorture-worker", bundle], "isRemembered": False, "comparison": None, "diagnosis": None,
        "shrunk": None, "time": 1795302641.3, "wallSeconds": 0.074, "userSeconds": 0.01, "systemSeconds": 0.009,
        "peakMemoryInBytes": 15978496, "sandbox": "bubblewrap", "steps": steps(65 if is_good else step or 0),
        "tests": None, "printed": [], "outputBytes": 322,
        "leftBehind": {"processes": 0, "sharedMemory": 0, "files": [], "fileCount": 0, "fileBytes": 0},
    }
    if change:
        event["comparison"] = {"change": change, "earlier": earlier}
    event.update(more)
    return event


def scan_ended(results, **more):
    counts = {}
    for result in results:
        counts[result["verdict"]] = counts.get(result["verdict"], 0) + 1
    unwanted = sum(not result["isWanted"] for result in results)
    return {"event": "scan_ended", "time": 1795302647.0, "wallSeconds": 24.9, "counts": counts, "unwanted": unwanted,
            "isInterrupted": False, "status": 1 if unwanted else 0, **more}


def stream(results, started=None, **ended):
    """The lines of a whole scan."""
    events = [started or scan_started(plugins=len(results)), *results, scan_ended(results, **ended)]
    return "".join(json.dumps(event) + "\n" for event in events)
