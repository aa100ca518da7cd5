#!/usr/bin/env python3
"""Compares what Morvane reported in the laboratory with what the trusted tools said there.

usage: lab/judge.py build/lab/ARCH/out MORVANE-VIEW

Device names change from boot to boot, but within one stage of one boot a name means the same disk to Morvane and to the
tools; that is the only place where names are compared. Exit status 1 if anything differs.
"""

import json
import re
import subprocess
import sys
import tempfile
from collections import Counter, defaultdict
from pathlib import Path
from statistics import median

import devices
import identity
import morvane_log
from morvane_log import Report
from reference import PREFERENCE, Reference, expected_identifier, wwn

TREE_FC, TREE_DAS, TREE_ISCSI = 1, 2, 4
OTHER = {"amd64": "i386", "i386": "amd64"}
ACCEPTED_SCALE_RATIO = 5.0


class Sheet:
    """The judge's tables: a row for each thing compared."""

    def __init__(self) -> None:
        self.mismatches = 0
        self.rows = 0

    def title(self, text: str) -> None:
        print(f"\n{text}\n{'-' * len(text)}")

    def row(self, what: str, holds: bool, detail: str = "") -> None:
        self.rows += 1
        self.mismatches += not holds
        print(f"  {'ok      ' if holds else 'MISMATCH'}  {what:<58}  {detail}".rstrip())

    def same(self, what: str, expected: set, found: set, detail: str = "") -> None:
        """A row for two sets, followed by what only one of them has."""
        self.row(what, expected == found, detail or f"{len(found)}")
        for side, items in (("only the tools", expected - found), ("only Morvane", found - expected)):
            for item in sorted(items, key=str):
                print(f"            {side}: {item}")


class Stage:
    """One run of Morvane: its report, the tools' answers, the facts of the fault."""

    def __init__(self, place: Path) -> None:
        def left(file: str, otherwise: str = "") -> str:
            """What the guest left; a run that went wrong may have left less, and must still be judged."""
            path = place / file
            return path.read_bytes().decode("latin-1") if path.exists() else otherwise

        self.place = place
        self.name = place.name
        self.lists_fc_ports = devices.MACHINES[place.parent.parent.name].lists_fc_ports
        self.log = left("Morvane.log")
        self.report: Report = morvane_log.read(self.log)
        self.reference = Reference(place / "reference")
        self.stdout = left("stdout")
        self.status = int(left("status", "-1"))
        self.seconds = float(left("ended", "0")) - float(left("started", "0"))
        self.facts = defaultdict(str, (line.split("=", 1) for line in left("facts").splitlines()))


def ran_to_its_end(stage: Stage) -> bool:
    # The HBA library may print lines of its own on standard output before Morvane's.
    return (
        stage.status == 0
        and stage.stdout.endswith("Test completed.\n")
        and list(stage.report.sections) == list(morvane_log.BANNERS)
        and stage.report.sections["END"] == ""
    )


def trees_are_whole(stage: Stage) -> bool:
    # Without an adapter the FC tree ends so, and at once.
    expected = [] if stage.lists_fc_ports else ["FC tree: There are no adapters on the system"]
    return re.findall(r"Caught exception while building (.*)\n", stage.log) == expected


def judge_accounting(sheet: Sheet, stage: Stage) -> None:
    """Every real block device and every partition is accounted for exactly once."""
    report, reference = stage.report, stage.reference
    earlier = set(report.claimed_by(TREE_FC)) | set(report.claimed_by(TREE_ISCSI))
    mentioned = Counter([device for device, _ in report.das] + report.not_supported)
    sheet.same(
        "real devices that no earlier tree claimed: DAS has each",
        set(reference.real_devices()) - earlier,
        set(mentioned),
    )
    sheet.row(
        "every line of DAS and LOGICAL has its form",
        stage.log.count("--------> Device Name: ")
        == len(report.das) + len(report.not_supported) + len(report.logical),
    )
    sheet.row("DAS has none twice", all(count == 1 for count in mentioned.values()))
    sheet.row(
        "claimed for the DAS tree: what it reports",
        set(report.claimed_by(TREE_DAS)) == {device for device, _ in report.das},
    )
    claimed = earlier | {device for device, _ in report.das}
    logical = Counter(device for device, _ in report.logical)
    sheet.same(
        "/proc/partitions less what was claimed: LOGICAL has each",
        set(reference.partitions()) - claimed,
        set(logical),
        f"{len(reference.partitions())} lines, {len(logical)} logical",
    )
    sheet.row("LOGICAL has none twice", all(count == 1 for count in logical.values()))
    host = reference.hostname()
    sheet.row(
        "logical identifiers: host name and device",
        all(identifier == f"{host} :: {device}" for device, identifier in report.logical),
    )


