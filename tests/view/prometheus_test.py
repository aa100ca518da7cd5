#!/usr/bin/python3
"""The metrics that morvane-view --prometheus writes, and how it writes them. usage: prometheus_test.py MORVANE-VIEW

With MORVANE_ACCEPT set in the environment the files golden/*/*.prom are written instead of compared; review them.
"""

import os
import re
import subprocess
import sys
import tempfile
import unittest
from pathlib import Path

import make_log
from support import HERE, PROGRAM, host_log, hosts, lab_log, lab_stages, run

LAST_WRITTEN = 1795244600  # of the laboratory's logs, some seconds before
SAMPLE = re.compile(r'(\w+)(?:\{(\w+="(?:[^"\\\n]|\\[\\n"])*"(?:,\w+="(?:[^"\\\n]|\\[\\n"])*")*)\})? (\d+)')


class Metrics(unittest.TestCase):
    maxDiff = None

    def setUp(self):
        scratch = tempfile.TemporaryDirectory()
        self.addCleanup(scratch.cleanup)
        self.folder = Path(scratch.name)
        self.file = self.folder / "morvane.prom"

    def metrics(self, log):
        """The metrics of a log, read as UTF-8."""
        (self.folder / "log").write_bytes(log)
        os.utime(self.folder / "log", (LAST_WRITTEN, LAST_WRITTEN))
        done = run("--prometheus", "morvane.prom", "log", folder=self.folder)
        self.assertEqual((done.returncode, done.stdout), (0, b""), done.stderr)
        return self.file.read_text(encoding="utf-8")

    def samples(self, log):
        """The values by name and labels; fails when a line is none or a series is there twice."""
        values = {}
        for line in self.metrics(log).splitlines():
            if not line.startswith("#"):
                sample = SAMPLE.fullmatch(line)
                self.assertIsNotNone(sample, line)
                self.assertNotIn(sample.group(1, 2), values)
                values[sample.group(1, 2)] = int(sample[3])
        return values

    def of_kind(self, log, name):
        return {labels: value for (metric, labels), value in self.samples(log).items() if metric == name}


class Content(Metrics):
    def test_is_the_one_expected(self):
        for place, log in ([("hosts/" + host, host_log(host)) for host in
                            ("demo", "empty", "fc-names", "fc-all-nameless", "iscsi-two-interfaces", "das-designators",
                             "powerpath-no-equals-sign")] +
                           [("lab/" + stage, lab_log(stage)) for stage in ("healthy", "lun-without-identifier")]):
            with self.subTest(place):
                golden = HERE / "golden" / f"{place}.prom"
                text = self.metrics(log)
                if os.environ.get("MORVANE_ACCEPT"):
                    golden.write_text(text)
                self.assertEqual(text, golden.read_text())

    def test_is_well_formed_whatever_the_log(self):
        for log in [host_log(host) for host in hosts()] + [lab_log(stage) for stage in lab_stages()] + [
                make_log.troubled().bytes(), make_log.big(500).bytes(), make_log.healthy().bytes()[:-3000]]:
            lines = self.metrics(log).splitlines()
            self.assertEqual(lines[-1], "# EOF")
            described = [line.split()[2] for line in lines if line.startswith("# HELP ")]
            self.assertEqual(described, [line.split()[2] for line in lines if line.startswith("# TYPE ")])
            self.assertEqual(described, list(dict.fromkeys(described)))
            self.assertEqual(list(dict.fromkeys(name for name, _ in self.samples(log))),
                             [name for name in described if any(line.startswith((name + " ", name + "{")) for line in lines)])

    def test_texts_of_devices_are_label_values(self):
        log = make_log.Log("hosta")
        log.multipath()
        luns = [make_log.fc_lun(f"/dev/sd{letter}", identifier, number, make_log.wwn(0x52, 1), vendor=vendor)
                for number, (letter, identifier, vendor) in enumerate(
                    (("b", 'a"b\\c}', 'V"\\'), ("c", "a\udce9\x01", "ÄB"), ("d", "a\\xE9\\x01", "{="), ("e", "a|b,c", "|")))]
        log.fc([{"name": "a", "wwnn": make_log.wwn(0x20, 1), "ports": ['10:"\udcff'], "luns": luns}])
        log.iscsi([], initiator=None)
        log.direct([])
        log.logical([])
        log.end()
        self.assertEqual(self.of_kind(log.bytes(), "morvane_lun_info"), {
            r'identifier="a\"b\\\\c}",vendor="V\"\\\\",product="ARRAY 9",pseudo_device="",uuid=""': 1,
            r'identifier="a\\xE9\\x01",vendor="ÄB",product="ARRAY 9",pseudo_device="",uuid=""': 1,
            r'identifier="a\\\\xE9\\\\x01",vendor="{=",product="ARRAY 9",pseudo_device="",uuid=""': 1,
            r'identifier="a|b,c",vendor="|",product="ARRAY 9",pseudo_device="",uuid=""': 1})
        self.assertEqual(self.of_kind(log.bytes(), "morvane_fc_port_paths"), {r'port_name="10\"\\xFF"': 4})

    def test_a_log_without_its_end_says_so(self):
        log = make_log.healthy().bytes()
        for cut, complete in ((log, 1), (log[:-200], 0), (log[200:], 0)):
            self.assertEqual(self.of_kind(cut, "morvane_run_complete"), {None: complete})

    def test_times_are_those_that_log_and_file_tell(self):
        def times(log):
            return {name.removeprefix("morvane_run_"): value for (name, _), value in self.samples(log).items()
                    if name.endswith("_seconds")}

        log = lab_log("healthy")
        start = int(re.search(rb"Time values: (\d+)\.", log)[1])
        known = {"start_timestamp_seconds": start, "end_timestamp_seconds": LAST_WRITTEN}
        self.assertEqual(times(log), known | {"duration_seconds": LAST_WRITTEN - start})
        later = re.sub(rb"Time values: \d+\.", b"Time values: 1800000000.", log)
        self.assertEqual(times(later), known | {"start_timestamp_seconds": 1800000000})
        self.assertEqual(times(host_log("empty")), {"end_timestamp_seconds": LAST_WRITTEN})
        piped = run("--prometheus", "-", "-", log=log).stdout.decode()
        self.assertEqual(re.findall("^morvane_run_(.*_seconds) .*", piped, re.M), ["start_timestamp_seconds"])

    def test_a_lun_is_counted_once_for_each_disk(self):
        self.assertEqual(self.of_kind(make_log.healthy().bytes(), "morvane_lun_paths"), {
            **{f'identifier="600A0B8000000000000000000000000{lun}",transport="fc"': 4 for lun in range(3)},
            'identifier="60014050000000000000000000000001",transport="iscsi"': 1})
        self.assertEqual(self.of_kind(make_log.healthy().bytes(), "morvane_luns"), {None: 4})


