#!/usr/bin/python3
"""What morvane-view check says, as programs that watch services run it and read it. usage: check_test.py MORVANE-VIEW"""

import re
import subprocess
import sys
import tempfile
import unittest
from pathlib import Path

import make_log
from support import PROGRAM, ROOT, host_log, lab_log, run

OK, WARNING, CRITICAL, UNKNOWN = range(4)
HEALTHY = make_log.healthy().bytes()
COUNTS = "luns=4;;;0 paths=13;;;0 lost_luns=0;;0;0 lost_paths=0;0;;0 changed_identities=0;;0;0"
FOURTH = b"60014050000000000000000000000001"  # the LUN of one path, over iSCSI
NEGATE = "/usr/lib/nagios/plugins/negate"  # runs a plugin, and reads its status and its status's name
# Debian's parser of performance data; what it reads of each label.
PARSER = """use Monitoring::Plugin::Performance;
for (Monitoring::Plugin::Performance->parse_perfstring(<STDIN>)) {
    print join(",", map { $_ // "" } $_->label, $_->value, $_->uom, $_->warning, $_->critical, $_->min), "\\n";
}"""


def without_iscsi(log):
    return re.sub(rb"\|_ Initiator IQN.*\n.*\n.*\n.*\n.*\n", b"", log)


ONE_PATH_LESS = make_log.healthy(without=[(1, 0, 1)]).bytes()
ONE_PATH_LEFT = make_log.healthy(without=[(0, 0, 1), (0, 1, 1), (1, 0, 1)]).bytes()


class Check(unittest.TestCase):
    maxDiff = None

    def setUp(self):
        scratch = tempfile.TemporaryDirectory()
        self.addCleanup(scratch.cleanup)
        self.folder = Path(scratch.name)

    def check(self, baseline, log, *options):
        """The status, the first line and the further lines of a check of one log by another."""
        (self.folder / "baseline").write_bytes(baseline)
        (self.folder / "log").write_bytes(log)
        return self.checked(*options, "baseline", "log")

    def checked(self, *arguments):
        done = run("check", *arguments, folder=self.folder)
        self.assertEqual(done.stderr, b"")
        first, further = done.stdout.decode().split("\n", 1)
        return done.returncode, first, further

    def unknown(self, reason, *arguments):
        self.assertEqual(self.checked(*arguments), (UNKNOWN, f"MORVANE UNKNOWN: {reason}", ""))

    def first(self, *arguments):
        return self.check(*arguments)[:2]


