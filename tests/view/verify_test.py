#!/usr/bin/python3
"""What morvane-view verify says: of the memory of every simulated host, as a whole, and of what it cannot use.
usage: verify_test.py MORVANE-VIEW SIMHOST [unittest arguments]

With MORVANE_ACCEPT set in the environment the files in verify/ are written instead of compared; review them.
"""

import difflib
import json
import os
import shutil
import sys
import tempfile
import unittest
from pathlib import Path

import jsonschema

from support import HERE, ROOT, host_log, hosts, memories, run

SIMHOST = Path(sys.argv[2]).resolve()
GOLDEN = HERE / "verify"
SCHEMA = json.loads((ROOT / "view" / "morvane-verify.schema.json").read_text())

# What each memory of the host "remembered" is there for: the findings, each with its devices.
FINDINGS = {
    "agrees": [],
    "stale-identity": [("stale-identity", "sdf")],
    "stale-map": [("stale-identity", "sdb"), ("stale-identity", "sdc"), ("map-name", "sdb sdc")],
    "mixed-map": [("stale-identity", "sdb"), ("mixed-map", "sdb sdd sde")],
    "map-name": [("map-name", "sdb sdc")],
    "no-map": [("lun-without-map", "sdb sdc"), ("lun-without-map", "sdd sde")],
    "path-missing": [("path-missing", "sdc")],
    "path-states": [("path-state", "sdb"), ("path-state", "sdc"), ("path-state", "sdd"),
                    ("path-state", "sde"), ("path-state", "sdf")],
    "devices-differ": [("not-in-log", "sdg"), ("not-in-kernel", "sda")],
    "older-log": [("log-older-than-boot", "")],
    "older-log-another-lun": [("stale-identity", "sdf"), ("log-older-than-boot", "")],
    "younger-device": [("log-older-than-device", "sdf")],
    "older-kernel": [("stale-identity", "sdd")],
    "cut-page": [],
    "maps-differ": [("maps-differ", "")] * 3,
}


class Scratch(unittest.TestCase):
    maxDiff = None

    def setUp(self):
        scratch = tempfile.TemporaryDirectory()
        self.addCleanup(scratch.cleanup)
        self.folder = Path(scratch.name)

    def memories(self, host):
        """The memories of a simulated host by their names, as roots."""
        return memories(SIMHOST, host, self.folder / "memories" / host)

    def verify(self, log, *arguments, status):
        done = run("verify", *arguments, "-", log=log, folder=self.folder)
        self.assertEqual((done.returncode, done.stderr.decode()), (status, ""), done.stdout.decode())
        return done.stdout.decode()


class Memories(Scratch):
    def check(self, name, text):
        golden = GOLDEN / name
        if os.environ.get("MORVANE_ACCEPT"):
            golden.parent.mkdir(exist_ok=True)
            golden.write_text(text)
        expected = golden.read_text()
        self.assertTrue(text == expected, name + "\n" + "".join(
            difflib.unified_diff(expected.splitlines(True), text.splitlines(True))))

    def test_every_simulated_host_against_what_its_kernel_remembers(self):
        for host in hosts():
            for memory, root in self.memories(host).items():
                with self.subTest(host, memory=memory):
                    text = run("verify", "--root", root, "-", log=host_log(host)).stdout.decode()
                    self.check(f"{host}.{memory}.txt", text)
                    if host.startswith("remembered"):
                        done = run("verify", "--json", "--root", root, "-", log=host_log(host))
                        self.check(f"{host}.{memory}.json", done.stdout.decode())
                        document = json.loads(done.stdout)
                        jsonschema.validate(document, SCHEMA)
                        self.assertEqual(done.returncode, 1 if document["findings"] else 0)
                        self.assertEqual(document["agree"], "Everything agrees.\n" in text)

    def test_each_memory_gives_the_findings_that_it_is_there_for_and_no_others(self):
        log = host_log("remembered")
        roots = self.memories("remembered")
        self.assertEqual(sorted(roots), sorted(FINDINGS))
        for memory, expected in FINDINGS.items():
            with self.subTest(memory):
                document = json.loads(self.verify(log, "--json", "--root", roots[memory], status=1 if expected else 0))
                found = [(finding["kind"], " ".join(path["device"].removeprefix("/dev/") for path in finding["paths"]))
                         for finding in document["findings"]]
                self.assertEqual(found, expected)

    def test_a_page_shows_the_findings(self):
        root = self.memories("remembered")["mixed-map"]
        done = run("verify", "--root", root, "--html", "page.html", "-", log=host_log("remembered"), folder=self.folder)
        self.assertEqual((done.returncode, done.stdout, done.stderr), (1, b"", b""))
        document = json.loads(self.verify(host_log("remembered"), "--json", "--root", root, status=1))
        page = (self.folder / "page.html").read_text().split('<script type="application/json" id="document">')[1]
        self.assertEqual(json.loads(page.split("</script>")[0])["verify"], document)

    def test_every_expected_answer_belongs_to_a_host(self):
        self.assertEqual({path.name.split(".")[0] for path in GOLDEN.glob("*")} - set(hosts()), set())


