# SPDX-License-Identifier: MIT
"""Looks at the HTML report in a real browser, as its readers do.

    html_page_test.py --scan build/release/vsttorture-scan --plugins build/release/plugins [TEST...]

The tests of the classes File and Program need no browser. The others take Chromium, its driver, and the Python package
selenium (Debian: chromium chromium-driver python3-selenium): where one of them is missing the status is 77, or 1 with
VSTTORTURE_BROWSER=required in the environment.
"""
import argparse
import base64
import hashlib
import html.parser
import json
import os
import pathlib
import shutil
import subprocess
import sys
import tempfile
import time
import unittest

# The package is Debian's; the interpreter need not be.
sys.path.append("/usr/lib/python3/dist-packages")
try:
    from selenium import webdriver
    from selenium.webdriver.common.action_chains import ActionChains
    from selenium.webdriver.common.by import By
    from selenium.webdriver.common.keys import Keys
except ImportError:
    webdriver = None

sys.path.insert(0, str(pathlib.Path(__file__).resolve().parents[1] / "shared"))
import short_folder  # noqa: E402
from recorded_events import plugin_ended, scan_started, stream  # noqa: E402

NOTHING_TO_LOOK_WITH = 77
SCAN = PLUGINS = None  # From the command line.
WIDE, NARROW = 1280, 360
LIMIT_IN_SECONDS = 60  # For what the browser does a moment later, also where the machine is busy.

PAYLOADS = [
    "</script><img src=x onerror=window.__hit=1>",
    "\"><svg onload=window.__hit=2>",
    "' onmouseover='window.__hit=3' x='",
    "]]><script>window.__hit=4</script>",
    "</noscript><script>window.__hit=5</script>",
    "</title></style><script>window.__hit=6</script>",
    "</pre></details></table><iframe srcdoc='<script>parent.__hit=7</script>'>",
    "javascript:window.__hit=8",
    "{{rows}}{{title}}&lt;&amp;<!--",
    "<plaintext>",
]
# What cannot be seen, and how the page shows it.
UNSEEN = {"a\u202eb": "a[U+202E]b", "c\x00d": "c\u2400d", "e\x9bf": "e[U+009B]f", "g\x1b[31mh": "g\u241b[31mh",
          "i\u200bj": "i[U+200B]j", "k\u2028l": "k[U+2028]l", "m\x7fn": "m\u2421n",
          "\u05d0\u05d1 \u4e2d": "\u05d0\u05d1 \u4e2d"}

FAILURES = [
    plugin_ended("/usr/lib/vst/new.so", "crashed", change="new", wallSeconds=0.5,
                 earlier={"verdict": "passed", "step": None, "time": 1795202622.0},
                 request={"kind": "dispatcher", "opcode": 44, "name": "effSetBypass", "index": 0, "value": 1,
                          "opt": 0.0},
                 hostRequest={"opcode": 0, "name": "audioMasterAutomate", "index": 21, "value": 0, "count": 46},
                 place={"module": "new.so", "offset": "0x4c", "address": "0x0"},
                 signal={"number": 11, "name": "SIGSEGV"},
                 printed=[{"step": 5, "stream": "stderr", "text": "a warning\nof two lines\n"}],
                 diagnosis={"tool": "memcheck", "command": ["valgrind", "vsttorture-worker", "/usr/lib/vst/new.so"],
                            "findings": [{"kind": "InvalidRead", "text": "Invalid read of size 8",
                                          "frames": ["bypass (bypass.cpp:44)", "new.so+0x4c"], "isInPlugin": True}],
                            "problem": None, "report": "==1== Invalid read\n"},
                 shrunk={"from": "3,1,0,2", "tests": "3", "runs": 7, "isReproduced": True,
                         "command": ["vsttorture-worker", "--tests", "3", "/usr/lib/vst/new.so"]},
                 leftBehind={"processes": 2, "sharedMemory": 0, "files": ["home/.cache"], "fileCount": 3,
                             "fileBytes": 2048}),
    plugin_ended("/usr/lib/vst/flaky.so", "passed", change="flaky", isWanted=False, wallSeconds=3.0,
                 repetitions={"runs": 5, "isFlaky": True, "verdicts": {"passed": 3, "crashed at 5": 2}}),
    plugin_ended("/usr/lib/vst/still.so", "crashed", change="still_failing", step=12, wallSeconds=0.02),
    plugin_ended("/usr/lib/vst/hangs.so", "hung", step=4, wallSeconds=20.2, hangs="waiting",
                 activity={"processorSeconds": 0.02, "wallSeconds": 20.0, "state": "S", "systemCall": "futex",
                           "sockets": 2}),
    plugin_ended("/opt/vst/old.so", "wrong_architecture", step=None, steps=[], cause="built for i386"),
]
WANTED = [
    plugin_ended("/usr/lib/vst/mended.so", change="mended", wallSeconds=0.1,
                 earlier={"verdict": "crashed", "step": 5, "time": 1795202622.0}),
    plugin_ended("/usr/lib/vst/known.so", "failed", step=5, isWanted=True, wallSeconds=0.2,
                 expected={"verdict": "failed", "step": 5, "reason": "ticket 44", "isMet": True}),
    plugin_ended("/opt/vst/a10.so", wallSeconds=0.03),
    plugin_ended("/opt/vst/a9.so", wallSeconds=0.04),
    plugin_ended("/opt/vst/Shell.so", "shell", wallSeconds=0.01),
    plugin_ended("/opt/vst/Shell.so", child=7, child_name="Seventh", wallSeconds=0.05),
]
def hostile(text, **more):
    """A result with the text wherever a plug-in, a list or a tool can put one."""
    return plugin_ended(
        f"/usr/lib/{text.replace('/', '_')}/{text.replace('/', '_')}.so", child=1, child_name=text, cause=text,
        otherNames=[text], contradictions=[text], command=["worker", text],
        printed=[{"step": 1, "stream": "stdout", "text": text}],
        expected={"verdict": "passed", "step": None, "reason": text, "isMet": False},
        steps=[{"number": 1, "text": text, "seconds": 0.1}],
        diagnosis={"tool": text, "command": [text], "problem": text, "report": text,
                   "findings": [{"kind": text, "text": text, "frames": [text], "isInPlugin": False}]},
        shrunk={"from": "1", "tests": "1", "runs": 1, "isReproduced": True, "command": [text]},
        leftBehind={"processes": 0, "sharedMemory": 0, "files": [text], "fileCount": 1, "fileBytes": 1},
        place={"module": text, "offset": "0x1", "address": "0x2"},
        description={"name": text, "maker": text, "category": {"name": text}, "uniqueId": {"text": text},
                     "programs": [text, text], "inputs": text}, **more)


