#!/usr/bin/env python3
"""What the laboratory's judge expects where scsi_id, the kernel and device-mapper differ."""

import sys
import unittest
from pathlib import Path

sys.path.insert(0, str(Path(__file__).resolve().parents[2] / "lab"))
from identity import Disk, Finding, disks, expected_findings, is_map_name
from reference import Reference

A, B = "6001405aaaaaaaaaaaaaaaaaaaaaaaaaa", "6001405bbbbbbbbbbbbbbbbbbbbbbbbbb"
FABRICS = {"1": "0x2000525400fa0a01", "2": "0x2000525400fa0b01"}


class FcDisks(Reference):
    """The answers of a host with an initiator port to one target port on each of two fabrics."""

    def __init__(self) -> None:
        self.files = {"names": "", "sys-block": "", "maps": "", "fc-hosts": "", "fc-targets": ""}
        for fabric, port in FABRICS.items():
            self.files["fc-hosts"] += (
                f"/sys/class/fc_host/host{fabric}/node_name:0x1000\n/sys/class/fc_host/host{fabric}/port_name:{port}\n"
            )
            target = f"/sys/class/fc_transport/target{fabric}:0:0"
            self.files["fc-targets"] += (
                f"{target}/node_name:0x3000\n{target}/port_name:0x400{fabric}\n{target}/port_id:0x000a02\n"
            )

    def disk(self, name: str, fabric: int, lun: int, asked: str, wwid: str) -> "FcDisks":
        self.files["names"] += f"{name}\t3{asked}\tnaa.{wwid}\tdisk/by-id/wwn-0x{wwid} disk/by-path/{name}\n"
        self.files["sys-block"] += (
            f"{name} ../devices/host{fabric}/rport-{fabric}:0-0/target{fabric}:0:0/{fabric}:0:0:{lun}/block/{name}\n"
        )
        return self

    def map(self, wwid: str, members: str) -> "FcDisks":
        self.files["maps"] += f"{wwid}|mpath-{wwid}|{members}\n"
        return self

    def text(self, name: str) -> str:
        return self.files[name]


def finding(kind: str, nodes: str, name: str = "") -> Finding:
    return Finding(kind, frozenset(f"/dev/{node}" for node in nodes.split()), name)


class Expectation(unittest.TestCase):
    def test_nothing_where_all_agree(self):
        host = FcDisks().disk("sda", 1, 0, A, A).disk("sdb", 2, 0, A, A).map("3" + A, "sda,sdb")
        self.assertEqual(expected_findings(host), set())

    def test_a_disk_of_another_name_than_the_kernels_is_stale_and_its_map_misnamed(self):
        host = FcDisks().disk("sda", 1, 0, B, A).disk("sdb", 2, 0, B, A).map("3" + A, "sda,sdb")
        self.assertEqual(
            expected_findings(host),
            {finding("stale-identity", "sda"), finding("stale-identity", "sdb"), finding("map-name", "sda sdb", "3" + A)},
        )

    def test_a_map_of_two_luns_is_mixed_and_its_stale_path_not_missed_elsewhere(self):
        host = FcDisks().disk("sda", 1, 0, B, A).disk("sdb", 2, 0, A, A).map("3" + A, "sda,sdb")
        host.disk("sdc", 1, 1, B, B).disk("sdd", 2, 1, B, B).map("3" + B, "sdc,sdd")
        # sda shows on fabric 1 what sdc shows there, too.
        self.assertEqual(
            expected_findings(host),
            {
                finding("stale-identity", "sda"),
                finding("mixed-map", "sda sdb", "3" + A),
                finding("shared-identity", "sda sdc sdd"),
            },
        )

    def test_a_path_outside_its_luns_map_is_missing_there(self):
        host = FcDisks().disk("sda", 1, 0, A, A).disk("sdb", 2, 0, A, A).map("3" + A, "sda")
        self.assertEqual(expected_findings(host), {finding("path-missing", "sdb", "3" + A)})

    def test_several_paths_in_no_map_are_a_lun_without_one(self):
        host = FcDisks().disk("sda", 1, 0, A, A).disk("sdb", 2, 0, A, A)
        self.assertEqual(expected_findings(host), {finding("lun-without-map", "sda sdb")})

    def test_one_name_at_two_numbers_of_a_target_is_shared(self):
        host = FcDisks().disk("sda", 1, 0, A, A).disk("sdb", 1, 9, A, A).map("3" + A, "sda,sdb")
        self.assertEqual(expected_findings(host), {finding("shared-identity", "sda sdb")})

    def test_one_name_at_two_numbers_of_two_targets_is_not_shared(self):
        host = FcDisks().disk("sda", 1, 0, A, A).disk("sdb", 2, 9, A, A).map("3" + A, "sda,sdb")
        self.assertEqual(expected_findings(host), set())


class Names(unittest.TestCase):
    def test_are_read_with_the_links_by_identifier_alone(self):
        self.assertEqual(
            disks(FcDisks().disk("sda", 1, 0, B, A)),
            {"/dev/sda": Disk("3" + B, "naa." + A, frozenset({"wwn-0x" + A}))},
        )

    def test_of_one_designator_agree_whatever_blanks_end_them(self):
        self.assertFalse(Disk("1ATA     DISK      1   ", "t10.ATA     DISK      1", frozenset()).is_stale)
        self.assertFalse(Disk("2001122334455667788", "eui.001122334455667788", frozenset()).is_stale)
        self.assertTrue(Disk("3" + A, "naa." + B, frozenset()).is_stale)

    def test_that_the_kernel_lacks_are_not_stale(self):
        self.assertFalse(Disk("0EMC     SYMMETRIX       000190100123", "", frozenset()).is_stale)

    def test_of_maps_are_those_of_udev(self):
        self.assertTrue(is_map_name("1Linux_scsi_debug_2000", Disk("1Linux   scsi_debug      2000", "", frozenset())))
        self.assertTrue(is_map_name("DISK_1", Disk("1ATA     DISK      1   ", "", frozenset({"ata-DISK_1"}))))
        self.assertFalse(is_map_name("DISK_1", Disk("1ATA     DISK      1   ", "", frozenset())))
        self.assertFalse(is_map_name("3" + A, Disk("3" + B, "", frozenset())))


if __name__ == "__main__":
    unittest.main()