def judge_fc(sheet: Sheet, stage: Stage) -> None:
    report, reference = stage.report, stage.reference
    hosts = {(wwn(host["node_name"]), wwn(host["port_name"])) for host in reference.fc_hosts().values()}
    sheet.title("Fibre Channel")
    sheet.same("adapters and ports: WWNN and WWPN as in sysfs", hosts, set(report.fc_ports))
    sheet.row("at least 4 ports", len(report.fc_ports) >= 4, f"{len(report.fc_ports)}")
    fabrics = {(path.initiator_wwpn, path.target_wwpn) for path in report.fc_paths}
    sheet.row("two fabrics", len(fabrics) == 2, ", ".join(" > ".join(fabric) for fabric in sorted(fabrics)))
    sheet.row("at least 16 LUN paths", len(report.fc_paths) >= 16, f"{len(report.fc_paths)}")
    sheet.same(
        "paths: ports, bus, target, device, LUN, FCID as in sysfs",
        reference.fc_paths(),
        {
            (
                path.adapter_wwnn, path.initiator_wwpn, path.target_wwnn, path.target_wwpn,
                path.bus, path.target, path.device, path.lun, path.fcid,
            )
            for path in report.fc_paths
        },
    )
    sheet.row("every LUN line has its form", stage.log.count("|_ lun name ") == len(report.fc_paths))
    sheet.row("FCP LUN is the LUN", all(path.fcplun == path.lun for path in report.fc_paths))
    sheet.same(
        "claimed for the FC tree: the devices of these paths",
        {path[6] for path in reference.fc_paths()},
        set(report.claimed_by(TREE_FC)),
    )
    for path in sorted(report.fc_paths, key=lambda path: (path.initiator_wwpn, path.lun)):
        expected = expected_identifier(reference, path.device)
        sheet.row(
            f"{path.initiator_wwpn} LUN {path.lun}: {expected.reason}",
            path.identifier == expected.identifier,
            path.identifier if path.identifier == expected.identifier else f"{path.identifier} not {expected.identifier}",
        )
    by_lun: dict[int, set[str]] = {}
    for path in report.fc_paths:
        by_lun.setdefault(path.lun, set()).add(path.identifier)
    sheet.row(
        "one LUN has one identifier on both fabrics, and no other's",
        all(len(identifiers) == 1 for identifiers in by_lun.values())
        and len({identifier for identifiers in by_lun.values() for identifier in identifiers}) == len(by_lun),
        f"{len(by_lun)} LUNs",
    )


def judge_unlisted_fc(sheet: Sheet, stage: Stage) -> None:
    """The HBA library lists no port of this machine: its LUNs are disks like any others."""
    sheet.title("Fibre Channel, of which the HBA library lists no port")
    sheet.row("an adapter is missed", "The system does not have any adapters\n" in stage.log and not stage.report.fc_ports)
    paths = {path[6] for path in stage.reference.fc_paths()}
    sheet.row("at least 16 LUN paths", len(paths) >= 16, f"{len(paths)}")
    sheet.same("DAS has each", paths, paths & {device for device, _ in stage.report.das})