# As the page lists them.
ORDER = ["new.so", "flaky.so", "still.so", "hangs.so", "old.so", "mended.so", "known.so", "Shell.so #7 Seventh",
         "a10.so", "a9.so", "Shell.so"]

NAMES = """return [...document.querySelectorAll('#results > tbody')].filter((body) => !body.hidden).map((body) => {
  const cell = body.rows[0].cells[1].cloneNode(true);
  cell.querySelector('small').remove();
  return cell.textContent.trim();
});"""

# The texts that are to be seen whose contrast is below 4.5 to 1, with their colours.
POOR_CONTRAST = """
  const parse = (colour) => colour.match(/[\\d.]+/g).map(Number);
  const over = (front, back) => {
    const alpha = front[3] ?? 1;
    return [0, 1, 2].map((i) => front[i] * alpha + back[i] * (1 - alpha));
  };
  const groundOf = (element) => {
    if (!element) return matchMedia('(prefers-color-scheme: dark)').matches ? [0, 0, 0] : [255, 255, 255];
    if (element.tagName === 'svg' && element.querySelector(':scope > rect')) {
      return parse(getComputedStyle(element.querySelector(':scope > rect')).fill);
    }
    return over(parse(getComputedStyle(element).backgroundColor), groundOf(element.parentElement));
  };
  const luminance = (colour) => {
    const [r, g, b] = colour.map((c) => c / 255).map((c) => (c <= 0.03928 ? c / 12.92 : ((c + 0.055) / 1.055) ** 2.4));
    return 0.2126 * r + 0.7152 * g + 0.0722 * b;
  };
  const poor = [];
  const texts = document.createTreeWalker(document.body, NodeFilter.SHOW_TEXT);
  let looked = 0;
  while (texts.nextNode()) {
    const element = texts.currentNode.parentElement;
    if (!texts.currentNode.data.trim() || !element.checkVisibility()) continue;
    if (['SCRIPT', 'NOSCRIPT', 'title'].includes(element.tagName)) continue;
    const style = getComputedStyle(element);
    const ground = groundOf(element);
    const colour = over(parse(element.tagName === 'text' ? style.fill : style.color), ground);
    const [light, dark] = [luminance(colour), luminance(ground)].sort((a, b) => b - a);
    looked += 1;
    if ((light + 0.05) / (dark + 0.05) < 4.5) poor.push([element.textContent.slice(0, 40), colour, ground].join(' '));
  }
  return [looked, poor];"""


BROWSER = HOME = None  # One of each for all tests.
PAGES = {}


def setUpModule():
    global HOME
    HOME = tempfile.TemporaryDirectory(prefix="vsttorture-browser-")
    unittest.addModuleCleanup(HOME.cleanup)


def start_browser():
    global BROWSER
    nobody = "localhost,127.0.0.1"
    os.environ.update(HOME=HOME.name, NO_PROXY=nobody, no_proxy=nobody)
    os.environ["TMPDIR"] = short_folder.parent()  # The browser makes a socket there.
    for name in [name for name in os.environ if name.startswith("XDG_")]:
        del os.environ[name]  # It makes folders there.
    options = webdriver.ChromeOptions()
    for argument in ["--headless=new", "--no-sandbox", "--disable-gpu", "--disable-quic", "--no-first-run",
                     "--disable-background-networking", "--disable-component-update", "--disable-sync",
                     "--disable-dev-shm-usage", "--hide-scrollbars", f"--user-data-dir={HOME.name}/profile"]:
        options.add_argument(argument)
    options.binary_location = shutil.which("chromium")
    options.set_capability("goog:loggingPrefs", {"performance": "ALL", "browser": "ALL"})
    BROWSER = webdriver.Chrome(service=webdriver.chrome.service.Service(shutil.which("chromedriver")), options=options)
    unittest.addModuleCleanup(BROWSER.quit)


