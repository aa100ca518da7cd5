#!/usr/bin/python3
"""What morvane-view paths writes: of simulated hosts as a whole, of what it cannot use, and of a large log.
usage: paths_test.py MORVANE-VIEW [unittest arguments]

With MORVANE_ACCEPT set in the environment the files in paths/ are written instead of compared; review them.
"""

import csv
import difflib
import io
import json
import os
import re
import resource
import sys
import tempfile
import unittest
from pathlib import Path

import make_log
from support import HERE, ROOT, host_log, lab_log, report, run

GOLDEN = HERE / "paths"
# Fibre Channel with PowerPath, iSCSI, direct disks, LUNs that are not listed, problems.
HOSTS = ("demo", "iscsi-two-interfaces", "iscsi-odd-listing", "das-malformed-page", "fc-nameless-middle",
         "fc-emc-without-page-83", "fc-lun-errors", "fc-powerpath-no-match", "empty")
HELP = run("paths", "--help").stdout.decode()
COLUMNS = dict(re.findall(r"^  (\w+) {2,}(.*)$", HELP[HELP.index("Columns:"):], re.M))


def shown(*arguments, log):
    """Standard output of a run that goes well."""
    done = run("paths", "-", *arguments, log=log)
    if done.returncode != 0:
        raise AssertionError(done.stderr)
    return done.stdout.decode()


class Golden(unittest.TestCase):
    maxDiff = None

    def check(self, name, text):
        golden = GOLDEN / name
        if os.environ.get("MORVANE_ACCEPT"):
            golden.parent.mkdir(parents=True, exist_ok=True)
            golden.write_text(text, newline="")
        with golden.open(newline="") as file:
            expected = file.read()
        self.assertTrue(text == expected, name + "\n" + "".join(
            difflib.unified_diff(expected.splitlines(True), text.splitlines(True))))

    def test_the_tables_of_hosts(self):
        every = ",".join(COLUMNS)
        for host in HOSTS:
            with self.subTest(host):
                log = host_log(host)
                self.check(f"{host}.txt", shown(log=log))
                self.check(f"{host}.csv", shown("--csv", "-o", every, log=log))
                self.check(f"{host}.jsonl", shown("--json-lines", "-o", every, log=log))

    def test_every_golden_file_belongs_to_a_host(self):
        self.assertEqual({path.name for path in GOLDEN.iterdir()},
                         {f"{host}.{kind}" for host in HOSTS for kind in ("txt", "csv", "jsonl")})


class Columns(unittest.TestCase):
    def test_are_those_of_the_manual_page(self):
        page = (ROOT / "view" / "morvane-view.1").read_text()
        described = page[page.index("The columns of"):]
        described = described[:described.index(".El")]
        self.assertEqual(dict(re.findall(r"^\.It Cm (\w+)\n(.*)$", described, re.M)), COLUMNS)

    def test_are_shown_in_the_order_that_is_asked_for(self):
        self.assertEqual(shown("-o", "lun,device", log=host_log("lab-fc")).splitlines()[0], "lun  device")

    def test_one_that_there_is_not_is_named(self):
        known = ", ".join(COLUMNS)
        for arguments, name in ((["-o", "device,wwid"], "wwid"), (["--filter", "wwid=x"], "wwid"), (["-o", ""], ""),
                                (["-o", "a\x1bb"], "a\\x1Bb"), (["--filter", "=x"], ""), (["--filter", "!=x"], "")):
            with self.subTest(arguments):
                done = run("paths", *arguments, "-", log=host_log("demo"))
                self.assertEqual((done.returncode, done.stdout, done.stderr.decode()),
                                 (2, b"", f"morvane-view: there is no column \"{name}\"; there are {known}\n"))


class Filters(unittest.TestCase):
    def devices(self, *filters):
        arguments = [word for each in filters for word in ("--filter", each)]
        return shown("--no-header", "-o", "device", *arguments, log=host_log("demo")).split()

    def test_a_glob_is_for_the_whole_value(self):
        self.assertEqual(self.devices("device=/dev/sd[sta]"), ["/dev/sds", "/dev/sdt", "/dev/sda"])
        self.assertEqual(self.devices("device=sda"), [])
        self.assertEqual(self.devices("transport=direct"), ["/dev/sda", "/dev/sdb"])

    def test_a_row_must_meet_all_and_may_be_asked_not_to_match(self):
        self.assertEqual(self.devices("transport!=fc", "luid=60A98*"), ["/dev/sds", "/dev/sdt"])

    def test_an_empty_glob_stands_for_what_a_row_has_not(self):
        self.assertEqual(self.devices("luid="), ["/dev/sdb"])
        self.assertEqual(sorted(set(self.devices("problem!="))), ["/dev/sdi", "/dev/sdj", "/dev/sdq", "/dev/sdr"])

    def test_one_that_is_none_is_refused(self):
        done = run("paths", "--filter", "device", "-", log=host_log("demo"))
        self.assertEqual((done.returncode, done.stdout, done.stderr), (
            2, b"", b'morvane-view: the filter "device" is neither COLUMN=GLOB nor COLUMN!=GLOB\n'))