def judge_iscsi(sheet: Sheet, stage: Stage) -> None:
    report, reference = stage.report, stage.reference
    sheet.title("iSCSI")
    expected = reference.iscsi_paths()
    sessions = {path[2:4] for path in expected}
    sheet.row("sessions: two over IPv4, one over IPv6", sorted("." in portal for _, portal in sessions) == [False, True, True])
    sheet.same(
        "paths: initiator, target, addresses, device, LUN",
        expected,
        {
            (path.initiator, path.target, path.initiator_port, path.target_port, path.device, path.lun)
            for path in report.iscsi_paths
        },
    )
    sheet.row("every path has its form", stage.log.count("|_ Device_Name: ") == len(report.iscsi_paths))
    sheet.row("no path twice", len(report.iscsi_paths) == len(set(report.iscsi_paths)))
    sheet.same("claimed for the iSCSI tree", {path[4] for path in expected}, set(report.claimed_by(TREE_ISCSI)))
    for path in sorted(report.iscsi_paths, key=lambda path: (path.target, path.target_port, path.lun)):
        outcome = expected_identifier(reference, path.device)
        identifier = outcome.identifier or ":-( SCSI_Inquiry_Failed"
        sheet.row(
            f"{path.target} {path.target_port} LUN {path.lun}: {outcome.reason}",
            path.identifier == identifier,
            path.identifier if path.identifier == identifier else f"{path.identifier} not {identifier}",
        )


def judge_direct(sheet: Sheet, stage: Stage) -> None:
    report, reference = stage.report, stage.reference
    sheet.title("Direct disks and logical devices")
    judge_accounting(sheet, stage)
    host = reference.hostname()
    for device, identifier in sorted(report.das):
        outcome = expected_identifier(reference, device)
        # A direct disk without a designator of these kinds is named after the host, not after its INQUIRY data.
        expected = outcome.identifier if outcome.reason in PREFERENCE else f"{host}::{device}"
        sheet.row(
            f"{describe(reference, device)}: {outcome.reason}",
            outcome.supported and identifier == expected,
            identifier if identifier == expected else f"{identifier} not {expected}",
        )
    for device in sorted(report.not_supported):
        outcome = expected_identifier(reference, device)
        sheet.row(f"{describe(reference, device)}: {outcome.reason}", not outcome.supported, "not supported")


def describe(reference: Reference, device: str) -> str:
    inquiry = reference.raw(device, "inquiry")
    name = inquiry[8:32].decode("latin-1").split() if len(inquiry) >= 32 else []
    return " ".join([device, *name])


# ---- faults


def faults_lun_offline(stage: Stage) -> list[tuple[str, bool]]:
    fc, direct = stage.facts["fc"], stage.facts["direct"]
    healthy = {path[6] for path in stage.reference.fc_paths()} - {fc}
    named = {path.device for path in stage.report.fc_paths}
    return [
        ("FC: both documented lines for the LUN", all(
            line in stage.log
            for line in (
                f"Cannot do Scsi Inquiry on {fc} - No such device or address\n",
                f"Failed in getting the uniqueLunId for device {fc} ignoring\n",
            )
        ) and re.search(rf"Failed in getting the VendorId for device {fc} Lun \d+ Under Target [0-9a-f:]+ ignoring\n", stage.log) is not None),
        # A skipped LUN leaves a hole in the adapter's table; the printer stops that many entries early.
        ("FC: not reported; at most one other path missing", fc not in named and len(healthy - named) <= 1),
        ("DAS: direct disk not supported", direct in stage.report.not_supported
         and (stage.lists_fc_ports or fc in stage.report.not_supported)),
    ]


def faults_lun_without_identifier(stage: Stage) -> list[tuple[str, bool]]:
    fc = stage.facts["fc"]
    lost = {path[1] for path in stage.reference.fc_paths() if path[6] == fc}
    seen = {path.initiator_wwpn for path in stage.report.fc_paths}
    return [
        ("FC: documented lines", "No bytes for undocumented ID\n" in stage.log
         and "Unexpected Malformed Std Inquiry Data\n" in stage.log
         and stage.log.count("Exception occured while opening adapter: ") == 1),
        ("FC: this adapter's tree is given up, the other's is whole",
         not lost & seen and len(stage.report.fc_paths) == 8),
    ]