class Losses(Check):
    def test_the_same_state_is_ok(self):
        self.assertEqual(self.check(HEALTHY, HEALTHY),
                         (OK, f"MORVANE OK: nothing lost, 4 LUNs with 13 paths | {COUNTS}", ""))

    def test_more_is_ok_and_listed_below(self):
        status, first, further = self.check(ONE_PATH_LESS, HEALTHY)
        self.assertEqual((status, first), (OK, f"MORVANE OK: nothing lost, 4 LUNs with 13 paths | {COUNTS}"))
        self.assertEqual(further, """
New paths (1)
  10:00:00:00:00:00:00:01 -> 52:00:00:00:00:00:00:10 LUN 1  /dev/sdi  600A0B80000000000000000000000001

LUNs with another number of paths (1)
  more  3 -> 4  600A0B80000000000000000000000001  ACME  ARRAY 9
""")

    def test_fewer_paths_of_a_lun_are_a_warning(self):
        status, first, further = self.check(HEALTHY, ONE_PATH_LESS)
        self.assertEqual((status, first), (
            WARNING, "MORVANE WARNING: 1 LUN with fewer paths (600A0B80000000000000000000000001: 3 of 4), 1 path lost | "
                     "luns=4;;;0 paths=12;;;0 lost_luns=0;;0;0 lost_paths=1;0;;0 changed_identities=0;;0;0"))
        self.assertEqual(further, """
Lost paths (1)
  10:00:00:00:00:00:00:01 -> 52:00:00:00:00:00:00:10 LUN 1  /dev/sdi  600A0B80000000000000000000000001

LUNs with another number of paths (1)
  fewer  4 -> 3  600A0B80000000000000000000000001  ACME  ARRAY 9
""")

    def test_a_lun_that_is_gone_is_critical(self):
        self.assertEqual(self.first(HEALTHY, without_iscsi(ONE_PATH_LESS)), (
            CRITICAL, "MORVANE CRITICAL: 1 LUN gone (60014050000000000000000000000001), 1 LUN with fewer paths "
                      "(600A0B80000000000000000000000001: 3 of 4), 2 paths lost | "
                      "luns=3;;;0 paths=11;;;0 lost_luns=1;;0;0 lost_paths=2;0;;0 changed_identities=0;;0;0"))

    def test_those_with_the_fewest_paths_are_named_first(self):
        fewer = make_log.healthy(without=[(0, 0, 0), (0, 0, 1), (0, 1, 1), (1, 0, 1), (0, 0, 2), (0, 1, 2)]).bytes()
        self.assertEqual(self.first(HEALTHY, fewer)[1].split(" | ", maxsplit=1)[0],
                         "MORVANE WARNING: 3 LUNs with fewer paths (600A0B80000000000000000000000001: 1 of 4, "
                         "600A0B80000000000000000000000002: 2 of 4, 600A0B80000000000000000000000000: 3 of 4), 6 paths lost")

    def test_a_path_that_was_identified_but_is_not_listed_is_not_lost(self):
        unlisted = re.sub(rb"\|  \|  \|  \|_ lun name /dev/sdi .*\n", b"", HEALTHY)
        status, first, further = self.check(HEALTHY, unlisted)
        self.assertEqual((status, first), (OK, f"MORVANE OK: nothing lost, 4 LUNs with 13 paths | {COUNTS}"))
        self.assertEqual(further, """
Lost paths (1)
  10:00:00:00:00:00:00:01 -> 52:00:00:00:00:00:00:10 LUN 1  /dev/sdi  600A0B80000000000000000000000001  the new log \
identified such a device without listing it
""")

    def test_another_lun_behind_a_path_is_critical(self):
        changed = HEALTHY.replace(FOURTH, b"60014050000000000000000000000009")
        status, first, further = self.check(HEALTHY, changed)
        self.assertEqual((status, first), (
            CRITICAL, "MORVANE CRITICAL: another LUN behind 1 path (/dev/sdn), 1 LUN gone (60014050000000000000000000000001), "
                      "1 path lost | "
                      "luns=4;;;0 paths=13;;;0 lost_luns=1;;0;0 lost_paths=1;0;;0 changed_identities=1;;0;0"))
        self.assertTrue(further.startswith(
            "\nDANGER: another LUN behind the same initiator, target and LUN number (1)\n"), further)

    def test_a_path_whose_identifier_can_no_longer_be_read_is_lost_to_its_lun(self):
        unread = HEALTHY.replace(b"LunId: " + FOURTH, b"LunId: :-( SCSI_Inquiry_Failed")
        self.assertEqual(self.first(HEALTHY, unread)[0], CRITICAL)
        self.assertEqual(self.first(unread, without_iscsi(HEALTHY)), (
            WARNING, "MORVANE WARNING: 1 path lost | "
                     "luns=3;;;0 paths=12;;;0 lost_luns=0;;0;0 lost_paths=1;0;;0 changed_identities=0;;0;0"))

    def test_a_direct_disk_without_an_identifier_counts_as_a_path(self):
        gone = re.sub(rb"\n--------> Device Name: \|/dev/sda\| LunId: \|hosta::/dev/sda\|\n", b"", HEALTHY)
        self.assertEqual(self.first(HEALTHY, gone)[1].split(" | ", maxsplit=1)[0], "MORVANE WARNING: 1 path lost")

    def test_powerpath_that_stopped_is_a_warning(self):
        before = HEALTHY.replace(b"PowerPath is not Running\n", b"PowerPath Data : Ulid  Pseudo Name\n" + b" " * 15 +
                                 b"600A0B80000000000000000000000001 emcpowera")
        status, first, further = self.check(before, HEALTHY)
        self.assertEqual((status, first), (WARNING, f"MORVANE WARNING: PowerPath no longer runs | {COUNTS}"))
        self.assertEqual(further, "\nPowerPath was running, is not running\n")
        self.assertEqual(self.first(HEALTHY, before)[0], OK)

    def test_a_device_with_another_name_is_no_loss(self):
        self.assertEqual(self.first(HEALTHY, make_log.healthy(first_disk=30).bytes())[0], OK)