class Formats(unittest.TestCase):
    def test_lines_have_no_blanks_at_their_ends_and_the_header_can_be_left_out(self):
        whole = shown(log=host_log("demo"))
        self.assertEqual([line for line in whole.splitlines() if line != line.rstrip()], [])
        rows = [line.split() for line in whole.splitlines()]
        self.assertEqual([line.split() for line in shown("--no-header", log=host_log("demo")).splitlines()], rows[1:])

    def test_the_table_of_fibre_channel_fits_a_hundred_columns(self):
        self.assertEqual(max(map(len, shown(log=host_log("fc-nameless-middle")).splitlines())), 97)

    def test_csv_is_read_back_and_its_lines_end_as_its_standard_says(self):
        log = make_log.troubled().bytes().replace(b"ARRAY 9", b'=A,"B"9')
        text = shown("--csv", "-o", "device,product,lun", log=log)
        self.assertEqual(text.count("\n"), text.count("\r\n"))
        lines = [json.loads(line) for line in shown("--json-lines", "-o", "device,product,lun", log=log).splitlines()]
        rows = list(csv.reader(io.StringIO(text, newline="")))
        self.assertEqual(rows[0], ["device", "product", "lun"])
        self.assertEqual(rows[1:], [["" if value is None else str(value) for value in line.values()] for line in lines])
        self.assertEqual(rows[1:], list(csv.reader(io.StringIO(shown("--csv", "--no-header", "-o", "device,product,lun", log=log)))))

    def test_bytes_of_a_device_are_escaped_in_each(self):
        log = make_log.troubled().bytes()
        for arguments in ([], ["--csv"], ["--json-lines"]):
            text = shown("-o", "luid,problem", *arguments, log=log)
            self.assertNotIn("\x1b", text)
            self.assertIn(r"naa\x1B[31m\xE9\\5000C500".replace("\\", "\\\\") if arguments == ["--json-lines"]
                          else r"naa\x1B[31m\xE9\\5000C500", text)

    def test_a_format_that_would_not_be_heeded_is_refused(self):
        for arguments in (["paths", "--csv", "--json-lines"], ["--json", "paths"], ["--html", "x.html", "paths"],
                          ["x.log", "paths"]):
            done = run(*arguments)
            self.assertEqual((done.returncode, done.stdout), (2, b""), arguments)
            self.assertIn(b" excludes ", done.stderr)

    def test_every_path_of_the_report_is_a_row(self):
        for log in (*map(host_log, HOSTS), lab_log("healthy")):
            document = report(log)
            devices = [path["device"] for tree in (document["fc"]["paths"], *(adapter["unlisted"] for adapter in
                       document["fc"]["adapters"]), document["iscsi"]["paths"], document["direct"]["devices"]) for path in tree]
            rows = [json.loads(line) for line in shown("--json-lines", log=log).splitlines()]
            self.assertEqual([row["device"] for row in rows], devices)

    def test_what_was_dropped_is_warned_of(self):
        done = run("paths", "-", log=host_log("fc-lun-times-out"))
        self.assertRegex(done.stderr.decode(), r"\Amorvane-view: warning: standard input: the report tells of \d+ problems?; "
                                               r"what was dropped has no row\n\Z")
        self.assertEqual(run("paths", "-", log=host_log("lab-fc")).stderr, b"")


class Size(unittest.TestCase):
    def test_ten_thousand_paths_take_no_longer_each_than_a_few(self):
        with tempfile.TemporaryDirectory() as folder:
            log = Path(folder, "log")
            seconds = []
            for count in (1248, 9984):
                log.write_bytes(make_log.big(count).bytes())
                before = resource.getrusage(resource.RUSAGE_CHILDREN).ru_utime
                done = run("paths", "--no-header", "-o", "device,luid,map,problem", log)
                seconds.append(resource.getrusage(resource.RUSAGE_CHILDREN).ru_utime - before)
                self.assertEqual(done.stdout.count(b"\n"), count + 1)
        self.assertLess(seconds[1], 8 * 4 * (seconds[0] + 0.05))


if __name__ == "__main__":
    unittest.main(argv=[sys.argv[0], *sys.argv[2:]])