def faults_command_lost(stage: Stage) -> list[tuple[str, bool]]:
    direct, host = stage.facts["direct"], stage.reference.hostname()
    # Over FC the initiator's own recovery may answer for the target before Morvane's 10 s are over.
    given_up = re.findall(r"(?:SCSI Error for|Time-out in Getting) Std Inquiry Data\n", stage.log)
    return [
        (f"FC: adapters given up: {', '.join(sorted({line.strip() for line in given_up}))}",
         len(given_up) >= 2 and stage.log.count("Exception occured while opening adapter: ") == 2
         and not stage.report.fc_paths),
        ("DAS: time-outs, host name as identifier",
         "Time-out in Reading VPD 0x83 Page\n" in stage.log and (direct, f"{host}::{direct}") in stage.report.das),
    ]


def faults_link_down(stage: Stage) -> list[tuple[str, bool]]:
    adapter, port = stage.facts["adapter"], stage.facts["port"]
    left = [path for path in stage.report.fc_paths if path.initiator_wwpn == port]
    # The command that meets the fault decides: standard INQUIRY gives the adapter up, page 0x83 only the LUN.
    given_up = f"Exception occured while opening adapter: {adapter}\n" in stage.log
    ignored = len(re.findall(r"Failed in getting the uniqueLunId for device \S+ ignoring\n", stage.log))
    outcome = f"tree given up after {ignored} LUNs" if given_up else f"{ignored} LUNs ignored"
    return [
        (f"FC: the adapter without link: {outcome}", given_up and not left or ignored > 0 and len(left) <= 8 - ignored),
        ("FC: the other adapter's tree is whole", len(stage.report.fc_paths) == len(left) + 8),
    ]


def faults_iscsi_target_gone(stage: Stage) -> list[tuple[str, bool]]:
    target = stage.facts["target"]
    gone = [path for path in stage.report.iscsi_paths if path.target == target]
    other = [path for path in stage.report.iscsi_paths if path.target != target]
    return [
        ("iSCSI: its disks are listed without identifier",
         len(gone) == 6 and all(path.identifier == ":-( SCSI_Inquiry_Failed" for path in gone)),
        ("iSCSI: the other target's disks are whole", len(other) == 3
         and sum(path.identifier == ":-( SCSI_Inquiry_Failed" for path in other) == 1),
    ]


# Stage, seconds that the run may take, what must be seen. The seconds are those of the time-outs that the fault meets
# (10 s a command, 5 s for an iSCSI session, 2 s for an FC port), and as much again for a loaded machine.
FAULTS = {
    "lun-offline": (20, faults_lun_offline),
    "lun-without-identifier": (20, faults_lun_without_identifier),
    "command-lost": (90, faults_command_lost),
    "link-down": (60, faults_link_down),
    "iscsi-target-gone": (60, faults_iscsi_target_gone),
}


def judge_fault(sheet: Sheet, stage: Stage) -> list[str]:
    """Judges one fault; gives its lines for the table of faults and outcomes."""
    limit, outcomes_of = FAULTS[stage.name]
    outcomes = [
        (what, holds) for what, holds in outcomes_of(stage) if stage.lists_fc_ports or not what.startswith("FC: ")
    ]
    sheet.title(f"Fault: {stage.name}")
    sheet.row("the run ends, within the limit", ran_to_its_end(stage) and stage.seconds <= limit,
              f"{stage.seconds:.1f} s of {limit} s")
    for what, holds in outcomes:
        sheet.row(what, holds)
    sheet.row("no tree is cut short", trees_are_whole(stage))
    judge_accounting(sheet, stage)
    lines = [what if holds else f"NOT {what}" for what, holds in outcomes]
    return [f"  {stage.name:<24}{stage.seconds:6.1f} s  {lines[0]}", *(f"{'':36}{line}" for line in lines[1:])]


# ---- identity: the devices, the kernel's memory of them, multipath's


# Stage, and how many findings of each kind its fault must lead to.
IDENTITY = {
    "identity-healthy": {},
    "stale-identity": {"stale-identity": 4, "map-name": 2},
    "mixed-map": {"stale-identity": 2, "mixed-map": 2},
    "path-missing": {"path-missing": 1},
    "snapshot": {"shared-identity": 1},
}