class PageTest(unittest.TestCase):
    def page(self, lines):
        """The file with the report of an event stream; each is made once."""
        if lines not in PAGES:
            folder = pathlib.Path(tempfile.mkdtemp(dir=HOME.name))
            (folder / "events.jsonl").write_text(lines)
            made = subprocess.run([SCAN, "report", "--html", folder / "report.html", "--quiet",
                                   folder / "events.jsonl"], stdin=subprocess.DEVNULL, capture_output=True, text=True,
                                  timeout=120, check=False)
            self.assertIn(made.returncode, (0, 1))
            self.assertEqual(made.stderr, "")
            PAGES[lines] = folder / "report.html"
        return PAGES[lines]


class Elements(html.parser.HTMLParser):
    """The elements of a page: each with its attributes, and what is in style and script."""

    VOID = {"meta", "input", "br"}

    def __init__(self, text):
        super().__init__()
        self.elements, self.raw, self.open, self.faults = [], {}, [], []
        self.feed(text)
        self.close()
        self.faults += [f"<{tag}> is not closed" for tag in self.open]

    def handle_starttag(self, tag, attributes):
        self.elements.append((tag, dict(attributes)))
        if tag not in self.VOID:
            self.open.append(tag)

    def handle_startendtag(self, tag, attributes):
        self.elements.append((tag, dict(attributes)))

    def handle_endtag(self, tag):
        if not self.open or self.open.pop() != tag:
            self.faults.append(f"</{tag}> closes nothing at {self.getpos()}")

    def handle_data(self, data):
        if self.open and self.open[-1] in ("style", "script"):
            self.raw[self.open[-1]] = self.raw.get(self.open[-1], "") + data


class File(PageTest):
    @classmethod
    def setUpClass(cls):
        cls.results = [*FAILURES, *WANTED, *(hostile(text, verdict="crashed") for text in [*PAYLOADS, *UNSEEN])]

    def setUp(self):
        self.bytes = self.page(stream(self.results)).read_bytes()
        self.elements = Elements(self.bytes.decode("ascii"))

    def test_all_elements_are_closed_and_all_names_of_parts_are_different(self):
        self.assertEqual(self.elements.faults, [])
        names = [attributes["id"] for _, attributes in self.elements.elements if "id" in attributes]
        self.assertEqual(len(names), len(set(names)))
        self.assertGreater(len(names), len(self.results))

    def test_its_policy_admits_its_own_style_and_script_by_their_hashes_and_nothing_else(self):
        hashes = {kind: base64.b64encode(hashlib.sha256(self.elements.raw[kind].encode()).digest()).decode()
                  for kind in ("style", "script")}
        policy = next(attributes["content"] for tag, attributes in self.elements.elements
                      if attributes.get("http-equiv") == "Content-Security-Policy")
        self.assertEqual(policy, f"default-src 'none'; style-src 'sha256-{hashes['style']}'; "
                                 f"script-src 'sha256-{hashes['script']}'; base-uri 'none'; form-action 'none'")

    def test_no_element_refers_to_anything_or_holds_a_script_of_its_own(self):
        for tag, attributes in self.elements.elements:
            for name in attributes:
                self.assertNotIn(name, ("src", "href", "srcdoc", "action", "style"), tag)
                self.assertFalse(name.startswith("on"), (tag, name))
        tags = [tag for tag, _ in self.elements.elements]
        self.assertEqual([tags.count(tag) for tag in ("style", "script", "link", "iframe", "img")], [1, 1, 0, 0, 0])


class Program(PageTest):
    def scan(self, *arguments):
        ended = subprocess.run([SCAN, *map(str, arguments)], stdin=subprocess.DEVNULL, capture_output=True, text=True,
                               env={"HOME": HOME.name, "TMPDIR": HOME.name, "PATH": "/usr/bin:/bin"}, timeout=120,
                               check=False)
        return ended.returncode, ended.stdout, ended.stderr

    def test_a_scan_and_a_report_of_its_record_write_the_same_page(self):
        folder = pathlib.Path(tempfile.mkdtemp(dir=HOME.name))
        plugins = [PLUGINS / name for name in ["well_behaved_effect.so", "open_crashes.so", "shell.so", "no_entry.so"]]
        status, _, complaints = self.scan("--sandbox", "off", "--cache", "off", "--describe", "--json",
                                          folder / "events", "--html", folder / "page", *plugins)
        self.assertEqual((status, complaints), (1, ""))
        self.assertEqual(self.scan("report", "--html", folder / "again", folder / "events")[0], 1)
        page = (folder / "page").read_text()
        results = [event for event in map(json.loads, (folder / "events").read_text().splitlines())
                   if event["event"] == "plugin_ended"]
        self.assertEqual(page.count("<tbody"), len(results))
        self.assertGreater(len(results), len(plugins))  # The children of the shell.
        self.assertEqual((folder / "again").read_text(), page)