class Thresholds(Check):
    def test_are_ranges_of_lost_paths(self):
        for options, status in (([], WARNING), (["--warning", "1"], OK), (["-w", "~:1"], OK), (["-w", "@2:"], OK),
                                (["-w", "@1:3"], WARNING), (["-w", "1", "-c", "0"], CRITICAL),
                                (["--critical", "0"], CRITICAL), (["--critical=1"], WARNING)):
            self.assertEqual(self.first(HEALTHY, ONE_PATH_LESS, *options)[0], status, options)

    def test_stand_in_the_performance_data_as_they_were_given(self):
        self.assertTrue(self.first(HEALTHY, HEALTHY, "-w", "~:2", "-c", "@4:")[1].endswith(" lost_paths=0;~:2;@4:;0 "
                                                                                         "changed_identities=0;;0;0"))

    def test_a_lun_with_too_few_paths_left_is_critical(self):
        self.assertEqual(self.first(HEALTHY, ONE_PATH_LEFT)[0], WARNING)
        self.assertEqual(self.first(HEALTHY, ONE_PATH_LEFT, "--least-paths", "1")[0], WARNING)
        self.assertEqual(self.first(HEALTHY, ONE_PATH_LEFT, "--least-paths", "2")[0], CRITICAL)
        self.assertEqual(self.first(HEALTHY, HEALTHY, "--least-paths", "2")[0], OK)  # the LUN of one path has no less

    def test_a_lun_that_is_gone_is_critical_whatever_they_are(self):
        self.assertEqual(self.first(HEALTHY, without_iscsi(HEALTHY), "-w", "100", "-c", "100")[0], CRITICAL)