def logged_names(stage: Stage, view: str) -> dict[str, dict]:
    """The names that 'morvane-view --json' gives each device of the log that has a page 0x83 there."""
    document = json.loads(subprocess.run([view, "--json", stage.place / "Morvane.log"], capture_output=True).stdout)
    names = {device: lun["names"] for lun in document["luns"] for device in lun["devices"]}
    names.update((disk["device"], disk["names"]) for disk in document["direct"]["devices"])
    return {device: given for device, given in names.items() if given}


def judge_names(sheet: Sheet, stage: Stage, view: str) -> None:
    """Every name that follows from a page of the log is the one that the tool itself gives the disk."""
    disks = identity.disks(stage.reference)
    wwids = dict(line.split("|", 1) for line in stage.reference.text("multipath-paths").splitlines())
    for device, given in sorted(logged_names(stage, view).items()):
        disk = disks[device]
        if given["scsiId"] is None and disk.asked.startswith("0"):
            # The log of a direct disk is read without vendor and product, which are half of such a name.
            print(f"            {device} has vendor specific designators alone, by which a direct disk gets no name: {disk.asked}")
            continue
        # What udev makes of the serial number's page and of ATA IDENTIFY, a log does not tell.
        links = {link for link in disk.links if re.match("wwn-|scsi-[1-9]", link)}
        # Of the LUNs that multipath looks at it takes udev's name, where ATA IDENTIFY gives none.
        wwid = wwids.get(device.removeprefix("/dev/"), "")
        compared = {
            "scsi_id": (given["scsiId"], disk.asked),
            "kernel": (given["kernel"] or "", disk.wwid),
            "udev": (sorted(links & set(given["links"])), sorted(links)),
        }
        if wwid and f"ata-{wwid}" not in disk.links:
            compared["multipath"] = (re.sub(r"\s+", "_", (given["multipath"] or given["scsiId"]).rstrip()), wwid)
        sheet.row(f"{device}: named as by {', '.join(compared)}", all(ours == theirs for ours, theirs in compared.values()),
                  disk.asked)
        for tool, (ours, theirs) in compared.items():
            if ours != theirs:
                print(f"            {tool}: {ours!r} not {theirs!r}")


def judge_verify(sheet: Sheet, stage: Stage, view: str) -> None:
    """What verify said in the guest is what follows from the tools' answers, and so it is of the recording made there."""
    expected = identity.expected_findings(stage.reference)
    planted = Counter(IDENTITY[stage.name])
    hit = {f"/dev/{disk}" for disk in stage.facts["disks"].split()}
    maps = identity.maps(stage.reference)
    sheet.row(
        "by the tools: what was planted, on the disks that were hit",
        Counter(finding.kind for finding in expected) == planted
        and hit == {disk for finding in expected if finding.kind not in ("mixed-map", "map-name") for disk in finding.disks},
        ", ".join(f"{count} {kind}" for kind, count in sorted(planted.items())) or "nothing",
    )
    with tempfile.TemporaryDirectory() as folder:
        subprocess.run(["tar", "-xf", stage.place / "recording.tar", "-C", folder], check=True)
        root = f"{folder}/recording"
        there = subprocess.run([view, "verify", "--json", "--root", root], capture_output=True, text=True)
    said = (stage.place / "verify.json").read_text()
    status = int((stage.place / "verify.status").read_text())
    sheet.row("verify: the same in the guest and of its recording", (said, status) == (there.stdout, there.returncode),
              f"{len(said)} bytes, status {status}")
    if status == 2:
        sheet.row("verify: no trouble", False, (stage.place / "verify.stderr").read_text().strip())
        return
    document = json.loads(said)
    found = identity.reported_findings(document)
    sheet.same("verify: what differs by the tools, and nothing else", expected, set(found))
    sheet.row("verify: nothing twice; status 0 if all agree, else 1",
              len(found) == len(set(found)) and status == bool(expected))
    compared = document["compared"]
    known = [disk for disk in identity.disks(stage.reference).values() if disk.wwid]
    sheet.row("verify: every disk that has a wwid was compared, and every map",
              compared["byPage83"] + compared["byWwid"] >= len(known)
              and compared["maps"] == compared["listedMaps"] == len(maps),
              f"{compared['byPage83']} by page, {compared['byWwid']} by wwid, {compared['maps']} maps")


