#!/usr/bin/python3
"""Runs morvane-view on logs and checks what it says. usage: program_test.py MORVANE-VIEW [unittest arguments]"""

import json
import os
import re
import subprocess
import sys
import tempfile
import unittest
from pathlib import Path

import jsonschema

import make_log

HERE = Path(__file__).resolve().parent
ROOT = HERE.parents[1]
HOSTS = ROOT / "tests" / "hosts"
SCHEMA = json.loads((ROOT / "view" / "morvane-log.schema.json").read_text())
PROGRAM = sys.argv[1]


def run(*arguments, log=b""):
    return subprocess.run([PROGRAM, *map(str, arguments)], input=log, capture_output=True, check=False)


def report(log):
    done = run("--json", "-", log=log)
    document = json.loads(done.stdout)
    jsonschema.validate(document, SCHEMA)
    return document


def host_log(host):
    """A simulated host's expected log with values where the comparison of logs leaves them open."""
    log = (HOSTS / host / "expected.log").read_bytes()
    log = re.sub(rb" Line #$", b" Line 1", log, flags=re.M)
    for mark, value in ((b"<times>", b"1.00, 2.00, 3.00, 4.00"), (b"<time>", b"1.50"), (b"0x<address>", b"0x55d0"),
                        (b"<address>", b"0x55d0")):
        log = log.replace(mark, value)
    return log


class Hosts(unittest.TestCase):
    def test_every_text_of_every_simulated_host_is_known(self):
        hosts = sorted(path.parent.name for path in HOSTS.glob("*/expected.log"))
        self.assertGreater(len(hosts), 0)
        for host in hosts:
            with self.subTest(host=host):
                log = host_log(host)
                facts = report(log)["log"]
                ended = b"\t\t\t   END \n" in log  # a failed assertion ends the program before
                self.assertEqual((facts["unknown"]["samples"], facts["complete"], facts["runs"]), ([], ended, 1))

    def test_a_report_line_is_a_path_or_a_device_and_nothing_is_lost(self):
        for path in sorted(HOSTS.glob("*/expected.log")):
            with self.subTest(host=path.parent.name):
                log = host_log(path.parent.name)
                document = report(log)
                listed = [m for m in re.findall(rb"^\|  \|  \|  \|_ lun name (\S*) luid ", log, re.M) if m]
                self.assertLessEqual(len(document["fc"]["paths"]), len(listed))
                self.assertEqual(len(document["iscsi"]["paths"]), len(re.findall(rb"\|_ Device_Name: ", log)))
                self.assertEqual(len(document["direct"]["devices"]),
                                 len(re.findall(rb"^--------> Device Name: \|.*\| LunId: \|.*\|$", log, re.M)))
                self.assertEqual(len(document["logical"]["devices"]),
                                 len(re.findall(rb"^--------> Device Name: \|.*\| LunId: \|.*\| $", log, re.M)))