class Unknown(Check):
    def test_logs_that_cannot_be_read(self):
        (self.folder / "good").write_bytes(HEALTHY)
        (self.folder / "empty").write_bytes(b"")
        (self.folder / "text").write_bytes(b"nothing that Morvane writes\n")
        self.unknown("nowhere: No such file or directory", "nowhere", "good")
        self.unknown("nowhere: No such file or directory", "good", "nowhere")
        self.unknown("./MorvaneLogs/Morvane.log: No such file or directory", "good")
        self.unknown("empty: the log is empty", "empty", "good")
        self.unknown("text: is not a Morvane log", "good", "text")
        self.unknown(".: is a folder; the log is the file Morvane.log in it", ".", "good")
        self.unknown(r"a\x7C\x0Ab: No such file or directory", "a|\nb", "good")

    def test_a_command_line_that_is_not_understood(self):
        for arguments, reason in (
                ([], "BASELINE is required"),
                (["a", "b", "c"], "The following argument was not expected: c"),
                (["--nonsense", "a"], "The following argument was not expected: --nonsense"),
                (["-w", "4:3", "a"], "4:3 is no range of whole numbers"),
                (["-c", "x|\ny", "a"], r"x\x7C\x0Ay is no range of whole numbers"),
                (["--least-paths", "-1", "a"], "--least-paths: Value -1 not in range 1 to 1000")):
            self.unknown(reason, *arguments)
        for option in ("--json", "--html=page"):
            done = run(option, "check", "a", folder=self.folder)
            self.assertEqual((done.returncode, done.stdout.decode(), done.stderr),
                             (UNKNOWN, f"MORVANE UNKNOWN: check excludes {option.split('=')[0]}\n", b""))

    def test_output_that_cannot_be_written(self):
        (self.folder / "good").write_bytes(HEALTHY)
        with open("/dev/full", "wb") as full:
            done = subprocess.run([PROGRAM, "check", "good", "good"], cwd=self.folder, stdout=full, check=False, timeout=60)
        self.assertEqual(done.returncode, UNKNOWN)

    def test_logs_that_are_not_whole(self):
        for cut in (HEALTHY[:-200], HEALTHY[200:], HEALTHY[:HEALTHY.index(b"ISCSI DEVICE")]):
            self.assertEqual(self.first(HEALTHY, cut),
                             (UNKNOWN, "MORVANE UNKNOWN: the log is not whole: what is lost cannot be judged"))
            self.assertEqual(self.first(cut, HEALTHY),
                             (UNKNOWN, "MORVANE UNKNOWN: the baseline is not whole: what is lost cannot be judged"))

    def test_packed_logs_that_are_cut(self):
        packed = subprocess.run(["zstd", "-qc"], input=HEALTHY, capture_output=True, check=True).stdout
        self.assertEqual(self.first(packed, packed)[0], OK)
        self.assertEqual(self.first(HEALTHY, packed[:-1])[0], UNKNOWN)
        self.assertEqual(self.first(packed[:-1], HEALTHY)[0], UNKNOWN)

    def test_a_tree_that_was_ended_early_unless_it_was_so_in_the_baseline(self):
        start = HEALTHY.index(b"Entered Function printDeviceTree")
        end = HEALTHY.index(b"Left Function BuildIscsiTree_Linux")
        ended = HEALTHY[:start] + b"Caught exception while building ISCSI tree: Write failed\n\n" + HEALTHY[end:]
        self.assertEqual(self.first(HEALTHY, ended), (
            UNKNOWN, "MORVANE UNKNOWN: the log's ISCSI tree was ended early: what is lost cannot be judged"))
        self.assertEqual(self.first(ended, HEALTHY)[0], OK)
        status, first, further = self.check(ended, ended)
        self.assertEqual((status, first), (OK, "MORVANE OK: nothing lost, 3 LUNs with 12 paths | luns=3;;;0 paths=12;;;0 "
                                               "lost_luns=0;;0;0 lost_paths=0;0;;0 changed_identities=0;;0;0"))
        warning = "warning: the {} log's ISCSI tree was ended early: what it does not list counts as lost\n"
        self.assertEqual(further, warning.format("old") + warning.format("new") + "No difference.\n")

    def test_another_host_and_one_that_was_renamed(self):
        status, first, further = self.check(HEALTHY, make_log.healthy("a|b").bytes())
        self.assertEqual((status, first), (UNKNOWN, r"MORVANE UNKNOWN: the baseline is of host hosta, the log of host "
                                                    r"a\x7Cb: if the host was renamed, take a new baseline"))
        self.assertIn("warning: the logs are of two hosts: hosta and a\\x7Cb\n", further)
        foreign = re.sub(rb"^--------> .*\n", b"", HEALTHY, flags=re.M).replace(b"wwpn 10:00", b"wwpn 10:ff").replace(
            b"iqn.1993", b"iqn.2093")
        self.assertEqual(self.first(HEALTHY, foreign), (
            UNKNOWN, "MORVANE UNKNOWN: the baseline and the log have no initiator in common: they may be of two hosts"))

    def test_another_lun_behind_a_path_is_critical_all_the_same(self):
        cut = HEALTHY.replace(FOURTH, b"60014050000000000000000000000009")[:-200]
        self.assertEqual(self.first(HEALTHY, cut), (
            CRITICAL, "MORVANE CRITICAL: another LUN behind 1 path (/dev/sdn), the log is not whole: what is lost cannot be "
                      "judged"))


class Texts(Check):
    """What comes from devices neither ends the line nor begins performance data, and is UTF-8."""

    def test_of_devices_are_escaped_in_every_line(self):
        odd = make_log.Log("h|o'st=\xe9")
        odd.multipath()
        luns = [make_log.fc_lun("/dev/sdb", "naa|\n\x1b'=;\udcc3", 0, make_log.wwn(0x52, 1), vendor="V|", product="\udcff|")]
        odd.fc([{"name": "a", "wwnn": make_log.wwn(0x20, 1), "ports": [make_log.wwn(0x10, 1)], "luns": luns}])
        odd.iscsi([], initiator=None)
        odd.direct([{"device": "/dev/sda|", "id": "d|\u202e\udce9'", "vendor": "ACME"}])
        odd.logical([])
        odd.end()
        healthy = HEALTHY.replace(b"hosta", "h|o'st=\xe9".encode())
        status, first, further = self.check(odd.bytes(), healthy)
        self.assertEqual(first.count("|"), 1)
        self.assertNotIn("|", further)
        self.assertEqual(re.findall("[\x00-\x09\x0b-\x1f\x7f\u202e]", first + further), [])
        self.assertEqual(status, CRITICAL)
        self.assertIn(r"d\x7C\xE2\x80\xAE\xE9'", first)