def judge_identity(sheet: Sheet, stage: Stage, view: str) -> None:
    sheet.title(f"Identity: {stage.name}")
    sheet.row("the run ends", ran_to_its_end(stage), f"{stage.seconds:.1f} s")
    judge_accounting(sheet, stage)
    judge_verify(sheet, stage, view)
    if not IDENTITY[stage.name]:
        judge_names(sheet, stage, view)


# ---- morvane-view, scale and word sizes


def judge_view(sheet: Sheet, place: Path, view: str) -> None:
    """morvane-view, which shares no code with this judge, reads every stage's log as the judge does."""
    sheet.title("morvane-view")
    for log in sorted(place.glob("*/Morvane.log")):
        read = subprocess.run([view, "--json", log], capture_output=True)
        if read.returncode != 0:
            sheet.row(f"{log.parent.name}: reads the log", False, read.stderr.decode(errors="replace").strip())
            continue
        document = json.loads(read.stdout)
        report = Stage(log.parent).report
        fc = {(path["initiator"], path["targetPort"], path["device"], path["lun"], path["identifier"])
              for path in document["fc"]["paths"]}
        iscsi = {(path["initiatorPort"], path["targetIqn"], path["targetAddress"], path["device"], path["lun"])
                 for path in document["iscsi"]["paths"]}
        same = (
            fc == {(path.initiator_wwpn, path.target_wwpn, path.device, path.lun, path.identifier) for path in report.fc_paths}
            and iscsi == {(path.initiator_port, path.target, path.target_port, path.device, path.lun)
                          for path in report.iscsi_paths}
            and [(disk["device"], disk["identifier"]) for disk in document["direct"]["devices"]] == report.das
            and document["logical"]["devices"] == [device for device, _ in report.logical]
        )
        unknown = document["log"]["unknown"]
        sheet.row(f"{log.parent.name}: the same paths and devices, no text unknown, the log whole",
                  same and unknown["count"] == 0 and document["log"]["complete"],
                  f"{len(fc)} FC, {len(iscsi)} iSCSI, {len(report.das)} direct, {document['log']['texts']} texts"
                  + "".join(f"; unknown: {sample['text']}" for sample in unknown["samples"]))


def judge_scale(sheet: Sheet, place: Path) -> None:
    sheet.title("Scale")
    stage = Stage(place)
    measured: dict[str, list[float]] = {}
    for line in (place / "times").read_text().splitlines():
        name, start, end = line.split()
        measured.setdefault(name, []).append(float(end) - float(start))
    times = {name: median(seconds) for name, seconds in measured.items()}
    # What the loop has to do with: two commands on each disk.
    asked, designators = (int((place / name).read_text()) for name in ("sg3-disks", "sg3-designators"))
    loop = times["sg3-loop"] * 1000 / asked
    disks = [identifier for _, identifier in stage.report.das if identifier.startswith("Linux   scsi_debug")]
    # The first disk of scsi_debug is a LUN on both fabrics too; where no FC port is listed these are direct disks.
    again = 0 if stage.lists_fc_ports else 2
    runs = ", ".join(f"{seconds:.1f}" for seconds in measured["morvane"])
    sheet.row("the run ends", ran_to_its_end(stage), f"{runs} s; the median counts")
    sheet.row("1,000 disks of scsi_debug beside the others, no two alike",
              len(disks) == 1001 + again and len(set(disks)) == 1001, f"{len(set(disks))} of {len(stage.report.das)} direct disks")
    judge_accounting(sheet, stage)
    ratio = loop / times["morvane"]
    sheet.row(
        f"shell loop of sg_inq and sg_vpd: at least {ACCEPTED_SCALE_RATIO:.0f} times Morvane's time",
        ratio >= ACCEPTED_SCALE_RATIO and designators >= asked,
        f"{loop:.1f} s by {asked} of the disks, {ratio:.1f} times",
    )
    print(f"            for comparison: lsscsi -i, which sends no command, {times['lsscsi']:.1f} s, "
          f"{times['lsscsi'] / times['morvane']:.2f} times")


