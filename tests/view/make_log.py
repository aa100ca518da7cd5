#!/usr/bin/python3
"""Writes logs as Morvane writes them, for hosts that are described here: whole texts in their order, trace lines,
dumps and missing line ends included. Used where a log of a simulated host is too small or too healthy."""

import sys

RULE = "================================================\n"


class Log:
    def __init__(self, host):
        self.host = host
        self.parts = []
        self.claimed = set()

    def add(self, text):
        self.parts.append(text)

    def enter(self, function, line=10):
        self.add(f"Entered Function {function} Line {line}\n")

    def leave(self, function, line=20):
        self.add(f"Left Function {function} Line {line}\n")

    def banner(self, text):
        self.add("\n" + RULE + text + "\n" + RULE)

    def bytes(self):
        return "".join(self.parts).encode("utf-8", "surrogateescape")

    # Multipath ------------------------------------------------------------------------------------------------

    def multipath(self, devices=None, daemon_lines=0):
        self.add("\n" + RULE)
        self.add("\t\tCheck for Multipath software\n")
        self.add(RULE)
        self.add("Checking the powerpath\n")
        self.enter("sense")
        self.add("Checking if emcpd is running\n")
        self.enter("sExecuteCommand")
        self.add("Calling popen\n")
        lines = [f"{1000 + i} emcpd" for i in range(daemon_lines)]
        if lines:
            self.add("Buffer got = " + "\n".join(lines) + "\n\n")
            self.enter("sBreakOutput")
            for line in lines:
                self.add("Line: " + line)
            self.add("End of popened Buffer\n")
            self.leave("sBreakOutput")
        self.add("Fread returned ERROR\n")
        self.add(f"Number of lines in output: {len(lines)}\n")
        self.leave("sExecuteCommand")
        self.leave("sense")
        if devices is None:
            self.add("PowerPath is not Running\n")
            return
        self.enter("printData")
        self.add("PowerPath Data : Ulid  Pseudo Name\n")
        for ulid, name in sorted(devices.items()):
            self.add(" " * 15 + f"{ulid} {name}")
        self.leave("printData")

    # INQUIRY --------------------------------------------------------------------------------------------------

    def dump(self, data):
        self.add(f"Going to dump {len(data)} bytes\n")
        for i, byte in enumerate(data):
            self.add(f"Byte {i}: 0x{byte:x}")
        self.add("\n")

    def command(self, page, length):
        self.add(f"lcAllocLength = {length}\n")
        self.enter("createInquiryCDB")
        self.add("Going to create the Inquiry command\n")
        self.add("SCSI Inquiry CDB Dump:")
        self.dump([0x12, 1 if page else 0, page, 0, length, 0])
        self.enter("addDataInScsiCdb")
        self.enter("_init")
        self.leave("_init")
        self.leave("addDataInScsiCdb")
        self.leave("createInquiryCDB")
        self.enter("doScsiIo")

    def answer(self):
        self.leave("doScsiIo", 261)
        self.enter("processResponse")
        self.enter("getScsiStatus")
        self.leave("getScsiStatus")
        self.add("Got a scsi inquiry response\n")
        self.leave("processResponse")

    def identify(self, disk):
        """HA_GetScsiUniqueLunId: returns the identifier or None."""
        self.enter("HA_GetScsiUniqueLunId")
        name = disk["device"]
        if disk.get("fail") == "open":
            self.add(f"Cannot do Scsi Inquiry on {name} - No such device or address\n")
            self.leave("HA_GetScsiUniqueLunId")
            return None
        self.enter("isDeviceTypeSupported")
        self.command(0, 36)
        if disk.get("fail") == "ioctl":
            self.leave("doScsiIo", 168)
            self.add("ioctl failed, error code = 25\n\n")
            self.add("Caught exception -> ioctl failed, error code = 25\n : Adding host name as LUN ID if the "
                     "device is DAS and rejecting otherwise...\n")
        else:
            self.answer()
        if disk.get("fail") in ("ioctl", "type"):
            self.leave("HA_GetScsiUniqueLunId")
            return None
        self.add("Get LunID\n")
        self.command(0x83, 4)
        if disk.get("fail") == "timeout":
            self.leave("doScsiIo", 201)
            self.add("Timeout\n")
            self.add("Time-out in Reading VPD 0x83 Page\n")
            self.add(f"Could not find UniqueLunId from VPD Page 83, for device {name}\n")
            self.add("Can't get ULID using Scsi\n")
            self.leave("HA_GetScsiUniqueLunId")
            return None
        if disk.get("fail") == "page":
            self.leave("doScsiIo", 253)
            self.add("Illegal request in CDB\n")
            self.add("VPD Page 0x83 not supported\n")
            self.add(f"Could not find UniqueLunId from VPD Page 83, for device {name}\n")
            self.add(f"InqBuffer \x10\x02\x7f Vendor {disk['vendor']} \n")
            identifier = disk["id"]
            self.add(f"UniqueLunId from Standard Inquiry = {identifier}\n")
            self.leave("HA_GetScsiUniqueLunId")
            return identifier
        self.answer()
        length = 12
        self.add("Determining the length of Identification descriptor list\n")
        self.add("Going to dump the DI VPD page heder\n")
        self.dump([0, 0x83, 0, length])
        self.add(f"Identification descriptor list length is: {length} bytes\n")
        self.add(f"Sending Inquiry again with alloc length: {length + 4} bytes\n")
        self.command(0x83, length + 4)
        self.answer()
        self.add("Going to dump entire DI VPD page\n")
        self.dump([0, 0x83, 0, length, 1, 3, 0, 8] + list(range(0x60, 0x68)))
        self.add("Peripheral type from vpd page = 0\n")
        self.add("Vpd Page: \x90\xd5\x7f\n")
        self.enter("getDiPageIdentifierAscii")
        self.add("Going to Extract Data from Descriptor @ 4\n")
        self.dump([1, 3, 0, 8] + list(range(0x60, 0x68)))
        self.add("Going to store identifier in Binary format\n")
        self.add(f"ID Type: 03; Association type: 00; Identifier: '{disk['id']}'\n")
        self.leave("getDiPageIdentifierAscii")
        self.add(f"Found NaaId: {disk['id']} \n")
        self.add(f"Old Unique LunId = {disk['id']}, New Unique LunId = {disk['id']}\n")
        self.add("Got ULID\n")
        self.leave("HA_GetScsiUniqueLunId")
        return disk["id"]

    def claim(self, kind, device):
        self.claimed.add(device)
        self.enter("addDeviceNameMap")
        self.add(f"Added to DevMap {sum(device.encode()) * 2654435 % 2**32} --> {device} --> {kind:x}\n")
        self.leave("addDeviceNameMap")

    # Trees ----------------------------------------------------------------------------------------------------

    def fc(self, adapters, powerpath=None):
        self.enter("BuildFcTree")
        self.banner("============== FC DEVICE DETAILS ===============")
        self.add("Going to open HBAAPI library\n")
        self.add("Time values: 1.00, 2.00, 1.00, 1502.00\nTime taken to load HBAAPI: 1.50 milliseconds\n")
        if not adapters:
            self.add("The system does not have any adapters\n")
            self.add("Caught exception while building FC tree: There are no adapters on the system\n\n")
            return
        self.add(f"Number of adapters: {len(adapters)}\n")
        for number, adapter in enumerate(adapters):
            self.adapter(number, adapter, powerpath)
        self.add("Time values: 1.00, 2.00, 2.00, 2.00\nTime taken to build tree: 1000.00 milliseconds\n")
        self.add("Going to free library\n")
        self.leave("BuildFcTree")

    def adapter(self, number, adapter, powerpath):
        name = adapter["name"]
        self.add(f"Going to open Adapter #{number} - '{name}'\n")
        self.enter("HA_OpenAdapter")
        self.add(f"Going to open adapter, adapter name = <{name}>\n")
        if adapter.get("fail") == "open":
            self.add(f"Failed to open adapter, adapter name = <{name}>\n")
            self.leave("HA_OpenAdapter")
            self.add(f"Exception occured while opening adapter: {name}\n")
            return
        self.leave("HA_OpenAdapter")
        self.add("Storing Adapter Handle\n")
        if adapter.get("fail") == "unsupported":
            self.add("Encountered non-supported Adapter - HBA_STATUS_ERROR_NOT_SUPPORTED\n")
            return
        self.add(f"Adapter info: Manufacturer Acme Model {adapter.get('model', 'A8')} "
                 f"NumPorts={len(adapter['ports'])}\n")
        luns = adapter["luns"]
        self.add("The status of get fcp target mapping: 7\n")
        self.add(f"The number of targets is {len(luns)}\n")
        for lun in luns:
            if not lun["device"]:
                self.unnamed(lun)
                continue
            self.enter("HA_PrintVendorProductId")
            if lun.get("fail") == "open":
                self.add(f"Cannot do Scsi Inquiry on {lun['device']} - No such device or address\n")
                self.leave("HA_PrintVendorProductId")
                self.add(f"Failed in getting the VendorId for device {lun['device']} Lun {lun['lun']} Under "
                         f"Target {lun['port']} ignoring\n")
                continue
            self.command(0, 36)
            if lun.get("fail") == "standard":
                self.leave("doScsiIo", 201)
                self.add("Timeout\nTime-out in Getting Std Inquiry Data\n")
                self.leave("HA_PrintVendorProductId")
                self.add(f"Exception occured while opening adapter: {name}\n")
                return
            self.answer()
            self.add("Peripheral type from standard enquiry = 0\n")
            self.add("Going to extract Inquiry data for field type: 0\n")
            self.add(f"Vendor {lun['vendor']} ProductId {lun['product']} ProductRev 1.0\n")
            self.leave("HA_PrintVendorProductId")
        slots = [None] * len(luns)
        for slot, lun in enumerate(luns):
            if not lun["device"]:
                self.unnamed(lun)
                continue
            self.claim(1, lun["device"])
            identifier = self.identify(lun)
            if identifier is None:
                self.add(f"Failed in getting the uniqueLunId for device {lun['device']} ignoring\n")
                continue
            self.add(f"UniqueLunid = {identifier} size = {len(identifier)}\n")
            if powerpath is not None:
                if identifier in powerpath:
                    self.add(f"Pseudo Device for Unique LunId {identifier} is {powerpath[identifier]}\n")
                else:
                    self.add(f"Lun With UniqueLunId {identifier} is not under PowerPath\n")
            slots[slot] = lun
        kept = sum(slot is not None for slot in slots)
        self.add("\n|_ Adapter wwnn " + adapter["wwnn"] + "\n")
        for port in adapter["ports"]:
            self.add("|  |_ Initiator wwpn " + port + "\n")
            last = None
            for lun in slots[:kept]:
                lun = lun or {"node": "00:" * 7 + "00", "port": "00:" * 7 + "00", "device": "", "id": "", "lun": 0}
                if last != (lun["port"], lun["node"]):
                    last = (lun["port"], lun["node"])
                    self.add(f"|  |  |_ Target wwnn {lun['node']} wwpn {lun['port']} bus 0 target# 0\n")
                self.add(f"|  |  |  |_ lun name {lun['device']} luid {lun['id']} oslun {lun['lun']} "
                         f"fcid 66049 fcplun 0{lun['lun']:x}\n")

    def unnamed(self, lun):
        self.add(f"Device Name Unassigned for Lun {lun['lun']} under Target {lun['port']} ignoring\n")

    def iscsi(self, sessions, initiator="iqn.1993-08.org.debian:01:abc"):
        self.enter("BuildIscsiTree_Linux")
        self.banner("============= ISCSI DEVICE DETAILS =============")
        self.enter("readInitiatorIQN")
        if initiator is None:
            self.add("Failed to open /etc/iscsi/initiatorname.iscsi!\n")
            self.add("Failed to read Initiator IQN \n\nCannot proceed with building ISCSI tree\n")
            self.leave("BuildIscsiTree_Linux")
            return
        self.add(f"InitiatorIQN {initiator}\n")
        self.leave("readInitiatorIQN")
        lines = []
        for session in sessions:
            self.add(f"Target IQN '{session['target']}'\n")
            self.add(f"Target IP '{session['address']}'\n")
            self.add(f"Initiator IP '{session['initiator']}'\n")
            for disk in session["disks"]:
                lun = disk["lun"]
                self.add("Got device list start\n")
                if lun >= 0:
                    self.add(f"LUN '{lun}'\n")
                self.claim(4, disk["device"])
                identifier = self.identify(disk) or ":-( SCSI_Inquiry_Failed"
                self.add(f"Register new iSCSI path: init_wwnn={initiator}, init_wwpn={session['initiator']}, "
                         f"tgt_wwnn={session['target']}, tgt_wwpn={session['address']}, lun={lun}\n")
                if lun < 0:
                    self.add(f"Ignoring device {disk['device']}, some param missing!\n")
                else:
                    lines.append((session, disk, identifier))
                self.add(f"Disk name '{disk['device']}'\n")
        self.enter("printDeviceTree")
        if lines:
            self.add("\n")
        for session, disk, identifier in lines:
            self.add(f"|_ Initiator IQN  {initiator}\n|  |_ Target IQN {session['target']}\n")
            self.add("|  |  |_ Initiator_IP/MAC <--------> Target_IP\n")
            self.add(f"         {session['initiator']} <---> {session['address']}\n")
            self.add(f"|  |  |  |_ Device_Name: {disk['device']} sScsiOSLun: {disk['lun']} LunId: {identifier}\n\n")
        self.leave("BuildIscsiTree_Linux")

    def direct(self, disks, odd=()):
        self.enter("BuildDasTree_Linux")
        self.banner("============== DAS DEVICE DETAILS ==============")
        self.enter("gatherDasInfo")
        for name in odd:
            self.add(f"|{name}| is of no interest to us. Ignoring")
        for disk in disks:
            device = disk["device"]
            self.enter("printDeviceTree")
            self.enter("getDeviceType")
            self.leave("getDeviceType")
            self.enter("reconfirmDAS")
            identifier = self.identify(disk)
            if identifier is None and disk["fail"] in ("open", "type"):
                self.add(f"Exception occured while getting LUN ID for device {device}\n")
                self.add(f"\n--------> Device Name: |{device}| is not supported\n\n")
                continue
            if identifier is None:
                identifier = f"{self.host}::{device}"
            self.claim(2, device)
            self.add(f"\n--------> Device Name: |{device}| LunId: |{identifier}|\n\n")
        self.leave("gatherDasInfo")
        self.leave("BuildDasTree_Linux")

    def logical(self, devices, readable=True):
        self.enter("BuildLogicalTree_Linux")
        self.banner("============ LOGICAL DEVICE DETAILS ============")
        self.enter("gatherLogicalInfo")
        for device in devices:
            self.enter("printDeviceTree")
            self.enter("getDeviceType")
            if device not in self.claimed:
                self.leave("getDeviceType")
                self.add(f"\n--------> Device Name: |{device}| LunId: |{self.host} :: {device}| \n")
        if readable:
            self.leave("gatherLogicalInfo")
        else:
            self.add("Could not open /proc/partitions for read!")
            self.add("Error occured while reading Logical devices. Failed to build Logical tree.\n")
        self.leave("BuildLogicalTree_Linux")

    def end(self):
        self.add("\n" + RULE + "\t\t\t   END \n" + RULE)