class BrowserTest(PageTest):
    """Each test opens a page of its own."""

    @property
    def browser(self):
        if BROWSER is None:
            start_browser()
        return BROWSER

    def devtools(self, command, **parameters):
        return self.browser.execute_cdp_cmd(command, parameters)

    def open(self, results=tuple(FAILURES + WANTED), fragment="", scheme="light", width=WIDE, scripts=True,
             started=None):
        path = self.page(stream(list(results), started))
        self.browser.get("about:blank")
        self.devtools("Emulation.setScriptExecutionDisabled", value=not scripts)
        self.devtools("Emulation.setDeviceMetricsOverride", width=width, height=900, deviceScaleFactor=1, mobile=False)
        self.devtools("Emulation.setEmulatedMedia", media="",
                      features=[{"name": "prefers-color-scheme", "value": scheme}])
        for log in ("performance", "browser"):
            self.browser.get_log(log)
        self.browser.get(path.as_uri() + fragment)

    def run_script(self, script, *arguments):
        return self.browser.execute_script(script, *arguments)

    def names(self):
        return self.run_script(NAMES)

    def element(self, selector):
        return self.browser.find_element(By.CSS_SELECTOR, selector)

    def elements(self, selector):
        return self.browser.find_elements(By.CSS_SELECTOR, selector)

    def row(self, name):
        return self.elements("#results > tbody")[self.names().index(name)].find_element(By.CSS_SELECTOR, ".row")

    def open_all(self):
        self.run_script("for (const one of document.querySelectorAll('details')) one.open = true;")
        # Rows that were text until now have details of their own.
        self.wait_for("return !document.querySelector('noscript')")
        # What is far away is not drawn, and what is not drawn has no text for innerText.
        self.run_script("""
          for (const one of document.querySelectorAll('details')) one.open = true;
          for (const one of document.querySelectorAll('tbody')) one.style.contentVisibility = 'visible';""")

    def wait_for(self, script):
        """Until the script returns something true, which is returned."""
        deadline = time.monotonic() + LIMIT_IN_SECONDS
        while time.monotonic() < deadline:
            value = self.run_script(script)
            if value:
                return value
            time.sleep(0.02)
        raise AssertionError("did not become true: " + script)

    def assert_quiet(self):
        """Nothing was fetched but the page, nothing complained, and no injected script ran."""
        requested = set()
        for entry in self.browser.get_log("performance"):
            message = json.loads(entry["message"])["message"]
            if message["method"] == "Network.requestWillBeSent":
                requested.add(message["params"]["request"]["url"].partition("#")[0])
        self.assertEqual([url for url in requested if not url.endswith("/report.html")], [])
        self.assertEqual(self.browser.get_log("browser"), [])
        self.assertIsNone(self.run_script("return window.__hit ?? null"))


class Page(BrowserTest):
    def test_it_opens_from_the_file_system_and_asks_the_network_for_nothing(self):
        self.open()
        self.open_all()
        self.assertTrue(self.browser.current_url.startswith("file:///"))
        self.assertIn("5 of 11 plug-ins did not end as they should", self.browser.title)
        self.assert_quiet()

    def test_its_head_says_how_many_ended_in_which_way_and_how_they_were_tried(self):
        self.open(started=scan_started(machine="rack 7", notes=["not searched: /root: Permission denied"]))
        self.assertEqual(self.element("h1").text, "5 of 11 plug-ins did not end as they should")
        counts = [[item.text for item in group.find_elements(By.TAG_NAME, "li")] for group in self.elements(".counts")]
        self.assertEqual(counts, [["1 failed", "2 crashed", "1 hung", "1 wrong_architecture", "5 passed", "1 shell"],
                                  ["1 new", "1 flaky", "1 still failing", "1 mended"]])
        self.assertEqual(self.element(".scan").text,
                         "rack 7 \xb7 2026-11-21 23:10:22 UTC \xb7 took 25 s \xb7 vsttorture-scan 0.2.0")
        self.assertIn("not searched: /root: Permission denied", self.element(".warnings").text)
        self.element(".circumstances > summary").click()
        facts = self.element(".circumstances").text
        for fact in ["/usr/lib/vst", "bubblewrap", "2 plug-ins", "20 s a step, 2 min 0 s a run, 4 GiB of memory"]:
            self.assertIn(fact, facts)

    def test_failures_come_first_and_what_is_new_before_the_others(self):
        self.open()
        self.assertEqual(self.names(), ORDER)

    def test_a_row_shows_verdict_name_folder_cause_step_time_and_change(self):
        self.open()
        cells = [cell.text for cell in self.row("still.so").find_elements(By.TAG_NAME, "td")]
        self.assertEqual(cells, ["crashed", "still.so /usr/lib/vst", "step 12, testing setting states: SIGSEGV in "
                                 "effSetBypass (44)", "12", "20 ms", "still failing"])
        self.assertEqual(self.row("known.so").find_element(By.TAG_NAME, "td").text, "failed as expected")

    def test_the_details_of_a_failure_say_all_that_is_known(self):
        self.open()
        self.row("new.so").click()
        self.open_all()
        details = self.elements(".details")[0].get_attribute("innerText")
        for text in ["effSetBypass (44), value 1", "audioMasterAutomate, index 21; 46 requests in all",
                     "new.so+0x4c", "Could not reach\n0x0", "SIGSEGV (11)", "new: it did not fail in this way before",
                     "earlier: passed, 2026-11-20 19:23:42 UTC", "15.2 MiB of memory", "2 processes, 3 files of 2 KiB: "
                     "home/.cache and others", "vsttorture-worker /usr/lib/vst/new.so", "3 of 3,1,0,2, found in 7 runs",
                     "vsttorture-worker --tests 3 /usr/lib/vst/new.so", "InvalidRead Invalid read of size 8",
                     "bypass (bypass.cpp:44)", "==1== Invalid read", "valgrind vsttorture-worker /usr/lib/vst/new.so",
                     "Step 5, standard error", "a warning\nof two lines",
                     "What to do: Repeat the run under a debugger"]:
            self.assertIn(text, details)
        parts = [part.get_attribute("textContent") for part in self.elements("tbody:first-of-type .bar > svg > title")]
        self.assertEqual(parts[-1], "Step 5, testing setting states: 1.0 ms (did not end well)")
        for name, text in {"flaky.so": "2 of 5 crashed at 5, 3 of 5 passed; 40 % of the runs failed",
                           "hangs.so": "waiting: used the processor for 20 ms of the last 20 s, sleeping in the system "
                                       "call futex, 2 open sockets",
                           "known.so": "failed at step 5, and so it ended; reason in the list: ticket 44"}.items():
            body = self.row(name).find_element(By.XPATH, "..")
            self.assertIn(text, body.get_attribute("innerText"))