class Recordings(Scratch):
    def setUp(self):
        super().setUp()
        self.root = self.memories("remembered")["path-states"]
        self.log = self.folder / "Morvane.log"
        self.log.write_bytes(host_log("remembered"))
        os.utime(self.log, (5, 5))

    def test_a_recording_gives_the_same_answer(self):
        answer = run("verify", "--root", self.root, "--record", self.folder / "case", self.log)
        self.assertEqual((answer.returncode, answer.stderr), (1, b""))
        again = run("verify", "--root", self.folder / "case")
        self.assertEqual((again.returncode, again.stdout, again.stderr), (1, answer.stdout, b""))

    def test_a_recording_holds_files_and_folders_and_links_that_stay_inside(self):
        run("verify", "--root", self.root, "--record", self.folder / "case", self.log)
        case = self.folder / "case"
        self.assertEqual((case / "MorvaneLogs/Morvane.log").read_bytes(), self.log.read_bytes())
        self.assertEqual((case / "MorvaneLogs/Morvane.log").stat().st_mtime, 5)
        for path in case.rglob("*"):
            if path.is_symlink():
                self.assertFalse(os.path.isabs(os.readlink(path)), path)
                self.assertTrue(path.resolve().is_relative_to(case.resolve()), path)
            elif path.is_file():
                original = self.root / path.relative_to(case)
                if original.name != "Morvane.log":
                    self.assertEqual(path.read_bytes(), original.read_bytes(), path)
            else:
                self.assertTrue(path.is_dir(), path)

    def test_a_copy_without_links_is_compared_by_names(self):
        copy = self.folder / "copy"
        (copy / "sys/block").mkdir(parents=True)
        for entry in (self.memories("remembered-shared-identity")["as-it-is"] / "sys/block").iterdir():
            shutil.copytree(entry / "device", copy / "sys/block" / entry.name / "device", symlinks=False,
                            ignore=shutil.ignore_patterns("block"))
        document = json.loads(self.verify(host_log("remembered-shared-identity"), "--json", "--root", copy, status=1))
        self.assertEqual([finding["kind"] for finding in document["findings"]], ["shared-identity"])
        self.assertEqual((document["compared"]["byPage83"], document["notCompared"]), (5, []))

    def test_nothing_is_written_into_a_folder_that_holds_anything(self):
        (self.folder / "case").mkdir()
        (self.folder / "case/mine").write_text("mine")
        done = run("verify", "--root", self.root, "--record", "case", self.log, folder=self.folder)
        self.assertEqual((done.returncode, done.stdout, done.stderr.decode()),
                         (2, b"", "morvane-view: case: is not empty; name a new folder for the recording\n"))
        self.assertEqual([path.name for path in (self.folder / "case").iterdir()], ["mine"])

    def test_a_recording_of_another_host_is_refused_unless_it_is_forced(self):
        (self.root / "proc/sys/kernel/hostname").write_text("larch\n")
        done = run("verify", "--root", self.root, self.log)
        self.assertEqual((done.returncode, done.stdout, done.stderr.decode()),
                         (2, b"", f"morvane-view: the log is of host rowan, but {self.root} is of host larch; --force compares "
                                  "them all the same\n"))
        self.assertEqual(run("verify", "--force", "--root", self.root, self.log).returncode, 1)

    def test_what_is_no_recording_is_said(self):
        (self.folder / "empty").mkdir()
        for arguments, message in (
            (("--root", "nowhere", self.log), "nowhere: No such file or directory"),
            (("--root", "empty", self.log), "empty: there is no sys/block in it: neither the root of a host nor a recording"),
            (("--root", "empty"), "empty: holds no MorvaneLogs/Morvane.log; name the log that is to be compared with it"),
            (("--record", "case", "--root", self.root, "-"), "a recording needs a log that is a file, not standard input"),
        ):
            with self.subTest(message):
                done = run("verify", *arguments, log=host_log("remembered"), folder=self.folder)
                self.assertEqual((done.returncode, done.stdout, done.stderr.decode()), (2, b"", f"morvane-view: {message}\n"))

    def test_a_list_of_maps_that_is_none_is_refused(self):
        takes = '; it takes what "multipathd show maps json" prints'
        lacks = "is JSON, but not multipathd's list of maps: there is no "
        for text, message in (
            ("mpatha (3600) dm-2 DGC,RAID 5", "is no JSON" + takes),
            ("", "is no JSON" + takes),
            ("[" * 100000, "is no JSON" + takes),
            ("[]", lacks + '"maps"' + takes),
            ('{"maps": {}}', lacks + '"maps"' + takes),
            ('{"maps": [{"name": 1}]}', lacks + '"name"' + takes),
            ('{"maps": [{"name": "a", "uuid": "b", "path_groups": [{}]}]}', lacks + '"paths"' + takes),
            ('{"maps": [{"name": "a", "uuid": "b", "path_groups": [{"paths": ["sda"]}]}]}', lacks + '"dev"' + takes),
        ):
            with self.subTest(text[:80]):
                (self.folder / "maps.json").write_text(text)
                done = run("verify", "--root", self.root, "--maps", "maps.json", self.log, folder=self.folder)
                self.assertEqual((done.returncode, done.stdout, done.stderr.decode()),
                                 (2, b"", f"morvane-view: maps.json: {message}\n"))
        for name, message in (("nowhere", "No such file or directory"), (".", "Is a directory")):
            done = run("verify", "--root", self.root, "--maps", name, self.log, folder=self.folder)
            self.assertEqual((done.returncode, done.stderr.decode()), (2, f"morvane-view: {name}: {message}\n"))

    def test_maps_without_paths_are_counted(self):
        (self.folder / "maps.json").write_text('{"maps": [{"name": "mpathz", "uuid": "36000"}]}')
        root = self.memories("remembered-shared-identity")["as-it-is"]
        for path in ("sys/block/dm-0/dm/name", "sys/block/dm-0/dm/uuid"):
            (root / path).parent.mkdir(parents=True, exist_ok=True)
        (root / "sys/block/dm-0/dm/name").write_text("mpathz\n")
        (root / "sys/block/dm-0/dm/uuid").write_text("mpath-36000\n")
        compared = json.loads(self.verify(host_log("remembered-shared-identity"), "--json", "--root", root, "--maps",
                                          "maps.json", status=1))["compared"]
        self.assertEqual((compared["maps"], compared["mapsWithPaths"], compared["listedMaps"]), (1, 0, 1))