def disk_name(number):
    """The kernel's name of its disk number `number`: sda, ..., sdz, sdaa, ..."""
    name = ""
    number += 1
    while number:
        number, letter = divmod(number - 1, 26)
        name = chr(ord("a") + letter) + name
    return "/dev/sd" + name


def wwn(prefix, number):
    text = f"{prefix:02x}{number:014x}"
    return ":".join(text[i:i + 2] for i in range(0, 16, 2))


def fc_lun(device, identifier, lun, port, **more):
    return {"device": device, "id": identifier, "lun": lun, "port": port, "node": "50:" + port[3:],
            "vendor": "ACME", "product": "ARRAY 9", **more}


def healthy(host="hosta", first_disk=1, without=()):
    """Two adapters, two targets each, three LUNs over four paths; one iSCSI session; a disk of its own. `without`: paths that
    are not there, each as the numbers of adapter, target and LUN."""
    log = Log(host)
    log.multipath()
    disk = first_disk
    adapters = []
    for a in range(2):
        luns = []
        for target in range(2):
            for lun in range(3):
                if (a, target, lun) not in without:
                    luns.append(fc_lun(disk_name(disk), f"600A0B80000000000000000000000{lun:03d}", lun,
                                       wwn(0x52, 16 * a + target)))
                disk += 1
        adapters.append({"name": f"acme-a8-{a}", "wwnn": wwn(0x20, a), "ports": [wwn(0x10, a)], "luns": luns})
    log.fc(adapters)
    log.iscsi([{"target": "iqn.2003-01.org.example:disk1", "address": "192.168.1.10", "initiator": "192.168.1.5",
                "disks": [{"device": disk_name(disk), "id": "60014050000000000000000000000001", "lun": 0}]}])
    log.direct([{"device": "/dev/sda", "fail": "ioctl"}])
    log.logical(["/dev/sda", "/dev/sda1", disk_name(first_disk), disk_name(first_disk) + "1"])
    log.end()
    return log


