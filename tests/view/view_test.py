"""What morvane-view says of Morvane's logs: view_test.py SIMHOST MORVANE MORVANE_VIEW TESTS

Each host of GOLDEN runs Morvane anew; the whole text that morvane-view makes of the log is compared with
TESTS/view/golden/HOST.txt. With MORVANE_ACCEPT set in the environment the texts are written instead; review them.
"""

import difflib
import json
import os
import pathlib
import subprocess
import sys
import tempfile
import unittest

SIMHOST, MORVANE, VIEW, TESTS = (pathlib.Path(argument).resolve() for argument in sys.argv[1:5])
GOLDEN = ["demo", "das-odd-entries", "das-time-out", "fc-adapter-errors", "fc-lun-errors", "fc-mapping-fails",
          "fc-nameless-middle", "fc-powerpath", "iscsi-two-interfaces", "lab-fc", "lab-iscsi", "lab-direct"]


def log_of(host, folder):
    """Runs Morvane on a simulated host in `folder`; the path of its log."""
    folder.mkdir(parents=True, exist_ok=True)
    subprocess.run([SIMHOST, TESTS / "hosts" / host / "host.toml", "--", MORVANE], cwd=folder, check=True,
                   stdout=subprocess.DEVNULL, stderr=subprocess.DEVNULL, timeout=60)
    return folder / "MorvaneLogs" / "Morvane.log"


def view(*arguments, folder=None, text=True):
    return subprocess.run([VIEW, *arguments], cwd=folder, capture_output=True, text=text, timeout=60)


class MorvaneView(unittest.TestCase):
    def setUp(self):
        scratch = tempfile.TemporaryDirectory()
        self.addCleanup(scratch.cleanup)
        self.scratch = pathlib.Path(scratch.name)

    def test_shows_the_report_of_each_host_as_expected(self):
        for host in GOLDEN:
            with self.subTest(host):
                folder = self.scratch / host
                log_of(host, folder)
                shown = view(folder=folder)
                self.assertEqual((shown.returncode, shown.stderr), (0, ""))
                golden = TESTS / "view" / "golden" / f"{host}.txt"
                if os.environ.get("MORVANE_ACCEPT"):
                    golden.write_text(shown.stdout)
                expected = golden.read_text()
                self.assertTrue(shown.stdout == expected,
                                "".join(difflib.unified_diff(expected.splitlines(True), shown.stdout.splitlines(True))))

    def test_knows_every_line_of_every_simulated_host(self):
        for description in sorted((TESTS / "hosts").glob("*/host.toml")):
            host = description.parent.name
            if host == "powerpath-no-equals-sign":  # ends in an assertion
                continue
            with self.subTest(host):
                model = json.loads(view("--json", log_of(host, self.scratch / host)).stdout)
                self.assertEqual(model["log"]["unknown"]["count"], 0, model["log"]["unknown"]["samples"])
                self.assertTrue(model["log"]["complete"])

    def test_finds_no_difference_between_two_runs_on_one_host(self):
        logs = [log_of("demo", self.scratch / run) for run in ("first", "second")]
        self.assertEqual(view("diff", *logs).returncode, 0)

    def test_finds_what_differs_between_two_hosts(self):
        self.assertEqual(view("diff", log_of("lab-fc", self.scratch / "old"), log_of("demo", self.scratch / "new"))
                         .returncode, 1)

    def test_says_what_is_wrong_with_a_log_that_is_not_there(self):
        shown = view("no-such-log", folder=self.scratch)
        self.assertEqual((shown.returncode, shown.stdout), (2, ""))
        self.assertIn("no-such-log", shown.stderr)

    def test_reads_a_log_that_is_cut_anywhere_and_says_that_it_is(self):
        log = log_of("fc-powerpath", self.scratch / "whole").read_bytes()
        cut = self.scratch / "cut.log"
        for size in range(400, len(log) - 200, 997):
            with self.subTest(size):
                cut.write_bytes(log[:size])
                shown = view("--json", cut)
                self.assertEqual(shown.returncode, 0, shown.stderr)
                self.assertFalse(json.loads(shown.stdout)["log"]["complete"])

    def test_shows_bytes_that_are_no_text_escaped(self):
        log = log_of("das-naa", self.scratch / "whole").read_bytes()
        self.assertIn(b"|/dev/sda|", log)
        odd = self.scratch / "odd.log"
        odd.write_bytes(log.replace(b"|/dev/sda|", b"|/dev/s\x1b[2J\xff|"))
        shown = view(odd, text=False)
        self.assertEqual(shown.returncode, 0)
        self.assertFalse(any(byte < 0x20 and byte != 0x0A for byte in shown.stdout), shown.stdout)


if __name__ == "__main__":
    unittest.main(argv=sys.argv[:1])
