"""The hardware of the guest, as QEMU arguments. To add a disk, add a line to DISKS."""

import struct
from dataclasses import dataclass
from pathlib import Path

MEBIBYTE = 1024 * 1024


@dataclass(frozen=True)
class Machine:
    """The guest's computer: the program that emulates it, its console, and which of ADAPTERS, DISKS and network cards it
    can have."""

    qemu: str
    console: str
    options: tuple[str, ...] = ()
    lacks: tuple[str, ...] = ()  # names of buses and devices that QEMU or Debian's kernel does not have there
    network_card: str = "e1000"
    # The HBA library lists FC ports on PCI network cards only; to Linux a virtio card is none.
    lists_fc_ports: bool = True


MACHINES = {
    "amd64": Machine("qemu-system-x86_64", "ttyS0"),
    "i386": Machine("qemu-system-i386", "ttyS0"),
    "arm64": Machine(
        "qemu-system-aarch64", "ttyAMA0", ("-machine", "virt", "-cpu", "cortex-a57"), lacks=("ide", "pvscsi")
    ),
    "s390x": Machine(
        "qemu-system-s390x", "ttysclp0",
        lacks=("ide", "lsi", "megasas", "mptsas", "pvscsi", "ahci", "xhci", "uas", "nvme"), network_card="virtio-net-pci",
        lists_fc_ports=False,
    ),
}

# Host adapters: QEMU device and the bus name that DISKS uses.
ADAPTERS = [
    ("virtio-scsi-pci", "virtio"),
    ("lsi53c895a", "lsi"),
    ("megasas", "megasas"),
    ("mptsas1068", "mptsas"),
    ("pvscsi", "pvscsi"),
    ("ahci", "ahci"),
    ("qemu-xhci", "xhci"),
    ("usb-uas,bus=xhci.0", "uas"),
]

# Disks and drives: the QEMU device with its properties. A disk with wwn= has an NAA designator; without it, QEMU's SCSI
# disks have a vendor-specific designator only, and libata's a T10 one. "{drive}" is replaced by an image of 16 MiB.
DISKS = [
    "scsi-hd,bus=virtio.0,{drive},vendor=MORVANE,product=LAB-NAA,serial=VIRTIO-0,wwn=0x5000c50000000001",
    "scsi-hd,bus=virtio.0,{drive},vendor=MORVANE,product=LAB-PLAIN,serial=VIRTIO-1",
    "scsi-hd,bus=virtio.0,{drive},vendor=EMC,product=SYMMETRIX,serial=000190100123",
    "scsi-hd,bus=virtio.0,{drive},product=LAB-PORT,serial=VIRTIO-3,wwn=0x5000c50000000008,port_wwn=0x5000c50000000009",
    "scsi-hd,bus=virtio.0,{drive},serial=VIRTIO-4,wwn=0x5000c5000000000a",
    "scsi-hd,bus=lsi.0,{drive},serial=LSI-0,wwn=0x5000c50000000002",
    "scsi-hd,bus=megasas.0,{drive},serial=MEGASAS-0,wwn=0x5000c50000000003",
    "scsi-hd,bus=mptsas.0,{drive},serial=MPTSAS-0,wwn=0x5000c50000000004",
    "scsi-hd,bus=pvscsi.0,{drive},serial=PVSCSI-0,wwn=0x5000c50000000005",
    "ide-hd,bus=ide.0,{drive},serial=PIIX-0",
    "ide-cd,bus=ide.1",
    "ide-hd,bus=ahci.0,{drive},serial=AHCI-0,wwn=0x5000c50000000006",
    "ide-cd,bus=ahci.1",
    "usb-storage,bus=xhci.0,{drive},serial=USB-0",
    "scsi-hd,bus=uas.0,{drive},serial=UAS-0,wwn=0x5000c50000000007",
    "virtio-blk-pci,{drive},serial=VIRTIOBLK-0",
    "nvme,{drive},serial=NVME-0",
]

# Fibre Channel fabrics: each an Ethernet segment with an initiator's (01) and a target's (02) network card.
FABRICS = ["0a", "0b"]


def partitioned_image(path: Path) -> None:
    """Writes a disk image of 16 MiB with two partitions (an MBR with two primary entries)."""
    sectors = 16 * MEBIBYTE // 512
    first, second = (2048, 8192), (10240, sectors - 10240)
    table = b"".join(
        struct.pack("<B3sB3sII", 0, b"\0\2\0", 0x83, b"\0\0\0", start, count) for start, count in (first, second)
    )
    with path.open("wb") as image:
        image.write(b"\0" * 446 + table + b"\0" * 32 + b"\x55\xaa")
        image.truncate(16 * MEBIBYTE)


def disks(machine: Machine) -> list[str]:
    """Those of DISKS that the machine can have."""
    return [
        disk
        for disk in DISKS
        if not any(disk.startswith(f"{name},") or f",bus={name}." in disk for name in machine.lacks)
    ]


def qemu_arguments(machine: Machine, image: Path) -> list[str]:
    """The arguments that attach all of the above; every disk reads the same image and keeps what is written to itself."""
    arguments: list[str] = []
    for device, bus in ADAPTERS:
        if bus not in machine.lacks:
            arguments += ["-device", f"{device},id={bus}"]
    for index, disk in enumerate(disks(machine)):
        if "{drive}" in disk:
            arguments += ["-drive", f"if=none,id=drive{index},file={image},format=raw,snapshot=on"]
        arguments += ["-device", disk.format(drive=f"drive=drive{index}")]
    for hub, fabric in enumerate(FABRICS):
        for end in ("01", "02"):
            arguments += ["-netdev", f"hubport,id=fabric{fabric}-{end},hubid={hub}"]
            arguments += [
                "-device", f"{machine.network_card},netdev=fabric{fabric}-{end},mac=52:54:00:fa:{fabric}:{end},romfile=",
            ]
    return arguments
