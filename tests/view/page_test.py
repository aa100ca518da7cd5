#!/usr/bin/python3
"""Opens the pages of morvane-view in headless Chromium.
usage: page_test.py MORVANE-VIEW SIMHOST [unittest arguments]"""

import json
import sys
import tempfile
import unittest
from pathlib import Path

from selenium import webdriver
from selenium.webdriver.chrome.service import Service

import make_log
from support import host_log, hosts, lab_log, lab_stages, memories, report, run

SIMHOST = Path(sys.argv[2]).resolve()


def listed(document):
    """The targets and the LUNs that a report names: those of the trees, the host itself as the target of its direct
    disks, an adapter as the target of the LUNs that its tree leaves out; a LUN without an identifier by its device."""
    fc, iscsi, direct = document["fc"], document["iscsi"]["paths"], document["direct"]["devices"]
    unlisted = [(adapter["name"], lun) for adapter in fc["adapters"] for lun in adapter["unlisted"]]
    targets = {path["targetPort"] for path in fc["paths"]} | {name for name, _ in unlisted} | \
        {(path["targetIqn"], path["targetAddress"]) for path in iscsi} | {"the host" for _ in direct}
    seen = fc["paths"] + [lun for _, lun in unlisted] + iscsi + direct
    luns = {("device", lun["device"]) if lun["identifier"] is None or lun["identifierKind"] == "host-name"
            else ("identifier", lun["identifier"]) for lun in seen}
    return targets, luns


