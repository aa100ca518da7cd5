#!/usr/bin/python3
"""What morvane-view says of the log of every simulated host and of every run kept from the laboratory, as a whole:
text, JSON, page, differences and the view of all of them together. usage: golden_test.py MORVANE-VIEW [unittest arguments]

With MORVANE_ACCEPT set in the environment the files in golden/ are written instead of compared; review them.
"""

import difflib
import json
import os
import sys
import tempfile
import unittest
from html.parser import HTMLParser
from pathlib import Path

from support import HERE, host_log, hosts, is_whole, lab_log, lab_stages, run, valid

GOLDEN = HERE / "golden"


class Page(HTMLParser):
    """The parts of a page that a browser would act on."""

    def __init__(self, text):
        super().__init__()
        self.headings, self.ids, self.references, self.document = [], [], [], None
        self._open = None
        self.feed(text)
        self.close()

    def handle_starttag(self, tag, attributes):
        self._open = (tag, dict(attributes))
        self.ids += [value for name, value in attributes if name == "id"]
        self.references += [value for name, value in attributes if name in ("src", "href", "action", "data")]

    def handle_endtag(self, tag):
        self._open = None

    def handle_data(self, data):
        tag, attributes = self._open or (None, {})
        if tag in ("title", "h1", "h2"):
            self.headings.append((tag, data))
        if tag == "script" and attributes.get("type") == "application/json":
            self.document = json.loads(data)


class Golden(unittest.TestCase):
    maxDiff = None

    def setUp(self):
        scratch = tempfile.TemporaryDirectory()
        self.addCleanup(scratch.cleanup)
        self.folder = Path(scratch.name)

    def write(self, name, log):
        """Puts a log where the next run of the program finds it by its name alone."""
        (self.folder / name).write_bytes(log)
        return name

    def shown(self, *arguments, status=0):
        done = run(*arguments, folder=self.folder)
        self.assertEqual(done.returncode, status, done.stderr)
        return done

    def check(self, name, text):
        golden = GOLDEN / name
        if os.environ.get("MORVANE_ACCEPT"):
            golden.parent.mkdir(parents=True, exist_ok=True)
            golden.write_text(text)
        expected = golden.read_text()
        self.assertTrue(text == expected, name + "\n" + "".join(
            difflib.unified_diff(expected.splitlines(True), text.splitlines(True))))

    def check_report(self, golden, name):
        """The text, the JSON and the page of one log."""
        self.check(f"{golden}.txt", self.shown(name).stdout.decode())
        document = self.shown("--json", name).stdout.decode()
        self.check(f"{golden}.json", document)
        report = valid(document)
        self.assertEqual(report["log"]["unknown"], {"count": 0, "samples": []})
        self.check_page(["--html", "page.html", name], "Storage paths of " + (report["host"] or "an unnamed host"),
                        [report], None)

    def check_page(self, arguments, title, reports, san):
        self.shown(*arguments)
        page = Page((self.folder / "page.html").read_text())
        self.assertEqual(page.document["title"], title)
        self.assertEqual([report["report"] for report in page.document["reports"]], reports)
        self.assertEqual(page.document["san"], san)
        self.assertEqual([reference for reference in page.references if not reference.startswith(("#", "data:"))], [])
        self.check("page.json", json.dumps({"headings": page.headings, "ids": page.ids}, indent=1) + "\n")

    def check_diff(self, golden, old, new):
        done = run("diff", "--json", old, new, folder=self.folder)
        self.check(f"{golden}.diff.json", done.stdout.decode())
        status = 0 if valid(done.stdout)["same"] else 1
        self.assertEqual((done.returncode, done.stderr), (status, b""))
        self.check(f"{golden}.diff.txt", self.shown("diff", old, new, status=status).stdout.decode())
        self.assertTrue(valid(self.shown("diff", "--json", new, new).stdout)["same"])

    def check_san(self, golden, names):
        self.check(f"{golden}.txt", self.shown("san", *names).stdout.decode())
        document = self.shown("san", "--json", *names).stdout.decode()
        self.check(f"{golden}.json", document)
        reports = [valid(self.shown("--json", name).stdout) for name in names]
        self.check_page(["san", "--html", "page.html", *names], f"SAN view of {len(names)} logs", reports, valid(document))

    def test_every_simulated_host(self):
        empty = self.write("empty.log", host_log("empty"))
        for host in hosts():
            with self.subTest(host):
                name = self.write(f"{host}.log", host_log(host))
                self.check_report(f"hosts/{host}", name)
                self.check_diff(f"hosts/{host}", empty, name)

    def test_every_run_of_the_laboratory(self):
        healthy = self.write("healthy.log", lab_log("healthy"))
        for stage in lab_stages():
            with self.subTest(stage):
                name = self.write(f"{stage}.log", lab_log(stage))
                self.check_report(f"lab/{stage}", name)
                self.check_diff(f"lab/{stage}", healthy, name)

    def test_all_simulated_hosts_and_all_runs_of_the_laboratory_together(self):
        self.check_san("hosts-san", [self.write(f"{host}.log", host_log(host)) for host in hosts()])
        self.check_san("lab-san", [self.write(f"{stage}.log", lab_log(stage)) for stage in lab_stages()])

    def test_every_golden_file_belongs_to_a_log(self):
        known = {f"hosts/{host}" for host in hosts()} | {f"lab/{stage}" for stage in lab_stages()} | \
            {"hosts-san", "lab-san", "page"}
        files = [path.relative_to(GOLDEN) for path in GOLDEN.rglob("*") if path.is_file()]
        self.assertEqual({str(file.parent / file.name.split(".")[0]) for file in files} - known, set())

    def test_only_an_assertion_leaves_a_log_without_its_end(self):
        self.assertEqual([host for host in hosts() if not is_whole(host_log(host))], ["powerpath-no-equals-sign"])


if __name__ == "__main__":
    unittest.main(argv=[sys.argv[0], *sys.argv[2:]])