def troubled(host="hostb"):
    """Everything that can go wrong on one host without ending the run."""
    powerpath = {"600601604B2A1E00AAAAAAAAAAAAAA01": "emcpowera", "600601604B2A1E00AAAAAAAAAAAAAA02": "emcpowerb"}
    log = Log(host)
    log.multipath(powerpath, daemon_lines=2)
    port = wwn(0x52, 1)
    log.fc([
        {"name": "acme-a8-0", "wwnn": wwn(0x20, 0), "ports": [wwn(0x10, 0)], "luns": [
            fc_lun("/dev/sdb", "600601604B2A1E00AAAAAAAAAAAAAA01", 0, port),
            fc_lun("", "", 1, port),
            fc_lun("/dev/sdc", "600601604B2A1E00AAAAAAAAAAAAAA02", 2, port, fail="timeout"),
            fc_lun("/dev/sdd", "600601604B2A1E00AAAAAAAAAAAAAA03", 3, port),
            fc_lun("/dev/sde", "", 4, port, fail="open"),
            fc_lun("/dev/sdf", "00000000000000000000000000000000", 5, port, vendor="EMC", fail="page"),
        ]},
        {"name": "acme-a8-1", "wwnn": wwn(0x20, 1), "ports": [wwn(0x10, 1)], "luns": [], "fail": "open"},
        {"name": "acme-a8-2", "wwnn": wwn(0x20, 2), "ports": [wwn(0x10, 2)], "luns": [], "fail": "unsupported"},
        {"name": "acme-a8-3", "wwnn": wwn(0x20, 3), "ports": [wwn(0x10, 3), wwn(0x10, 4)], "luns": [
            fc_lun("/dev/sdg", "ACME:BOX:1.0:x", 0, wwn(0x52, 3), fail="page"),
            fc_lun("/dev/sdh", "ACME:BOX:1.0:x", 1, wwn(0x52, 3), fail="page"),
        ]},
        {"name": "acme-a8-4", "wwnn": wwn(0x20, 5), "ports": [wwn(0x10, 5)], "luns": [
            fc_lun("/dev/sdi", "600601604B2A1E00AAAAAAAAAAAAAA04", 0, port, fail="standard")]},
    ], powerpath)
    log.iscsi([
        {"target": "iqn.2003-01.org.example:disk1", "address": "192.168.1.10", "initiator": "192.168.1.6",
         "disks": [{"device": "/dev/sdj", "id": "", "lun": 0, "fail": "timeout"},
                   {"device": "/dev/sdk", "id": "6001405000000000000000000000000A", "lun": -1}]},
        {"target": "iqn.2003-01.org.example:empty", "address": "192.168.1.11", "initiator": "192.168.1.6",
         "disks": []}])
    log.direct([{"device": "/dev/vda", "fail": "ioctl"}, {"device": "/dev/sr0", "fail": "type"},
                {"device": "/dev/sdz", "fail": "open"},
                {"device": "/dev/sdl", "id": "naa\x1b[31m\udce9\\5000C500", "vendor": "ACME"}], odd=["README", "x"])
    log.logical(["/dev/vda", "/dev/vda1"], readable=False)
    log.end()
    return log