class Page(unittest.TestCase):
    @classmethod
    def setUpClass(cls):
        options = webdriver.ChromeOptions()
        for flag in ("--headless --no-sandbox --disable-gpu --disable-dev-shm-usage --disable-quic --no-first-run "
                     "--disable-background-networking --disable-component-update --disable-sync "
                     "--window-size=1400,1800").split():
            options.add_argument(flag)
        options.set_capability("goog:loggingPrefs", {"browser": "ALL"})
        cls.browser = webdriver.Chrome(service=Service("/usr/bin/chromedriver"), options=options)
        cls.addClassCleanup(cls.browser.quit)
        cls.folder = tempfile.TemporaryDirectory()
        cls.addClassCleanup(cls.folder.cleanup)

    def open(self, log, *command, status=0):
        page = Path(self.folder.name, "page.html")
        self.assertEqual(run(*command, "--html", page, "-", log=log).returncode, status)
        self.browser.get(page.as_uri())
        self.assertEqual(self.browser.get_log("browser"), [])
        return report(log)

    def check_picture(self, document):
        targets, luns = listed(document)
        self.assertEqual(self.count("#picture .target"), len(targets))
        self.assertEqual(self.count("#picture .lun[data-n]"), len(luns))

    def count(self, selector):
        return self.browser.execute_script("return document.querySelectorAll(arguments[0]).length", selector)

    def test_the_picture_shows_every_target_and_lun_and_the_search_every_path(self):
        for log in (make_log.healthy().bytes(), make_log.big(10000).bytes()):
            document = self.open(log)
            self.check_picture(document)
            lun = document["luns"][0]
            field = self.browser.find_element("id", "search")
            field.send_keys(lun["identifier"] + "\n")
            self.assertEqual(self.count("#paths tr.hit"), lun["pathCount"])
            self.assertEqual(self.count("#picture .lun.hit"), 1)
            self.assertEqual(self.browser.find_element("css selector", "#picture .lun.hit").value_of_css_property("opacity"), "1")
            self.assertEqual(self.count("#picture .target.hit"), lun["pathCount"])
            self.assertEqual(self.browser.get_log("browser"), [])

    def test_the_picture_of_every_simulated_host_and_run_of_the_laboratory_is_whole(self):
        for name, log in [(host, host_log(host)) for host in hosts()] + [(stage, lab_log(stage)) for stage in lab_stages()]:
            with self.subTest(name):
                self.check_picture(self.open(log))

    def test_the_view_of_several_hosts_draws_each_host_and_joins_their_luns(self):
        with tempfile.TemporaryDirectory() as folder:
            logs = [Path(folder, name) for name in ("alpha", "beta")]
            for log in logs:
                log.write_bytes(make_log.healthy(log.name).bytes())
            page = Path(folder, "san.html")
            self.assertEqual(run("san", "--html", page, *logs).returncode, 0)
            self.browser.get(page.as_uri())
        self.assertEqual(self.browser.get_log("browser"), [])
        self.assertEqual((self.count("#picture .host"), self.count("#hosts tbody tr")), (2, 2))
        targets, luns = listed(report(make_log.healthy().bytes()))
        own = 1  # the direct disk and the way to it are each host's own
        self.assertEqual(self.count("#picture .target"), len(targets) + own)
        self.assertEqual(self.count("#picture .lun[data-n]"), len(luns) + own)

    def test_the_search_finds_a_lun_by_what_other_programs_call_it(self):
        document = self.open(host_log("demo"))
        names = document["luns"][0]["names"]
        for name in {names["multipath"], names["kernel"], names["scsiId"], names["sg3Rules"], *names["links"]}:
            self.browser.execute_script(
                "const field = document.getElementById('search'); field.value = arguments[0];"
                "field.form.requestSubmit()", name)
            self.assertEqual(self.count("#luns tbody tr:not([hidden])"), 1, name)
            self.assertIn(document["luns"][0]["identifier"], self.browser.execute_script(
                "return document.querySelector('#luns tbody tr:not([hidden])').textContent"))
        self.assertEqual(self.browser.get_log("browser"), [])

    def test_what_differs_from_the_kernels_memory_stands_above_the_problems_with_its_paths(self):
        log = host_log("remembered")
        for name, root in memories(SIMHOST, "remembered", Path(self.folder.name, "memories")).items():
            with self.subTest(name):
                compared = json.loads(run("verify", "--json", "--root", root, "-", log=log).stdout)
                findings = compared["findings"]
                self.check_picture(self.open(log, "verify", "--root", root, status=1 if findings else 0))
                shown = self.browser.execute_script(
                    "const shown = [];"
                    "for (let e = document.getElementById('verify').nextElementSibling; e.tagName !== 'H2';"
                    "     e = e.nextElementSibling) {"
                    "  shown.push({ meaning: e.querySelector('b')?.textContent ?? e.textContent,"
                    "               devices: [...e.querySelectorAll('button')].map((b) => b.textContent) });"
                    "} return shown")
                self.assertEqual(shown, [{"meaning": finding["meaning"], "devices": [path["device"] for path in finding["paths"]]}
                                         for finding in findings] or [{"meaning": "Everything agrees.", "devices": []}])
                if name == "devices-differ":  # the log has no path of the first
                    continue
                for button in self.browser.find_elements("css selector", "#verify + div button")[:1]:
                    button.click()
                    self.assertIn(button.text, self.browser.find_element("id", "paths").text)
                    self.assertIn(button.text, self.browser.execute_script(
                        "return [...document.querySelectorAll('#paths tr.hit')].map((row) => row.cells[0].textContent)"))
        self.assertEqual(self.browser.get_log("browser"), [])

    def test_paper_shows_the_whole_picture_and_nothing_to_type_into(self):
        self.open(make_log.big(10000).bytes())
        self.browser.execute_cdp_cmd("Emulation.setEmulatedMedia", {"media": "print"})
        self.addCleanup(self.browser.execute_cdp_cmd, "Emulation.setEmulatedMedia", {"media": ""})
        self.assertFalse(self.browser.find_element("id", "search").is_displayed())
        picture = self.browser.find_element("id", "picture")
        self.assertEqual(picture.get_property("scrollHeight"), picture.get_property("clientHeight"))

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
    unittest.main(argv=[sys.argv[0], *sys.argv[3:]])