class Sorting(BrowserTest):
    def sorted_by(self, column, times=1):
        for _ in range(times):
            self.elements("th button")[column].click()
        marks = [header.get_attribute("aria-sort") for header in self.elements("th")]
        self.assertEqual([mark for i, mark in enumerate(marks) if i != column], ["none"] * 5)
        return self.names(), marks[column]

    def test_each_column_sorts_both_ways_and_keeps_what_has_no_value_at_the_end(self):
        by_name = ["a9.so", "a10.so", "flaky.so", "hangs.so", "known.so", "mended.so", "new.so", "old.so", "Shell.so",
                   "Shell.so #7 Seventh", "still.so"]
        expected = {
            0: ["known.so", "new.so", "still.so", "hangs.so", "old.so", "flaky.so", "mended.so", "Shell.so #7 Seventh",
                "a10.so", "a9.so", "Shell.so"],
            1: by_name,
            2: ["old.so", "flaky.so", "hangs.so", "new.so", "known.so", "still.so"],
            3: ["hangs.so", "new.so", "known.so", "still.so"],
            4: ["Shell.so", "still.so", "a10.so", "a9.so", "Shell.so #7 Seventh", "old.so", "mended.so", "known.so",
                "new.so", "flaky.so", "hangs.so"],
            5: ["new.so", "flaky.so", "still.so", "mended.so"],
        }
        self.open()
        for column, names in expected.items():
            with self.subTest(column=column):
                up, mark = self.sorted_by(column)
                self.assertEqual((up[:len(names)], mark), (names, "ascending"))
                self.assertEqual(sorted(up), sorted(ORDER))
                down, mark = self.sorted_by(column)
                self.assertEqual(mark, "descending")
                if column in (2, 3):
                    self.assertEqual(set(down[:len(names)]), set(names))
                    self.assertEqual(down[0], names[-1])
                elif column in (1, 4):
                    self.assertEqual(down, names[::-1])
                else:
                    self.assertEqual(down[-1] if column == 5 else down[0], "new.so" if column == 5 else "Shell.so")

    def test_a_report_without_changes_has_no_such_column(self):
        self.open([plugin_ended("/usr/lib/vst/a.so")])
        self.assertEqual([header.text.split()[0] for header in self.elements("th") if header.is_displayed()],
                         ["Verdict", "Plug-in", "Cause", "Step", "Time"])


class Filtering(BrowserTest):
    def chip(self, text):
        return next(button for button in self.elements(".counts button") if button.text == text)

    def test_the_box_wants_all_words_in_any_case(self):
        self.open()
        box = self.element("#filter")
        for text, names in {"OPT a": ["old.so", "Shell.so #7 Seventh", "a10.so", "a9.so"],
                            "seventh": ["Shell.so #7 Seventh"], "crashed effSetBypass": ["new.so", "still.so"],
                            "nothing like it": []}.items():
            with self.subTest(text=text):
                box.clear()
                box.send_keys(text)
                self.assertEqual(self.names(), names)
                self.assertEqual(self.element("#shown").text, f"{len(names)} of 11 shown")
                self.assertEqual(self.element("#nothing").is_displayed(), not names)
        box.send_keys(Keys.ESCAPE)
        self.assertEqual((self.names(), self.element("#shown").text), (ORDER, ""))

    def test_verdicts_add_up_and_changes_narrow_them(self):
        self.open()
        self.chip("2 crashed").click()
        self.assertEqual(self.names(), ["new.so", "still.so"])
        self.assertEqual(self.chip("2 crashed").get_attribute("aria-pressed"), "true")
        self.chip("1 hung").click()
        self.assertEqual(self.names(), ["new.so", "still.so", "hangs.so"])
        self.chip("1 new").click()
        self.assertEqual(self.names(), ["new.so"])
        for text in ["2 crashed", "1 hung", "1 new"]:
            self.chip(text).click()
        self.assertEqual(self.names(), ORDER)