def big(luns, host="big"):
    """A host with `luns` LUN entries in all: 4 adapters, 4 targets each, LUNs shared by all."""
    log = Log(host)
    log.multipath()
    disk = 1
    adapters = []
    each = luns // 16
    for a in range(4):
        entries = []
        for target in range(4):
            for lun in range(each):
                entries.append(fc_lun(disk_name(disk), f"600A0B8000000000000000000{lun:07X}", lun,
                                      wwn(0x52, 16 * a + target)))
                disk += 1
        adapters.append({"name": f"acme-a8-{a}", "wwnn": wwn(0x20, a), "ports": [wwn(0x10, a)], "luns": entries})
    log.fc(adapters)
    log.iscsi([], initiator=None)
    log.direct([{"device": "/dev/sda", "fail": "ioctl"}])
    log.logical(["/dev/sda1"])
    log.end()
    return log


def main():
    kinds = {"healthy": healthy, "troubled": troubled, "big": big}
    if len(sys.argv) < 2 or sys.argv[1] not in kinds:
        sys.exit(f"usage: make_log.py {'|'.join(kinds)} [HOST or LUN count]")
    arguments = [int(a) if a.isdigit() else a for a in sys.argv[2:]]
    sys.stdout.buffer.write(kinds[sys.argv[1]](*arguments).bytes())


if __name__ == "__main__":
    main()
