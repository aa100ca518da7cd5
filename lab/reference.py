"""What the kernel, iscsiadm and sg3-utils said in the guest, read from the files that guest/collect.sh left."""

import re
from dataclasses import dataclass
from pathlib import Path


@dataclass(frozen=True)
class Designator:
    kind: str  # as sg_vpd names it
    text: str  # in Morvane's notation: binary as upper-case hex, text as it stands, without trailing blanks


# sg_vpd's names of the designator types, in Morvane's order of preference.
PREFERENCE = ["NAA", "T10 vendor identification", "EUI-64 based", "SCSI name string", "MD5 logical unit identifier"]


class Reference:
    def __init__(self, place: Path) -> None:
        self.place = place

    def text(self, name: str) -> str:
        path = self.place / name
        return path.read_text(errors="replace") if path.exists() else ""

    def hostname(self) -> str:
        return self.text("hostname").strip()

    def block_devices(self) -> dict[str, str]:
        """Names and link targets of /sys/block."""
        return dict(line.split(" ", 1) for line in self.text("sys-block").splitlines())

    def real_devices(self) -> list[str]:
        """The device nodes of /sys/block that are not virtual."""
        return [
            f"/dev/{name}"
            for name, link in self.block_devices().items()
            if not link.startswith("../devices/virtual/")
        ]

    def partitions(self) -> list[str]:
        """The device nodes of /proc/partitions."""
        lines = self.text("proc-partitions").splitlines()
        return [f"/dev/{line.split()[3]}" for line in lines if line.startswith(" ")]

    def attributes(self, file: str) -> dict[str, dict[str, str]]:
        """The attributes of a sysfs class: object name, attribute name, value."""
        objects: dict[str, dict[str, str]] = {}
        for line in self.text(file).splitlines():
            path, _, value = line.partition(":0x") if ":0x" in line else ("", "", "")
            if match := re.fullmatch(r"/sys/class/\w+/([^/]+)/+(\w+)", path):
                objects.setdefault(match[1], {})[match[2]] = value.strip()
        return objects

    def fc_hosts(self) -> dict[str, dict[str, str]]:
        return self.attributes("fc-hosts")

    def fc_paths(self) -> set[tuple]:
        """Every SCSI disk behind an FC remote port: initiator's WWNN and WWPN, target's WWNN and WWPN, bus, target
        number, device node, LUN, target's port identifier."""
        hosts, targets = self.fc_hosts(), self.attributes("fc-targets")
        paths = set()
        for name, link in self.block_devices().items():
            match = re.search(r"/rport-\d+:\d+-\d+/(target(\d+):(\d+):(\d+))/\d+:\d+:\d+:(\d+)/", link)
            if match:
                host, target = hosts[f"host{match[2]}"], targets[match[1]]
                paths.add(
                    (
                        wwn(host["node_name"]), wwn(host["port_name"]),
                        wwn(target["node_name"]), wwn(target["port_name"]),
                        int(match[2]), int(match[4]), f"/dev/{name}", int(match[5]), int(target["port_id"], 16),
                    )
                )
        return paths

    def iscsi_paths(self) -> set[tuple]:
        """Every disk of iscsiadm's listing: initiator, target, interface address and portal address, each address up to
        its first colon, device node, LUN."""
        paths = set()
        initiator = self.text("initiatorname.iscsi").strip().removeprefix("InitiatorName=")
        target = portal = address = ""
        lun = -1
        for line in self.text("iscsiadm-3").splitlines():
            key, _, value = line.strip().partition(": ")
            if key == "Target":
                target = value.split()[0]
            elif key == "Current Portal":
                portal = value.split(":")[0]
            elif key == "Iface IPaddress":
                address = value.split(":")[0]
            elif match := re.search(r"Lun: (\d+)", line):
                lun = int(match[1])
            elif match := re.search(r"Attached scsi disk (\S+)", line):
                paths.add((initiator, target, address, portal, f"/dev/{match[1]}", lun))
        return paths

    # ---- one disk

    def disk(self, device: str) -> Path:
        return self.place / "disks" / device.removeprefix("/dev/")

    def raw(self, device: str, name: str) -> bytes:
        path = self.disk(device) / name
        return path.read_bytes() if path.exists() else b""

    def has_disk(self, device: str) -> bool:
        return self.disk(device).exists()

    def designators(self, device: str) -> list[Designator]:
        """The designators of the logical unit that 'sg_vpd -p di' shows."""
        path = self.disk(device) / "vpd83.txt"
        lines = path.read_text(errors="replace").splitlines() if path.exists() else []
        designators: list[Designator] = []
        in_logical_unit = False
        kind = vendor = ""
        for line in lines:
            stripped = line.strip()
            if re.fullmatch(r"  \S.*:", line):
                in_logical_unit = stripped == "Addressed logical unit:"
            elif not in_logical_unit:
                continue
            elif match := re.match(r"designator type: (.*?)(?: \[0x\w+\])?,  code set: (\w+)", stripped):
                kind = match[1]
            elif stripped.startswith("vendor id: "):
                vendor = line.split("vendor id: ", 1)[1]
            elif stripped.startswith("vendor specific: "):
                text = line.split("vendor specific: ", 1)[1]
                designators.append(Designator(kind, ((vendor if kind.startswith("T10") else "") + text).rstrip(" ")))
            elif match := re.fullmatch(r"0x([0-9a-f]+)", stripped):
                designators.append(Designator(kind, match[1].upper()))
            elif kind == "SCSI name string" and not stripped.startswith("SCSI name string"):
                designators.append(Designator(kind, stripped))
        return designators


@dataclass(frozen=True)
class Outcome:
    """What a run must make of a disk, and why."""

    identifier: str | None  # None: there is none to be had
    reason: str
    supported: bool = True


def wwn(value: str) -> str:
    """Sysfs's hexadecimal number as eight bytes with colons."""
    digits = value.removeprefix("0x").zfill(16)
    return ":".join(digits[index : index + 2] for index in range(0, 16, 2))


def expected_identifier(reference: Reference, device: str) -> Outcome:
    """The identifier that follows from what sg3-utils read from the disk."""
    inquiry = reference.raw(device, "inquiry36")
    if reference.text(f"disks/{device.removeprefix('/dev/')}/inquiry36.status").strip() != "0" or len(inquiry) < 36:
        return Outcome(None, "answers no INQUIRY")
    if inquiry[0] & 0x1F not in (0x00, 0x0C):
        return Outcome(None, f"peripheral device type {inquiry[0] & 0x1F}", supported=False)
    designators = reference.designators(device)
    for kind in PREFERENCE:
        # The walk ends at the first NAA designator; of the other kinds the last one counts.
        candidates = [designator.text for designator in designators if designator.kind == kind]
        if candidates:
            return Outcome(candidates[0 if kind == "NAA" else -1], kind)
    vendor, product, revision = (inquiry[a:b].decode("latin-1").rstrip(" ") for a, b in ((8, 16), (16, 32), (32, 36)))
    if vendor == "EMC":
        page = reference.raw(device, "vpd83").ljust(20, b"\0")
        return Outcome(page[4:20].hex().upper(), "bytes 4 to 19 of VPD page 0x83")
    if inquiry[4] > 31:
        # The bytes after the 36 that were asked for are zero, so the last part is empty.
        return Outcome(f"{vendor}:{product}:{revision}:", "standard INQUIRY data")
    return Outcome(None, "no designator, 36 bytes of INQUIRY data")