class Opening(BrowserTest):
    def opened(self):
        return self.run_script("return [...document.querySelectorAll('#results > tbody')].filter((body) => "
                               "body.rows[1].querySelector('details').open).map((body) => body.id)")

    def test_a_click_on_a_row_opens_it_and_names_it_in_the_address(self):
        self.open()
        self.row("a9.so").click()
        self.assertEqual(self.opened(), ["plugin-a9.so"])
        self.wait_for("return location.hash === '#plugin-a9.so'")
        self.assertIn("vsttorture-worker /opt/vst/a9.so", self.element("#plugin-a9\\.so .command").text)
        self.row("a9.so").click()
        self.assertEqual(self.opened(), [])
        self.assert_quiet()

    def test_an_address_opens_the_plugin_that_it_names(self):
        for name in ["plugin-hangs.so", "plugin-Shell.so.7"]:
            self.open(fragment="#" + name)
            self.assertEqual(self.opened(), [name])
        self.run_script("location.hash = '#plugin-new.so'")
        self.wait_for("return document.querySelector('#plugin-new\\\\.so details').open")

    def test_an_address_far_down_is_scrolled_to_and_shown_although_it_was_filtered_out(self):
        self.open([plugin_ended(f"/usr/lib/vst/{n:03}.so") for n in range(300)], fragment="#plugin-250.so")
        in_sight = "const box = document.getElementById(arguments[0]).getBoundingClientRect(); " \
                   "return box.top >= 0 && box.top < innerHeight - 100;"
        self.wait_for(in_sight.replace("arguments[0]", "'plugin-250.so'"))
        self.element("#filter").send_keys("001")
        self.assertEqual(self.names(), ["001.so"])
        self.run_script("location.hash = '#plugin-280.so'")
        self.wait_for(in_sight.replace("arguments[0]", "'plugin-280.so'"))

    def test_files_of_the_same_name_have_addresses_of_their_own_which_verdicts_do_not_change(self):
        for verdicts in [("passed", "crashed"), ("crashed", "passed")]:
            self.open([plugin_ended(f"/{folder}/same.so", verdict) for folder, verdict in zip("ab", verdicts)],
                      fragment="#plugin-same.so~2")
            self.assertEqual(self.opened(), ["plugin-same.so~2"])
            self.assertIn("/b/same.so", self.element("tbody:has(details[open]) .command").text)

    def test_the_command_is_copied(self):
        self.open(fragment="#plugin-new.so")
        self.devtools("Browser.grantPermissions", permissions=["clipboardReadWrite", "clipboardSanitizedWrite"])
        button = self.element("#plugin-new\\.so .command button")
        button.click()
        self.wait_for("return document.querySelector('#plugin-new\\\\.so .command button').textContent !== 'Copy'")
        if button.text == "Copied":
            copied = self.browser.execute_async_script("navigator.clipboard.readText().then(arguments[0])")
        else:
            copied = self.run_script("return getSelection().toString()")
        self.assertEqual(copied, "vsttorture-worker /usr/lib/vst/new.so")


class Keyboard(BrowserTest):
    def focused(self):
        return self.run_script("return document.activeElement.closest('tbody')?.id ?? document.activeElement.id")

    def press(self, *keys):
        ActionChains(self.browser).send_keys(*keys).perform()

    def test_everything_is_reached_and_worked_by_keys(self):
        self.open()
        self.press("/")
        self.assertEqual(self.focused(), "filter")
        for _ in range(7):  # The headers, then the first row.
            self.press(Keys.TAB)
        self.assertEqual(self.focused(), "plugin-new.so")
        outline = "const style = getComputedStyle(document.activeElement);" \
                  "return [style.outlineStyle, style.outlineWidth]"
        self.assertEqual(self.run_script(outline), ["solid", "2px"])
        self.press(Keys.ENTER)
        self.assertTrue(self.element("#plugin-new\\.so .details").is_displayed())
        self.press(Keys.ARROW_DOWN, Keys.ARROW_DOWN)
        self.assertEqual(self.focused(), "plugin-still.so")
        self.press(Keys.ARROW_UP)
        self.assertEqual(self.focused(), "plugin-flaky.so")
        self.press(Keys.END)
        self.assertEqual(self.focused(), "plugin-Shell.so")
        self.press(Keys.SPACE)
        self.wait_for("return document.querySelector('#plugin-Shell\\\\.so .details')?.checkVisibility()")
        self.press(Keys.HOME)
        self.assertEqual(self.focused(), "plugin-new.so")

    def test_a_header_sorts_by_key(self):
        self.open()
        self.press("/", Keys.TAB, Keys.TAB, Keys.ENTER)
        self.assertEqual(self.names()[0], "a9.so")


