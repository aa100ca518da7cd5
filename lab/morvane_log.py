"""Reads the report out of a Morvane log."""

import re
from dataclasses import dataclass, field

BAR = "================================================"
BANNERS = {
    "MULTIPATH": "\t\tCheck for Multipath software",
    "FC": "============== FC DEVICE DETAILS ===============",
    "ISCSI": "============= ISCSI DEVICE DETAILS =============",
    "DAS": "============== DAS DEVICE DETAILS ==============",
    "LOGICAL": "============ LOGICAL DEVICE DETAILS ============",
    "END": "\t\t\t   END ",
}
TRACE = re.compile(r"(?:Entered|Left) Function .+? Line \d+\n")  # a conversion operator's name has blanks
WWN = r"[0-9a-f]{2}(?::[0-9a-f]{2}){7}"


@dataclass(frozen=True)
class FcPath:
    """One LUN line, with the adapter, port and target lines above it."""

    adapter_wwnn: str
    initiator_wwpn: str
    target_wwnn: str
    target_wwpn: str
    bus: int
    target: int
    device: str
    identifier: str
    lun: int
    fcid: int
    fcplun: int


@dataclass(frozen=True)
class IscsiPath:
    initiator: str
    target: str
    initiator_port: str
    target_port: str
    device: str
    lun: int
    identifier: str


@dataclass
class Report:
    sections: dict[str, str]  # by the names of BANNERS, without trace lines
    fc_ports: list[tuple[str, str]] = field(default_factory=list)  # adapter WWNN and port WWPN
    fc_paths: list[FcPath] = field(default_factory=list)
    iscsi_paths: list[IscsiPath] = field(default_factory=list)
    das: list[tuple[str, str]] = field(default_factory=list)  # device and identifier
    not_supported: list[str] = field(default_factory=list)
    logical: list[tuple[str, str]] = field(default_factory=list)
    claimed: list[tuple[str, int]] = field(default_factory=list)  # device and tree type, in order of registration

    def claimed_by(self, tree_type: int) -> list[str]:
        return [device for device, claimant in self.claimed if claimant == tree_type]


def split_sections(text: str) -> dict[str, str]:
    positions = [(text.find(f"\n{BAR}\n{banner}\n{BAR}\n"), name, banner) for name, banner in BANNERS.items()]
    found = sorted(position for position in positions if position[0] >= 0)
    sections = {}
    for index, (start, name, banner) in enumerate(found):
        end = found[index + 1][0] if index + 1 < len(found) else len(text)
        sections[name] = text[start + len(BAR) * 2 + len(banner) + 4 : end]
    return sections


def read_fc_tree(report: Report, text: str) -> None:
    adapter = port = ""
    target: tuple[str, str, int, int] = ("", "", 0, 0)
    for line in text.splitlines():
        if match := re.fullmatch(rf"\|_ Adapter wwnn ({WWN})", line):
            adapter = match[1]
        elif match := re.fullmatch(rf"\|  \|_ Initiator wwpn ({WWN})", line):
            port = match[1]
            report.fc_ports.append((adapter, port))
        elif match := re.fullmatch(rf"\|  \|  \|_ Target wwnn ({WWN}) wwpn ({WWN}) bus (\d+) target# (\d+)", line):
            target = (match[1], match[2], int(match[3]), int(match[4]))
        elif match := re.fullmatch(
            r"\|  \|  \|  \|_ lun name (\S+) luid (.*) oslun (\d+) fcid (\d+) fcplun 0([0-9a-f]+)", line
        ):
            report.fc_paths.append(
                FcPath(adapter, port, *target, match[1], match[2], int(match[3]), int(match[4]), int(match[5], 16))
            )


def read(log: str) -> Report:
    text = TRACE.sub("", log)
    report = Report(split_sections(text))
    read_fc_tree(report, report.sections.get("FC", ""))
    for match in re.finditer(
        r"\|_ Initiator IQN  (\S+)\n"
        r"\|  \|_ Target IQN (\S+)\n"
        r"\|  \|  \|_ Initiator_IP/MAC <--------> Target_IP\n"
        r" {9}(\S+) <---> (\S+)\n"
        r"\|  \|  \|  \|_ Device_Name: (\S+) sScsiOSLun: (-?\d+) LunId: (.*)\n\n",
        report.sections.get("ISCSI", ""),
    ):
        report.iscsi_paths.append(IscsiPath(*match.group(1, 2, 3, 4, 5), int(match[6]), match[7]))
    das = report.sections.get("DAS", "")
    report.das = re.findall(r"\n--------> Device Name: \|(\S+)\| LunId: \|(.*)\|\n\n", das)
    report.not_supported = re.findall(r"\n--------> Device Name: \|(\S+)\| is not supported\n\n", das)
    logical = report.sections.get("LOGICAL", "")
    report.logical = re.findall(r"\n--------> Device Name: \|(\S+)\| LunId: \|(.*)\| \n", logical)
    report.claimed = [
        (device, int(tree_type, 16))
        for device, tree_type in re.findall(r"Added to DevMap \d+ --> (\S+) --> ([0-9a-f]+)\n", text)
    ]
    return report
