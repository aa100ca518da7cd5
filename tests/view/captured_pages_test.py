#!/usr/bin/python3
"""Holds the names that morvane-view makes of a log against those that other programs gave the same devices.

The devices' answers and names are other people's data and stand beside the checkout, in ../shared/pages: a file of hex for
each device, and a table with a column for each program. Without them the test is skipped.

usage: captured_pages_test.py MORVANE-VIEW SIMHOST MORVANE [unittest arguments]"""

import re
import subprocess
import sys
import tempfile
import unittest
from pathlib import Path

from support import ROOT, report

PAGES = ROOT.parent / "shared" / "pages"
COLUMNS = {"scsi_id": "scsiId", "sg3_rules": "sg3Rules", "multipath": "multipath", "kernel": "kernel"}

# What differs, and why.
NOT_ASKED = "not in the log: Morvane asks no device of its type"
REFUSED = "the table's name is that of the bytes alone: the program asks for page 83h and refuses an answer of another code"
VENDOR = "not in the log: made of vendor and product, too, which it does not tell of a direct disk"
DIFFERENT = {
    ("celestica-athena", column): NOT_ASKED for column in COLUMNS
} | {
    ("txt-ibm-tape", column): NOT_ASKED for column in COLUMNS
} | {
    (name, "scsi_id"): VENDOR for name in ("txt-crosvm", "txt-old-libata", "txt-qemu-serial")
} | {
    ("lsm-15-wrong-code", "kernel"): REFUSED,
    ("oswin-wrong-code", "kernel"): REFUSED,
    ("oswin-wrong-code", "sg3_rules"): REFUSED,
}


def case(name):
    """The two answers of a device in hexadecimal."""
    fields = dict(line.split(": ", 1) for line in (PAGES / "cases" / f"{name}.txt").read_text().splitlines())
    return fields["standard"], fields["page83"]


def table():
    """The names of each device, by column; None where a program has none."""
    head, *rows = ((PAGES / "names.tsv").read_text()).splitlines()
    columns = head.split("\t")[1:]
    for row in rows:
        name, *values = row.split("\t")
        yield name, {column: None if re.fullmatch("-|-E[A-Z]+", value) else
                     re.sub(r"\\x([0-9a-f]{2})", lambda match: chr(int(match[1], 16)), value)
                     for column, value in zip(columns, values, strict=True)}


def description(cases):
    """A host whose direct disks are the devices: /dev/sd0, /dev/sd1, ..."""
    link = "../devices/pci0000:00/0000:00:1f.2/host0/target0:0:{n}/0:0:{n}:0/block/sd{n}"
    text = f'about = "Devices of others"\nhostname = "oak"\nsys_block = [{{ link = "{link}", count = {len(cases)} }}]\n[fc]\n'
    for number, name in enumerate(cases):
        standard, page83 = case(name)
        text += f'[[disk]]\nnode = "/dev/sd{number}"\nraw = {{ standard = "{standard}", 0x83 = "{page83}" }}\n'
    return text


@unittest.skipUnless(PAGES.is_dir(), "no ../shared/pages beside the checkout")
class CapturedPages(unittest.TestCase):
    def test_every_program_is_said_to_call_a_device_what_it_called_it(self):
        expected = dict(table())
        with tempfile.TemporaryDirectory() as folder:
            Path(folder, "host.toml").write_text(description(expected))
            subprocess.run([SIMHOST, "host.toml", "--", MORVANE], cwd=folder, check=True, capture_output=True)
            document = report(Path(folder, "MorvaneLogs", "Morvane.log").read_bytes())
        names = {disk["device"]: disk["names"] for disk in document["direct"]["devices"]}
        agreed = dict.fromkeys(COLUMNS, 0)
        different = set()
        for number, (name, wanted) in enumerate(expected.items()):
            told = names.get(f"/dev/sd{number}") or {}
            for column, key in COLUMNS.items():
                if told and told[key] == wanted[column]:
                    agreed[column] += 1
                else:
                    different.add((name, column))
        print(", ".join(f"{column}: {count} of {len(expected)}" for column, count in agreed.items()))
        for name, column in sorted(different & DIFFERENT.keys()):
            print(f"{name}, {column}: {DIFFERENT[name, column]}")
        self.assertEqual(sorted(different), sorted(DIFFERENT))


if __name__ == "__main__":
    SIMHOST, MORVANE = (Path(argument).resolve() for argument in sys.argv[2:4])
    unittest.main(argv=[sys.argv[0], *sys.argv[4:]])