def judge_simulated_hosts(sheet: Sheet, place: Path) -> None:
    """What the test program of the simulated hosts said of each."""
    sheet.title("Simulated hosts")
    hosts = Path(__file__).resolve().parent.parent / "tests" / "hosts"
    reported = re.findall(r"^\[       OK \] Hosts/SimulatedHost\.isReportedAsExpected/(\w+)", (place / "tests").read_text(), re.M)
    sheet.same(
        "on this kernel: log, record, output and status as expected",
        {host.parent.name for host in hosts.glob("*/host.toml")},
        {name.replace("_", "-") for name in reported},
    )


def comparable(stage: Stage) -> set[tuple]:
    """The report without what changes from boot to boot: device names, host numbers and their order."""
    report = stage.report

    def without_device(identifier: str) -> str:
        return re.sub(r"/dev/\S+", "DEVICE", identifier)

    return (
        {("FC port", *port) for port in report.fc_ports}
        | {("FC", path.initiator_wwpn, path.target_wwpn, path.lun, path.fcid, path.identifier) for path in report.fc_paths}
        | {("iSCSI", path.initiator_port, path.target_port, path.target, path.lun, path.identifier) for path in report.iscsi_paths}
        | {("DAS", identifier) for _, identifier in report.das if "::" not in identifier}
        | {("counts", "DAS named after the host", sum("::" in identifier for _, identifier in report.das))}
        | {("counts", "not supported", len(report.not_supported)), ("counts", "logical", len(report.logical))}
    )


def judge_word_sizes(sheet: Sheet, arch: str, healthy: Stage, place: Path) -> None:
    sheet.title("Word sizes")
    other_place = place.parent.parent / OTHER[arch] / "out"
    complete = [out for out in (place, other_place) if (out / "done").exists() and (out / "setup").exists()]
    setups = [(out / "setup").read_text() for out in complete]
    if len(setups) != 2 or setups[0] != setups[1]:
        print(f"  not compared: no run of {OTHER[arch]} with this set-up; './dev lab {OTHER[arch]}' makes one")
        return
    other = Stage(other_place / "healthy")
    sheet.same(f"{arch} and {OTHER[arch]} report the same", comparable(other), comparable(healthy))


def main() -> int:
    place = Path(sys.argv[1]).resolve()
    arch = place.parent.name
    sheet = Sheet()
    healthy = Stage(place / "healthy")
    sheet.title("Healthy storage")
    sheet.row("the run ends", ran_to_its_end(healthy), f"{healthy.seconds:.1f} s")
    sheet.row("no tree is cut short", trees_are_whole(healthy))
    (judge_fc if healthy.lists_fc_ports else judge_unlisted_fc)(sheet, healthy)
    judge_iscsi(sheet, healthy)
    judge_direct(sheet, healthy)
    table = [line for name in FAULTS if (place / name).exists() for line in judge_fault(sheet, Stage(place / name))]
    if table:
        sheet.title("Faults and outcomes")
        print("\n".join(table))
    for name in IDENTITY:
        if (place / name).exists():
            judge_identity(sheet, Stage(place / name), sys.argv[2])
    if (place / "scale").exists():
        judge_scale(sheet, place / "scale")
    if (place / "hosts").exists():
        judge_simulated_hosts(sheet, place / "hosts")
    judge_view(sheet, place, sys.argv[2])
    if arch in OTHER:
        judge_word_sizes(sheet, arch, healthy, place)
    print(f"\nlab {arch}: {sheet.rows} compared, {sheet.mismatches} mismatches")
    return 1 if sheet.mismatches else 0


if __name__ == "__main__":
    sys.exit(main())