class Runners(Check):
    def test_read_the_performance_data(self):
        line = self.first(HEALTHY, without_iscsi(HEALTHY), "-w", "2", "-c", "5")[1]
        parsed = subprocess.run(["perl", "-e", PARSER], input=line.split(" | ", maxsplit=1)[1], text=True,
                                capture_output=True, check=True).stdout
        self.assertEqual(parsed, "luns,3,,,,0\npaths,12,,,,0\nlost_luns,1,,,0,0\nlost_paths,1,,2,5,0\n"
                                 "changed_identities,0,,,0,0\n")

    def test_read_status_and_text(self):
        (self.folder / "good").write_bytes(HEALTHY)
        (self.folder / "worse").write_bytes(ONE_PATH_LESS)
        for name, state, status in (("good", "OK", OK), ("worse", "WARNING", WARNING), ("nowhere", "UNKNOWN", UNKNOWN)):
            plain = run("check", "good", name, folder=self.folder)
            self.assertEqual(plain.returncode, status)
            # Each status becomes the next; the text says so, too.
            turned = subprocess.run([NEGATE, "-s", "-o", "WARNING", "-w", "CRITICAL", "-u", "OK", PROGRAM, "check", "good",
                                     name], cwd=self.folder, capture_output=True, check=False, timeout=60)
            to = {"OK": "WARNING", "WARNING": "CRITICAL", "UNKNOWN": "OK"}[state]
            self.assertEqual((turned.returncode, turned.stdout.decode().split("\n")[0]),
                             ({"WARNING": 1, "CRITICAL": 2, "OK": 0}[to],
                              plain.stdout.decode().split("\n")[0].replace(f"MORVANE {state}", f"MORVANE {to}")))


class Documentation(Check):
    def test_shows_the_line_of_a_path_that_is_lost(self):
        demo = host_log("demo")
        lost = re.sub(rb"\|  \|  \|  \|_ lun name /dev/sdp .*\n", b"", demo)
        trace = lost.index(b"Added to DevMap", lost.rindex(b"Added to DevMap", 0, lost.index(b"--> /dev/sdp -->")))
        lost = lost[:trace] + lost[lost.index(b"Added to DevMap", trace + 1):]
        (self.folder / "accepted.log").write_bytes(demo)
        (self.folder / "MorvaneLogs").mkdir()
        (self.folder / "MorvaneLogs" / "Morvane.log").write_bytes(lost)
        page = (ROOT / "docs" / "monitoring.md").read_text()
        shown = re.search(r"^\$ morvane-view (check .*)\n(.*)\n", page, re.M)
        self.assertEqual(self.checked(*shown[1].split()[1:])[:2], (WARNING, shown[2]))


class Laboratory(Check):
    def test_runs_are_judged_by_the_healthy_one(self):
        expected = {
            "healthy": "MORVANE OK: nothing lost, 17 LUNs with 32 paths",
            "link-down": "MORVANE WARNING: 8 LUNs with fewer paths (6001405ABFC200000000000000000000: 1 of 2, "
                         "6001405ABFC000000000000000000000: 1 of 2, 6001405ABFC300000000000000000000: 1 of 2, ...), "
                         "8 paths lost",
            "lun-offline": "MORVANE CRITICAL: 1 LUN gone (5000C50000000002), 1 LUN with fewer paths "
                           "(6001405ABFC100000000000000000000: 1 of 2), 2 paths lost",
            "iscsi-target-gone": "MORVANE CRITICAL: 2 LUNs gone (6001405ABC2000000000000000000000, "
                                 "6001405ABC3000000000000000000000), 1 LUN with fewer paths "
                                 "(0200000C303030313930313030313233: 2 of 4), 6 paths lost",
            "lun-without-identifier": "MORVANE WARNING: 1 LUN with fewer paths (0200000C303030313930313030313233: 3 of 4), "
                                      "1 path lost",
            "command-lost": "MORVANE CRITICAL: 1 LUN gone (Linux   scsi_debug      2000), 1 LUN with fewer paths "
                            "(0200000C303030313930313030313233: 2 of 4), 5 paths lost",
        }
        for stage, words in expected.items():
            with self.subTest(stage):
                status, first, _ = self.check(lab_log("healthy"), lab_log(stage))
                self.assertEqual(first.split(" | ")[0], words)
                self.assertEqual(status, ["OK", "WARNING", "CRITICAL"].index(words.split()[1].rstrip(":")))


if __name__ == "__main__":
    unittest.main(argv=[sys.argv[0], *sys.argv[2:]])