class Printing(BrowserTest):
    VISIBLE = "return [...document.querySelectorAll('.details')].filter((one) => one.checkVisibility(" \
              "{contentVisibilityAuto: true})).map((one) => one.closest('tbody').id)"
    UNWANTED = ["plugin-new.so", "plugin-flaky.so", "plugin-still.so", "plugin-hangs.so", "plugin-old.so"]

    def test_paper_shows_the_details_of_failures_and_no_tools(self):
        self.open()
        self.assertEqual(self.run_script(self.VISIBLE), [])
        self.devtools("Emulation.setEmulatedMedia", media="print")
        # With content-visibility what is shown is known when the next frame has been made.
        self.assertEqual(self.wait_for(f"const shown = (() => {{ {self.VISIBLE} }})(); "
                                       f"return shown.length >= {len(self.UNWANTED)} && shown"), self.UNWANTED)
        self.assertFalse(self.element("#filter").is_displayed())
        self.assertEqual(self.run_script("return getComputedStyle(document.body).backgroundColor"),
                         "rgb(255, 255, 255)")

    def test_a_browser_that_cannot_do_that_by_style_has_them_opened_while_it_prints(self):
        self.open()
        opened = "return [...document.querySelectorAll('#results details[open]')].map((one) => one.closest('tbody').id)"
        self.run_script("dispatchEvent(new Event('beforeprint'))")
        self.assertEqual(self.run_script(opened), self.UNWANTED)
        self.run_script("dispatchEvent(new Event('afterprint'))")
        self.assertEqual(self.run_script(opened), [])

    def test_failures_beyond_those_that_are_elements_from_the_beginning_are_printed_too(self):
        self.open([plugin_ended(f"/usr/lib/vst/{n:03}.so", "crashed", steps=[]) for n in range(502)])
        self.assertEqual(self.run_script("return document.querySelectorAll('noscript').length"), 2)
        self.run_script("dispatchEvent(new Event('beforeprint'))")
        self.assertEqual(self.run_script("return document.querySelectorAll('#results details[open] > .details').length"),
                         502)

    def test_it_prints(self):
        self.open()
        paper = base64.b64decode(self.devtools("Page.printToPDF", printBackground=False)["data"])
        self.assertTrue(paper.startswith(b"%PDF"))
        self.assertGreater(len(paper), 20_000)
        self.assertEqual(self.run_script("return document.querySelectorAll('#results details[open]').length"), 0)


class WithoutScripts(BrowserTest):
    """The DOM is asked by the browser's own tools: scripts of the page do not run."""

    def tearDown(self):
        self.browser.get("about:blank")
        self.devtools("Emulation.setScriptExecutionDisabled", value=False)

    def value(self, expression):
        return self.devtools("Runtime.evaluate", expression=expression, returnByValue=True)["result"].get("value")

    def test_it_is_a_table_with_all_rows_whose_details_open(self):
        for width in (WIDE, NARROW):
            self.open(scripts=False, width=width)
            self.assertFalse(self.value("document.documentElement.classList.contains('scripted')"))
            self.assertEqual(self.value("document.querySelectorAll('#results > tbody').length"), len(ORDER))
            text = self.value("document.body.innerText")
            for name in ["new.so", "a9.so", "2 crashed", "step 12, testing setting states"]:
                self.assertIn(name, text)
            self.assertNotIn("Filter", text)
            self.assertNotIn("vsttorture-worker /opt/vst/a9.so", text)
            x, y = self.value("(() => { const row = document.getElementById('plugin-a9.so'); row.scrollIntoView();"
                              "const box = row.querySelector('summary').getBoundingClientRect();"
                              "return [box.left + box.width / 2, box.top + box.height / 2]; })()")
            for kind in ("mousePressed", "mouseReleased"):
                self.devtools("Input.dispatchMouseEvent", type=kind, x=x, y=y, button="left", clickCount=1)
            deadline = time.monotonic() + LIMIT_IN_SECONDS
            while not self.value("document.querySelector('#plugin-a9\\\\.so details').open"):
                self.assertLess(time.monotonic(), deadline)
            self.assertIn("vsttorture-worker /opt/vst/a9.so", self.value("document.body.innerText"))


class HostileTexts(BrowserTest):
    def test_markup_stays_text_wherever_it_comes_from(self):
        for verdict in ("crashed", "passed"):
            results = [hostile(text, verdict=verdict, isWanted=verdict == "passed") for text in PAYLOADS]
            self.open(results, started=scan_started(machine=PAYLOADS[0], notes=PAYLOADS, sandbox=PAYLOADS[1],
                                                    places=PAYLOADS, version=PAYLOADS[3]))
            self.open_all()
            self.assertEqual(len(self.names()), len(PAYLOADS))
            text = self.run_script("return document.body.innerText")
            for payload in PAYLOADS:
                # Name of the child, other name, printed, file left behind, and more.
                self.assertGreaterEqual(text.count(payload), 8, payload)
            self.assertEqual(self.run_script("return document.querySelectorAll('img, iframe, script, a, plaintext')"
                                             ".length"), 1)
            self.assert_quiet()

    def test_what_cannot_be_seen_is_shown(self):
        self.open([hostile(text, verdict="crashed") for text in UNSEEN])
        self.open_all()
        text = self.run_script("return document.body.innerText")
        for shown in UNSEEN.values():
            self.assertGreaterEqual(text.count(shown), 8, shown)
        for character in "\u202e\x00\x9b\x1b\u200b\u2028\x7f":
            self.assertNotIn(character, text)

    def test_an_endless_line_is_whole_and_does_not_widen_the_page(self):
        line = "x" * 100_000
        for width in (WIDE, NARROW):
            self.open([hostile(line, verdict="crashed")], width=width)
            self.assertEqual(self.run_script("return document.scrollingElement.scrollWidth"), width)
            self.open_all()
            self.assertEqual(self.run_script("return document.scrollingElement.scrollWidth"), width)
            printed = "return [...document.querySelectorAll('pre')]" \
                      ".filter((one) => one.textContent === arguments[0]).length"
            self.assertGreaterEqual(self.run_script(printed, line), 2)

    def test_the_page_runs_no_script_but_its_own(self):
        self.open()
        self.run_script("""
          document.body.insertAdjacentHTML('beforeend', '<img src="data:," onerror="window.__hit = 1">');
          const script = document.createElement('script');
          script.textContent = 'window.__hit = 2';
          document.body.append(script);""")
        refused = []
        deadline = time.monotonic() + LIMIT_IN_SECONDS
        # At least one for each of the two.
        while sum("Content Security Policy" in message for message in refused) < 2 and time.monotonic() < deadline:
            time.sleep(0.02)
            refused += [entry["message"] for entry in self.browser.get_log("browser")]
        self.assertGreaterEqual(sum("Content Security Policy" in message for message in refused), 2, refused)
        self.assertIsNone(self.run_script("return window.__hit ?? null"))