class Hostile(Scratch):
    """Recordings that somebody made to do harm. Every run ends soon, with the answer that the rest gives."""

    def setUp(self):
        super().setUp()
        self.root = self.memories("remembered")["agrees"]
        self.device = (self.root / "sys/block/sdf").resolve() / "device"

    def compared(self, status=0):
        document = json.loads(self.verify(host_log("remembered"), "--json", "--root", self.root, status=status))
        return document["compared"]["byPage83"]

    def test_what_is_no_regular_file_counts_as_missing(self):
        self.assertEqual(self.compared(), 6)
        page = self.device / "vpd_pg83"
        page.unlink()
        os.mkfifo(page)
        self.assertEqual(self.compared(), 5)
        page.unlink()
        page.symlink_to("/dev/zero")
        self.assertEqual(self.compared(), 5)
        page.unlink()
        page.mkdir()
        self.assertEqual(self.compared(), 5)

    def test_a_file_that_is_too_large_counts_as_missing(self):
        with open(self.device / "vpd_pg83", "r+b") as page:
            page.truncate(1 << 40)
        self.assertEqual(self.compared(), 5)

    def test_a_page_that_is_nonsense_is_another_device_or_none(self):
        for page, status in ((b"\0", 0), (b"\0\x83\xff\xff", 0), (b"\0\x83\0\x04\x01\x03\0\xff", 0), (bytes(65536), 0),
                             (b"\0\x83\0\x0c\x01\x03\0\x08" + b"\x50" * 8, 1)):
            with self.subTest(page[:16]):
                (self.device / "vpd_pg83").write_bytes(page)
                self.compared(status)

    def test_links_neither_loop_nor_lead_out(self):
        entry = self.root / "sys/block/sdf"
        entry.unlink()
        outside = self.folder / "outside"
        shutil.copytree(self.device, outside / "device", symlinks=True)
        for target in ("sdf", "../block/sdf/sdf", str(outside), "../../../../../../../../.." + str(outside)):
            with self.subTest(target):
                entry.symlink_to(target)
                document = json.loads(self.verify(host_log("remembered"), "--json", "--root", self.root, status=1))
                self.assertEqual([finding["kind"] for finding in document["findings"]], ["not-in-kernel"])
                entry.unlink()

    def test_a_log_that_is_a_pipe_is_none(self):
        (self.root / "MorvaneLogs").mkdir()
        os.mkfifo(self.root / "MorvaneLogs/Morvane.log")
        done = run("verify", "--root", self.root)
        self.assertEqual((done.returncode, done.stderr.decode()),
                         (2, f"morvane-view: {self.root}: holds no MorvaneLogs/Morvane.log; name the log that is to be "
                             "compared with it\n"))

    def test_names_are_shown_without_control_characters(self):
        (self.device / "state").write_bytes(b"off\x1b[31mline\xff\n")
        text = self.verify(host_log("remembered"), "--root", self.root, status=1)
        self.assertIn("the kernel's device is off\\x1B[31mline\\xFF\n", text)

    def test_ten_thousand_devices_are_compared_before_the_program_is_given_up(self):
        for number in range(10000):
            device = self.root / f"sys/devices/pci0/host9/target9:0:0/9:0:0:{number}"
            (device / "block" / f"sd{number}").mkdir(parents=True)
            (self.root / f"sys/block/sd{number}").symlink_to(f"../devices/pci0/host9/target9:0:0/9:0:0:{number}/block/sd{number}")
            (device / f"block/sd{number}/device").symlink_to("../..")
            (device / "vpd_pg83").write_bytes(b"\0\x83\0\x0c\x01\x03\0\x08" + number.to_bytes(8, "big"))
        document = json.loads(self.verify(host_log("remembered"), "--json", "--root", self.root, status=1))
        self.assertEqual(len(document["findings"]), 10000)