class Report(unittest.TestCase):
    def test_a_healthy_host_has_no_problem_and_counts_paths_by_lun(self):
        document = report(make_log.healthy().bytes())
        self.assertEqual([p for p in document["problems"] if p["severity"] == "problem"], [])
        self.assertEqual([(lun["pathCount"], lun["unique"]) for lun in document["luns"]], [(4, True)] * 3 + [(1, True)])
        self.assertEqual(document["host"], "hosta")

    def test_each_trouble_is_named_with_its_cause(self):
        document = report(make_log.troubled().bytes())
        self.assertEqual([(p["kind"], p["subject"]) for p in document["problems"] if p["severity"] == "problem"], [
            ("lun-unnamed", "LUN 1"),
            ("lun-dropped", "/dev/sdc"),
            ("lun-dropped", "/dev/sde (LUN 4 of target 52:00:00:00:00:00:00:01)"),
            ("lun-left-out", "/dev/sdd"),
            ("lun-left-out", "/dev/sdf"),
            ("adapter-failed", "acme-a8-1"),
            ("adapter-failed", "acme-a8-4"),
            ("device-ignored", "/dev/sdk"),
            ("inquiry-failed", "/dev/sdj (LUN 0 of iqn.2003-01.org.example:disk1)"),
            ("device-unsupported", "/dev/sdz"),
            ("tree-ended", "LOGICAL"),
            ("identifier-not-unique", "ACME:BOX:1.0:x"),
            ("identifier-not-unique", "0" * 32),
        ])
        causes = {p["subject"]: p["cause"] for p in document["problems"]}
        self.assertEqual(causes["/dev/sdc"], "dropped: reading page 0x83 timed out")
        self.assertEqual(causes["/dev/sr0"],
                         "not reported: its device type is neither disk nor storage array controller")

    def test_bytes_that_are_no_text_are_escaped(self):
        text = run("-", log=make_log.troubled().bytes()).stdout
        self.assertNotIn(b"\x1b", text)
        self.assertIn(rb"naa\x1B[31m\xE9\\5000C500", text)

    def test_a_cut_log_is_read_up_to_the_cut_wherever_it_is(self):
        log = make_log.troubled().bytes()
        for end in range(100, log.index(b"\t\t\t   END "), 97):
            with self.subTest(end=end):
                document = report(log[:end])
                self.assertEqual(document["log"]["complete"], False)
                self.assertIn("log-cut", [p["kind"] for p in document["problems"]])

    def test_unknown_lines_are_counted_and_named(self):
        log = make_log.healthy().bytes().replace(b"Number of adapters: 2\n", b"Number of adapters: 2\nwhat is this\n")
        done = run("--json", "-", log=log)
        self.assertEqual(json.loads(done.stdout)["log"]["unknown"]["count"], 1)
        self.assertIn(b"1 piece is none of Morvane's texts:", done.stderr)
        self.assertIn(b": what is this\n", done.stderr)

    def test_of_two_runs_the_last_is_reported_and_leftovers_are_not(self):
        old, new = make_log.troubled("old").bytes(), make_log.healthy("new").bytes()
        document = report(old + new)
        self.assertEqual((document["host"], document["log"]["runs"], len(document["luns"])), ("new", 2, 4))
        document = report(new + old[len(old) // 2:])
        self.assertEqual((document["host"], document["log"]["runs"], len(document["luns"])), ("new", 1, 4))
        self.assertGreater(document["log"]["leftoverTexts"], 0)


class Diff(unittest.TestCase):
    def compare(self, before, after):
        with tempfile.TemporaryDirectory() as folder:
            old, new = Path(folder, "old"), Path(folder, "new")
            old.write_bytes(before)
            new.write_bytes(after)
            done = run("diff", "--json", old, new)
        document = json.loads(done.stdout)
        jsonschema.validate(document, SCHEMA)
        return done.returncode, document

    def test_a_renamed_device_is_no_difference(self):
        status, document = self.compare(make_log.healthy().bytes(), make_log.healthy(first_disk=30).bytes())
        self.assertEqual((status, document["same"]), (0, True))

    def test_another_lun_behind_the_same_place_is_dangerous(self):
        before = make_log.healthy().bytes()
        other = b"600A0B80000000000000000000000999"
        after = before.replace(b"600A0B80000000000000000000000001", other)
        status, document = self.compare(before, after)
        self.assertEqual(status, 1)
        self.assertEqual({(c["before"], c["after"], c["dangerous"]) for c in document["identityChanges"]},
                         {("600A0B80000000000000000000000001", other.decode(), True)})
        self.assertEqual((len(document["identityChanges"]), document["lostPaths"]), (4, []))

    def test_a_lost_adapter_shows_as_lost_paths_and_smaller_counts(self):
        before = make_log.healthy().bytes()
        start = before.index(b"Going to open Adapter #1")
        end = before.index(b"Time values", start)
        status, document = self.compare(before, before[:start] + before[end:])
        self.assertEqual((status, len(document["lostPaths"]), document["newPaths"]), (1, 6, []))
        self.assertEqual([(c["before"], c["after"]) for c in document["pathCounts"]], [(4, 2)] * 3)


class San(unittest.TestCase):
    def test_luns_are_joined_over_hosts(self):
        with tempfile.TemporaryDirectory() as folder:
            logs = []
            for host in ("alpha", "beta"):
                logs.append(Path(folder, host))
                logs[-1].write_bytes(make_log.healthy(host).bytes())
            logs.append(Path(folder, "gamma"))
            logs[-1].write_bytes(make_log.troubled("gamma").bytes())
            done = run("san", "--json", *logs)
        document = json.loads(done.stdout)
        jsonschema.validate(document, SCHEMA)
        seen = {lun["identifier"]: lun for lun in document["luns"]}
        self.assertEqual(seen["600A0B80000000000000000000000001"]["hosts"],
                         [{"host": "alpha", "pathCount": 4}, {"host": "beta", "pathCount": 4}])
        self.assertEqual(seen["600601604B2A1E00AAAAAAAAAAAAAA01"]["hosts"], [{"host": "gamma", "pathCount": 1}])
        self.assertEqual([i for i, lun in seen.items() if lun["notUnique"]], ["0" * 32, "ACME:BOX:1.0:x"])


class Errors(unittest.TestCase):
    def test_each_is_one_clear_line_and_status_2(self):
        for log, words in ((b"", b"the log is empty"), (b"hello\nworld\n", b"is not a Morvane log")):
            done = run("-", log=log)
            self.assertEqual((done.returncode, done.stderr, done.stdout), (2, b"morvane-view: -: " + words + b"\n", b""))
        done = run("/nonexistent/log")
        self.assertEqual((done.returncode, done.stderr),
                         (2, b"morvane-view: /nonexistent/log: No such file or directory\n"))
        self.assertEqual(run("diff", "/nonexistent/a", "/nonexistent/b").returncode, 2)
        self.assertEqual(run("--nonsense").returncode, 2)


class Page(unittest.TestCase):
    """Opens pages in headless Chromium."""

    @classmethod
    def setUpClass(cls):
        from selenium import webdriver
        from selenium.webdriver.chrome.service import Service
        options = webdriver.ChromeOptions()
        for flag in ("--headless --no-sandbox --disable-gpu --disable-quic --no-first-run "
                     "--disable-background-networking --disable-component-update --disable-sync "
                     "--window-size=1400,1800").split():
            options.add_argument(flag)
        options.set_capability("goog:loggingPrefs", {"browser": "ALL"})
        cls.browser = webdriver.Chrome(service=Service("/usr/bin/chromedriver"), options=options)
        cls.addClassCleanup(cls.browser.quit)
        cls.folder = tempfile.TemporaryDirectory()
        cls.addClassCleanup(cls.folder.cleanup)

    def open(self, log):
        page = Path(self.folder.name, "page.html")
        self.assertEqual(run("--html", page, "-", log=log).returncode, 0)
        self.browser.get(page.as_uri())
        self.assertEqual(self.browser.get_log("browser"), [])
        return report(log)

    def count(self, selector):
        return self.browser.execute_script("return document.querySelectorAll(arguments[0]).length", selector)

    def test_the_picture_shows_every_target_and_lun_and_the_search_every_path(self):
        for log in (make_log.healthy().bytes(), make_log.big(10000).bytes()):
            document = self.open(log)
            targets = {p["targetPort"] for p in document["fc"]["paths"]} | \
                {(p["targetIqn"], p["targetAddress"]) for p in document["iscsi"]["paths"]}
            self.assertEqual(self.count("#picture .target"), len(targets) + 1)  # and the host's own disk
            self.assertEqual(self.count("#picture .lun[data-n]"), len(document["luns"]) + 1)
            lun = document["luns"][0]
            field = self.browser.find_element("id", "search")
            field.send_keys(lun["identifier"] + "\n")
            self.assertEqual(self.count("#paths tr.hit"), lun["pathCount"])
            self.assertEqual(self.count("#picture .lun.hit"), 1)
            self.assertEqual(self.count("#picture .target.hit"), lun["pathCount"])
            self.assertEqual(self.browser.get_log("browser"), [])

    def test_texts_from_devices_cannot_become_markup(self):
        log = make_log.healthy().bytes().replace(b"600A0B80000000000000000000000001", b"<img src=x></script>")
        self.open(log)
        self.assertEqual(self.count("img"), 0)
        self.assertIn("<img src=x></script>", self.browser.find_element("id", "luns").text)

    def test_keys_reach_the_search_and_move_in_the_picture(self):
        self.open(make_log.healthy().bytes())
        focused = "return document.activeElement.getAttribute('aria-label') || document.activeElement.id"
        self.browser.find_element("tag name", "body").send_keys("/")
        self.assertEqual(self.browser.execute_script(focused), "search")
        self.browser.execute_script("document.querySelector('#picture [tabindex=\"0\"]').focus()")
        self.assertEqual(self.browser.execute_script(focused), "host hosta")
        self.browser.switch_to.active_element.send_keys("\ue014")  # arrow right
        self.assertTrue(self.browser.execute_script(focused).startswith("initiator "))


if __name__ == "__main__":
    os.environ["NO_COLOR"] = "1"
    unittest.main(argv=[sys.argv[0], *sys.argv[2:]])