class Looks(BrowserTest):
    def test_all_texts_stand_out_in_light_and_in_dark(self):
        grounds = set()
        for scheme in ("light", "dark"):
            self.open(scheme=scheme, started=scan_started(notes=["a note"]))
            self.open_all()
            looked, poor = self.run_script(POOR_CONTRAST)
            self.assertEqual(poor, [])
            self.assertGreater(looked, 300)
            grounds.add(self.run_script("return getComputedStyle(document.body).backgroundColor"))
        self.assertEqual(len(grounds), 2)

    def test_a_phone_scrolls_in_one_direction_only(self):
        self.open(width=NARROW)
        for _ in range(2):
            self.assertEqual(self.run_script("return document.scrollingElement.scrollWidth"), NARROW)
            beyond = self.run_script("return [...document.querySelectorAll('body *')].filter((one) => "
                                     "one.getBoundingClientRect().right > innerWidth + 1 && !one.closest('svg'))"
                                     ".map((one) => one.outerHTML.slice(0, 80))")
            self.assertEqual(beyond, [])
            self.open_all()

    def test_a_long_folder_is_to_be_seen_to_its_end(self):
        folder = "/builds" + "/a-folder-with-a-long-name" * 6
        for width in (WIDE, NARROW):
            with self.subTest(width=width):
                self.open([plugin_ended(f"{folder}/release/a.so"), plugin_ended("/lib/a.so")], width=width)
                cut = self.run_script("return [...document.querySelectorAll('.row > td')].filter((cell) => "
                                      "cell.scrollWidth > cell.clientWidth || "
                                      "cell.scrollHeight > cell.clientHeight + 1).map((cell) => cell.textContent)")
                self.assertEqual(cut, [])

    def test_assistive_technology_finds_a_table_and_a_name_for_each_control(self):
        self.open()
        # The rows are there when they have been drawn.
        deadline = time.monotonic() + LIMIT_IN_SECONDS
        by_role = {}
        while len(by_role.get("row", [])) < 1 + 2 * len(ORDER) and time.monotonic() < deadline:
            by_role = {}
            for node in self.devtools("Accessibility.getFullAXTree")["nodes"]:
                if not node["ignored"]:
                    by_role.setdefault(node["role"]["value"], []).append(node.get("name", {}).get("value", ""))
        self.assertEqual(by_role["table"], ["Results, failures first"])
        self.assertEqual(by_role["columnheader"], ["Verdict", "Plug-in", "Cause", "Step", "Time", "Change"])
        self.assertEqual(by_role["searchbox"], ["Filter"])
        self.assertEqual(len(by_role["row"]), 1 + 2 * len(ORDER))
        triangles = by_role["DisclosureTriangle"]
        self.assertIn("Details of a9.so", triangles)
        for role in ("button", "DisclosureTriangle", "searchbox"):
            self.assertNotIn("", by_role[role], role)
        self.assertEqual(self.run_script("return document.documentElement.lang"), "en")


def main():
    global SCAN, PLUGINS
    parser = argparse.ArgumentParser(description=__doc__, formatter_class=argparse.RawDescriptionHelpFormatter)
    parser.add_argument("--scan", required=True, type=pathlib.Path)
    parser.add_argument("--plugins", required=True, type=pathlib.Path)
    options, rest = parser.parse_known_args()
    SCAN, PLUGINS = options.scan.resolve(), options.plugins.resolve()
    if rest and set(rest) <= {"File", "Program"}:
        unittest.main(argv=[sys.argv[0], *rest])
    missing = [name for name in ("chromium", "chromedriver") if not shutil.which(name)]
    if webdriver is None:
        missing.append("selenium")
    if missing:
        print("there is no " + " and no ".join(missing))
        sys.exit(1 if os.environ.get("VSTTORTURE_BROWSER") == "required" else NOTHING_TO_LOOK_WITH)
    unittest.main(argv=[sys.argv[0], *rest])


if __name__ == "__main__":
    main()