class Nvme(Scratch):
    def test_the_paths_of_a_namespace_are_those_of_its_subsystem(self):
        root = self.folder / "root"
        namespace = root / "sys/devices/virtual/nvme-subsystem/nvme-subsys0/nvme0n1"
        namespace.mkdir(parents=True)
        (namespace / "wwid").write_text("uuid.1\n")
        (namespace / "device").symlink_to("../../nvme-subsys0")
        (root / "sys/block").mkdir()
        (root / "sys/block/nvme0n1").symlink_to("../devices/virtual/nvme-subsystem/nvme-subsys0/nvme0n1")
        for number, state in enumerate(("live", "connecting")):
            controller = root / f"sys/devices/virtual/nvme-fabrics/ctl/nvme{number}"
            (controller / f"nvme0c{number}n1").mkdir(parents=True)
            (controller / "state").write_text(state + "\n")
            (controller / f"nvme0c{number}n1/device").symlink_to(f"../../nvme{number}")
            (namespace.parent / f"nvme{number}").symlink_to(f"../../nvme-fabrics/ctl/nvme{number}")
            (root / f"sys/block/nvme0c{number}n1").symlink_to(f"../devices/virtual/nvme-fabrics/ctl/nvme{number}/nvme0c{number}n1")
        document = json.loads(self.verify(host_log("empty"), "--json", "--root", root, status=1))
        self.assertEqual([(finding["kind"], finding["paths"][0]["device"], finding["details"]) for finding in document["findings"]],
                         [("path-state", "/dev/nvme0n1", ["its controller nvme1 is connecting"]),
                          ("not-in-log", "/dev/nvme0n1", [])])


if __name__ == "__main__":
    unittest.main(argv=[sys.argv[0], *sys.argv[3:]])