class File(Metrics):
    def test_is_replaced_whole_and_readable_for_all(self):
        self.file.write_text("older metrics")
        self.file.chmod(0o644)
        self.metrics(make_log.healthy().bytes())
        self.assertTrue(self.file.read_text().endswith("# EOF\n"))
        self.assertEqual(self.file.stat().st_mode & 0o777, 0o644)
        self.assertEqual(sorted(path.name for path in self.folder.iterdir()), ["log", "morvane.prom"])

    def test_stays_as_it_was_when_there_is_nothing_to_tell(self):
        self.file.write_text("older metrics")
        for log, words in ((b"", "the log is empty"), (b"text\n", "is not a Morvane log")):
            done = run("--prometheus", self.file, "-", log=log)
            self.assertEqual((done.returncode, done.stdout, done.stderr.decode()), (2, b"", f"morvane-view: -: {words}\n"))
            self.assertEqual(self.file.read_text(), "older metrics")

    def test_is_no_log(self):
        log = self.folder / "Morvane.log"
        log.write_bytes(make_log.healthy().bytes())
        done = run("--prometheus", log, log)
        self.assertEqual((done.returncode, done.stdout, done.stderr.decode()), (
            2, b"", f"morvane-view: {log}: is a log that is to be read; name another file to write to\n"))
        self.assertEqual(log.read_bytes(), make_log.healthy().bytes())

    def test_that_cannot_be_written_is_said(self):
        log = make_log.healthy().bytes()
        for file, words in (("/nonexistent/x.prom", "No such file or directory"), ("/dev/full", "No space left on device")):
            done = run("--prometheus", file, "-", log=log)
            self.assertEqual((done.returncode, done.stdout, done.stderr.decode()), (2, b"", f"morvane-view: {file}: {words}\n"))
        with open("/dev/full", "wb") as full:
            done = subprocess.run([PROGRAM, "--prometheus", "-", "-"], input=log, stdout=full, stderr=subprocess.PIPE,
                                  check=False, timeout=60)
        self.assertEqual((done.returncode, done.stderr), (2, b"morvane-view: standard output: the report could not be "
                                                             b"written\n"))

    def test_can_be_written_beside_the_json(self):
        log = make_log.healthy().bytes()
        done = run("--json", "--prometheus", self.file, "-", log=log)
        self.assertEqual((done.returncode, done.stdout), (0, run("--json", "-", log=log).stdout))
        self.assertTrue(self.file.read_text().endswith("# EOF\n"))

    def test_of_a_subcommand_is_refused(self):
        for arguments in (["diff", "a", "b"], ["san", "a"], ["verify"]):
            done = run("--prometheus", self.file, *arguments)
            self.assertEqual(done.returncode, 2)
            self.assertIn(b" excludes --prometheus\n", done.stderr)


if __name__ == "__main__":
    unittest.main(argv=[sys.argv[0], *sys.argv[2:]])
