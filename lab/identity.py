"""Who each disk of the guest is by scsi_id, the kernel, udev and device-mapper, and what follows where they differ."""

import re
from collections import defaultdict
from dataclasses import dataclass

from reference import Reference

# The kernel's prefixes of a wwid, and scsi_id's for the same kind of designator.
PREFIXES = {"naa.": "3", "eui.": "2", "t10.": "1"}


@dataclass(frozen=True)
class Disk:
    """What a disk is called."""

    asked: str  # by scsi_id, which asks the device itself
    wwid: str  # by the kernel, which asked when it first saw the device; empty if that gave no name
    links: frozenset[str]  # below /dev/disk/by-id, by udev

    @property
    def is_stale(self) -> bool:
        """Whether the kernel remembers another device."""
        remembered = PREFIXES.get(self.wwid[:4], "?") + self.wwid[4:]
        return bool(self.wwid) and remembered.rstrip() != self.asked.rstrip()


@dataclass(frozen=True)
class Finding:
    """One thing that is wrong."""

    kind: str  # as 'morvane-view verify --json' names it
    disks: frozenset[str]  # device nodes
    map: str = ""  # by its name, where the finding is about one


def disks(reference: Reference) -> dict[str, Disk]:
    """Every SCSI disk, by its device node."""
    found = {}
    for line in reference.text("names").splitlines():
        disk, asked, wwid, links = line.split("\t")
        by_id = frozenset(link.removeprefix("disk/by-id/") for link in links.split() if link.startswith("disk/by-id/"))
        found[f"/dev/{disk}"] = Disk(asked, wwid, by_id)
    return found


def maps(reference: Reference) -> dict[str, tuple[str, frozenset[str]]]:
    """Every multipath map of device-mapper: name, WWID and device nodes."""
    found = {}
    for line in reference.text("maps").splitlines():
        name, uuid, members = line.split("|")
        if uuid.startswith("mpath-"):
            nodes = frozenset(f"/dev/{disk}" for disk in members.split(",") if disk)
            found[name] = (uuid.removeprefix("mpath-"), nodes)
    return found


def is_map_name(wwid: str, disk: Disk) -> bool:
    """Whether multipath may call the disk so: it takes udev's name, which is scsi_id's with a line for a run of blanks, or
    of a disk of libata the one that ATA IDENTIFY gives it, also where the disk is reached over FC."""
    return wwid == re.sub(r"\s+", "_", disk.asked.rstrip()) or f"ata-{wwid}" in disk.links


def expected_findings(reference: Reference) -> set[Finding]:
    """What is wrong by the answers of the tools alone."""
    known, all_maps = disks(reference), maps(reference)
    stale = {node for node, disk in known.items() if disk.is_stale}
    findings = {Finding("stale-identity", frozenset({node})) for node in stale}
    map_of = {}
    for name, (wwid, nodes) in all_maps.items():
        map_of.update(dict.fromkeys(nodes, name))
        if len({known[node].asked for node in nodes}) > 1:
            findings.add(Finding("mixed-map", nodes, name))
        if not any(is_map_name(wwid, known[node]) for node in nodes):
            findings.add(Finding("map-name", nodes, name))

    luns = defaultdict(set)
    for node, disk in known.items():
        luns[disk.asked].add(node)
    numbers = defaultdict(set)
    for path in reference.fc_paths():
        numbers[path[1], path[3], known[path[6]].asked].add(path[7])
    shared = {asked for (_, _, asked), at in numbers.items() if len(at) > 1}
    for asked, nodes in luns.items():
        if asked in shared:
            findings.add(Finding("shared-identity", frozenset(nodes)))
            continue
        # Which map a disk is in follows from what the kernel remembers, so a stale one proves nothing here.
        paths = nodes - stale
        outside = paths - map_of.keys()
        if len(paths) > 1 and len(outside) == len(paths):
            findings.add(Finding("lun-without-map", frozenset(outside)))
        elif len(paths) > 1:
            name = map_of[next(iter(paths - outside))]
            findings.update(Finding("path-missing", frozenset({node}), name) for node in outside)
    return findings


def reported_findings(verification: dict) -> list[Finding]:
    """What 'morvane-view verify --json' found. A stale disk's map is told, but the finding is about the disk."""
    about_a_map = {"mixed-map", "map-name", "path-missing"}
    return [
        Finding(
            finding["kind"],
            frozenset(path["device"] for path in finding["paths"]),
            finding["map"] if finding["kind"] in about_a_map else "",
        )
        for finding in verification["findings"]
    ]
