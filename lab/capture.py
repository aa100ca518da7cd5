#!/usr/bin/env python3
"""Turns what the laboratory's healthy stage left into descriptions of simulated hosts, for the tests.

usage: lab/capture.py build/lab/ARCH/out tests/hosts

Writes lab-fc, lab-iscsi and lab-direct: the same devices and answers, without the kernel behind them. Disks answer with
the bytes that sg3-utils read; iscsiadm's listing and /proc/partitions are as they were; what the HBA API library
answered is taken from the log of the run.
"""

import re
import sys
from pathlib import Path

import morvane_log
from reference import Reference

ORIGIN = """\
# Captured in the laboratory (docs/lab.md) with Debian 12's kernel {kernel}:
# {tools}.
# Written by lab/capture.py; do not edit.
"""
TOOLS = {
    "fc": "software FCoE ports and LIO targets seen through libhbaapi2 and libhbalinux2",
    "iscsi": "LIO targets and three sessions of open-iscsi 2.1.8",
    "direct": "disks on QEMU's host adapters and scsi_debug",
}
ABOUT = {
    "fc": "Eight LUNs of LIO on two fabrics, with NAA and T10 identifiers and an EMC disk without either",
    "iscsi": "Two IPv4 sessions and one over IPv6, two of them to one target, and a LUN without identifier",
    "direct": "A disk on each of QEMU's adapters: two without SCSI, one whose short transfers fail, two CD-ROMs",
}


def quoted(text: str) -> str:
    return '"' + text.replace("\\", "\\\\").replace('"', '\\"').replace("\t", "\\t").replace("\n", "\\n") + '"'


def lines(texts: list[str]) -> str:
    return "[\n" + "".join(f"    {quoted(text)},\n" for text in texts) + "]\n"


def disk(reference: Reference, device: str) -> str:
    """The [[disk]] with its answers in hex."""
    entry = f'\n[[disk]]\nnode = "{device}"\n'
    name = device.removeprefix("/dev/")
    if not reference.has_disk(device):
        return entry + 'faults = [{ errno = "ENOTTY" }] # no SCSI device\n'
    answers = [("standard", "inquiry"), ("0x80", "vpd80"), ("0x83", "vpd83")]
    raw = [f'{command} = "{data.hex()}"' for command, file in answers if (data := reference.raw(device, file))]
    entry += "raw = { " + ", ".join(raw) + " }\n"
    if status := re.search(r"Host_status=0x([0-9a-f]+)", reference.text(f"disks/{name}/inquiry36.txt")):
        entry += f"faults = [{{ host_status = {int(status[1], 16)} }}] # a transfer shorter than the buffer\n"
    return entry


def adapters(reference: Reference, log: str, report: morvane_log.Report) -> str:
    names = re.findall(r"^Adapter name: (.*)$", log, re.M)
    infos = re.findall(r"^Adapter info: Manufacturer (.*) Model (.*) NumPorts=1$", log, re.M)
    text = ""
    for name, (manufacturer, model), (wwnn, wwpn) in zip(names, infos, report.fc_ports, strict=True):
        text += f"\n[[adapter]]\nname = {quoted(name)}\nmanufacturer = {quoted(manufacturer)}\nmodel = {quoted(model)}\n"
        text += f'wwnn = "{wwnn}"\nports = ["{wwpn}"]\n'
        paths = [path for path in report.fc_paths if path.initiator_wwpn == wwpn]
        if paths:
            first = paths[0]
            luns = ", ".join(f'{{ device = "{path.device}", lun = {path.lun} }}' for path in paths)
            text += f'\n[[adapter.target]]\nwwnn = "{first.target_wwnn}"\nwwpn = "{first.target_wwpn}"\n'
            text += f"bus = {first.bus}\nid = {first.target}\nfcid = {first.fcid:#08x}\nluns = [{luns}]\n"
    return text


def host(kind: str, reference: Reference, log: str, report: morvane_log.Report, kernel: str) -> str:
    fc, iscsi = {path.device for path in report.fc_paths}, {path[4] for path in reference.iscsi_paths()}
    real = reference.real_devices()
    mine = {"fc": fc, "iscsi": iscsi, "direct": set(real) - fc - iscsi}[kind]
    others = set(real) - mine

    def kept(device: str) -> bool:
        return not any(re.fullmatch(rf"{other}p?\d*", device) for other in others)

    blocks = reference.block_devices()
    text = ORIGIN.format(kernel=kernel, tools=TOOLS[kind])
    text += f"about = {quoted(ABOUT[kind])}\nhostname = {quoted(reference.hostname())}\n\n"
    text += "sys_block = " + lines([link for name, link in blocks.items() if kept(f"/dev/{name}")])
    partitions = [
        line for line in reference.text("proc-partitions").splitlines()
        if not line.startswith(" ") or kept(f"/dev/{line.split()[3]}")
    ]
    text += "\n[files]\n" + '"/proc/partitions" = """\n' + "\n".join(partitions) + '\n"""\n'
    if kind != "fc":
        initiator = reference.text("initiatorname.iscsi")
        text += f'"/etc/iscsi/initiatorname.iscsi" = {quoted(initiator)}\n'
    text += "\n[fc]\n"
    if kind == "iscsi":
        listing = reference.text("iscsiadm-3")
        text += f'\n[commands]\n"/sbin/iscsiadm" = """\n{listing}"""\n'
    for device in sorted(mine):
        text += disk(reference, device)
    if kind == "fc":
        text += adapters(reference, log, report)
    return text


def main() -> None:
    place, hosts = Path(sys.argv[1]), Path(sys.argv[2])
    reference = Reference(place / "healthy" / "reference")
    log = (place / "healthy" / "Morvane.log").read_bytes().decode("latin-1")
    report = morvane_log.read(log)
    kernel = (place.parent / "kernel-version").read_text().strip()
    for kind in ABOUT:
        folder = hosts / f"lab-{kind}"
        folder.mkdir(parents=True, exist_ok=True)
        (folder / "host.toml").write_text(host(kind, reference, log, report, kernel))
        print(folder / "host.toml")


if __name__ == "__main__":
    main()
