#!/usr/bin/env python3
# SPDX-License-Identifier: MIT
"""Times how long the HTML report of many plug-ins takes to open in headless Chromium.

    cmake --preset release && cmake --build --preset release
    bench/html_page.py [--scan build/release/vsttorture-scan] [--plugins 5000] [--rounds 7]

The page is made by `vsttorture-scan report --html` of an event stream like that of real plug-ins: one in twenty fails,
two thirds print some warnings, all are described. A page counts as open when its script has run and the browser has
drawn it: the second frame after the event "load". Times are the browser's own, from the start of the navigation on, and
the processor time of the thread that does the work. Then the table is sorted by name, and filtered. Takes the Debian
packages chromium, chromium-driver and python3-selenium.
"""
import argparse
import os
import pathlib
import random
import shutil
import statistics
import subprocess
import sys
import tempfile

sys.path.append("/usr/lib/python3/dist-packages")
from selenium import webdriver  # noqa: E402

ROOT = pathlib.Path(__file__).resolve().parent.parent
sys.path.append(str(ROOT / "tests/scanner"))
from recorded_events import STEP_TEXTS, plugin_ended, stream  # noqa: E402

WARNING = "[WRN] Found standard VST 2.x chunk header (program), read it as a bank\n"
DRAWN = "const done = arguments[0]; requestAnimationFrame(() => requestAnimationFrame(() => done({})))"
SORT = """const done = arguments[0], begin = performance.now();
  document.querySelectorAll('th button')[1].click();
  requestAnimationFrame(() => setTimeout(() => done(performance.now() - begin)));"""
FILTER = """const done = arguments[0], begin = performance.now(), box = document.getElementById('filter');
  box.value = 'x1'; box.dispatchEvent(new Event('input'));
  requestAnimationFrame(() => setTimeout(() => done(performance.now() - begin)));"""


def plugin(number, draw):
    is_good = draw.random() >= 0.05
    steps = [{"number": n + 1, "text": STEP_TEXTS[draw.randrange(7)], "seconds": draw.expovariate(1000) ** 2 * 1000}
             for n in range(65 if is_good else draw.randrange(1, 60))]
    printed = [{"step": step, "stream": "stderr", "text": WARNING * draw.randrange(1, 8)} for step in (1, 5, 14)]
    name = f"plugin-x{number % 7}-{number:05}"
    return plugin_ended(
        f"/usr/lib/vst/maker-{number % 40}/{name}.so", "passed" if is_good else "crashed", step=len(steps), steps=steps,
        printed=printed if number % 3 else [],
        description={"name": name, "maker": f"Maker {number % 40}", "category": {"number": 1, "name": "effect"},
                     "uniqueId": {"number": number, "text": "abcd"}, "inputs": [None] * 2, "outputs": [None] * 2,
                     "parameters": [{}] * 20, "programs": ["Default"]})


def start_browser(home):
    os.environ.update(HOME=home, NO_PROXY="localhost,127.0.0.1")
    options = webdriver.ChromeOptions()
    for argument in ["--headless=new", "--no-sandbox", "--disable-gpu", "--disable-quic", "--no-first-run",
                     "--disable-background-networking", "--disable-component-update", "--disable-sync",
                     "--disable-dev-shm-usage", f"--user-data-dir={home}/profile"]:
        options.add_argument(argument)
    options.binary_location = shutil.which("chromium")
    return webdriver.Chrome(service=webdriver.chrome.service.Service(shutil.which("chromedriver")), options=options)


def one_round(browser, page):
    def busy():
        metrics = browser.execute_cdp_cmd("Performance.getMetrics", {})["metrics"]
        return next(metric["value"] for metric in metrics if metric["name"] == "TaskDuration")

    browser.get("about:blank")
    browser.execute_cdp_cmd("Performance.enable", {"timeDomain": "threadTicks"})
    before = busy()
    browser.get(page.as_uri())
    opened = browser.execute_async_script(DRAWN.format("performance.now()"))
    processor = busy() - before
    assert browser.execute_script("return document.documentElement.classList.contains('scripted')")
    return {"open": opened, "open, processor time": processor * 1000,
            "sort by name": browser.execute_async_script(SORT), "filter": browser.execute_async_script(FILTER)}


def main():
    parser = argparse.ArgumentParser(description=__doc__, formatter_class=argparse.RawDescriptionHelpFormatter)
    parser.add_argument("--scan", default=ROOT / "build/release/vsttorture-scan", type=pathlib.Path)
    parser.add_argument("--plugins", default=5000, type=int)
    parser.add_argument("--rounds", default=7, type=int)
    options = parser.parse_args()
    draw = random.Random(1)
    with tempfile.TemporaryDirectory(prefix="vsttorture-bench-") as home:
        folder = pathlib.Path(home)
        (folder / "events").write_text(stream([plugin(number, draw) for number in range(options.plugins)]))
        page = folder / "page.html"
        made = subprocess.run([options.scan, "report", "--quiet", "--html", page, folder / "events"],
                              stdout=subprocess.DEVNULL, check=False)
        assert made.returncode == 1, made
        browser = start_browser(home)
        try:
            rounds = [one_round(browser, page) for _ in range(options.rounds)]
        finally:
            browser.quit()
        print(f"{options.plugins} plug-ins, {page.stat().st_size / 1e6:.1f} MB, {options.rounds} rounds, "
              f"load {os.getloadavg()[0]:.1f} on {os.cpu_count()} processors")
        for what in rounds[0]:
            times = sorted(one[what] for one in rounds)
            print(f"{what:<22} median {statistics.median(times):6.0f} ms  ({times[0]:.0f} to {times[-1]:.0f})")


if __name__ == "__main__":
    main()
