# Brings the laboratory's storage up; read by the other scripts of the guest.
# shellcheck shell=bash disable=SC2034 # variables are used by the scripts that read this one

target=/sys/kernel/config/target

# wait_for SECONDS WHAT COMMAND...: runs the command until it succeeds; a message and status 1 if it never does.
wait_for() {
    local tenths=$(($1 * 10)) what=$2
    shift 2
    while ! "$@" >/dev/null 2>&1; do
        tenths=$((tenths - 1))
        [ $tenths -gt 0 ] || { echo "lab: gave up waiting for $what"; return 1; }
        sleep 0.1
    done
}

# parameter NAME: the value of lab.NAME= on the kernel's command line.
parameter() {
    sed -n "s/.*\blab\.$1=\([^ ]*\).*/\1/p" /proc/cmdline
}

# ---- direct disks: everything QEMU attaches (lab/devices.py), and a disk of scsi_debug

direct_disks() {
    local entry count=0
    for entry in /sys/block/*; do
        case $(readlink "$entry") in ../devices/virtual/*) ;; *) count=$((count + 1)) ;; esac
    done
    [ "$count" -ge "$(parameter disks)" ]
}

direct_disks_up() {
    modprobe -a sd_mod sr_mod sg
    modprobe -a virtio_scsi virtio_blk nvme sym53c8xx megaraid_sas mptsas vmw_pvscsi ata_piix ahci xhci_pci
    modprobe -a usb_storage uas
    wait_for 60 "the direct disks" direct_disks
    # Identifiers that do not depend on the number the host got; a UUID designator instead of an NAA one.
    modprobe scsi_debug add_host=1 num_tgts=1 max_luns=1 dev_size_mb=8 delay=0 vpd_use_hostno=0 uuid_ctl=2
    wait_for 20 "the disk of scsi_debug" test -e "/dev/$(scsi_debug_disk)"
}

# disk_by_serial SERIAL...: the sdX whose unit serial number page holds the first of the serials that is there.
disk_by_serial() {
    local serial device
    for serial; do
        for device in /sys/block/sd*; do
            if grep -aq "$serial" "$device/device/vpd_pg80" 2>/dev/null; then basename "$device"; return; fi
        done
    done
    echo "lab: no disk has the serial number $*" >&2
    return 1
}

# scsi_debug_disk: the sdX of the scsi_debug disk that is there from the start.
scsi_debug_disk() {
    basename /sys/bus/pseudo/drivers/scsi_debug/adapter0/host*/target*/*/block/*
}

# ---- targets: back stores of LIO, exported over FC and iSCSI

targets_up() {
    modprobe -a target_core_mod target_core_pscsi iscsi_target_mod tcm_fc
    mount -t configfs config /sys/kernel/config
}

# ramdisk NAME SERIAL: a back store in memory; LIO derives its T10 and NAA designators from the serial.
ramdisk() {
    local store=$target/core/rd_mcp_0/$1
    mkdir -p "$store"
    echo rd_pages=256 >"$store/control"
    echo "$2" >"$store/wwn/vpd_unit_serial"
    echo 1 >"$store/enable"
}

# passthrough NAME sdX: a back store that hands every command to that disk of the guest. LIO claims for itself the block
# device that it is told of; told of a loop device that nothing uses, it leaves the disk free to be a path of a map.
passthrough() {
    local store=$target/core/pscsi_0/$1 host channel id lun
    IFS=: read -r host channel id lun <<<"$(basename "$(readlink "/sys/block/$2/device")")"
    mkdir -p "$store"
    echo "scsi_host_id=$host,scsi_channel_id=$channel,scsi_target_id=$id,scsi_lun_id=$lun" >"$store/control"
    echo "/dev/loop$(find $target/core/pscsi_0 -mindepth 1 -maxdepth 1 -type d | wc -l)" >"$store/udev_path"
    echo 1 >"$store/enable"
}

# ---- Fibre Channel: per fabric two software FCoE ports on one Ethernet segment without a switch (VN2VN). A port's
# WWPN is 20:00: and the address of its network card. Cards ending in 01 are initiators, in 02 targets.

fabrics="0a 0b"
fc_stores="rd_mcp_0/fc0 rd_mcp_0/fc1 rd_mcp_0/fc2 rd_mcp_0/fc3 pscsi_0/naa pscsi_0/ata pscsi_0/emc pscsi_0/debug"

# fc_card FABRIC 01|02: the name of the fabric's network card.
fc_card() {
    basename "$(dirname "$(grep -l "52:54:00:fa:$1:$2" /sys/class/net/*/address)")"
}

# fc_export FABRIC LUN STORE: shows the back store as a LUN of the fabric's target to the fabric's initiator.
fc_export() {
    local tpg=$target/fc/20:00:52:54:00:fa:$1:02/tpgt_1
    mkdir -p "$tpg/lun/lun_$2" "$tpg/acls/20:00:52:54:00:fa:$1:01/lun_$2"
    ln -s "$target/core/$3" "$tpg/lun/lun_$2/store"
    ln -s "$tpg/lun/lun_$2" "$tpg/acls/20:00:52:54:00:fa:$1:01/lun_$2/lun"
}

# fc_unexport FABRIC LUN: takes it away again; the initiator keeps its disk.
fc_unexport() {
    local tpg=$target/fc/20:00:52:54:00:fa:$1:02/tpgt_1
    local acl=$tpg/acls/20:00:52:54:00:fa:$1:01
    rm "$acl/lun_$2/lun" "$tpg/lun/lun_$2/store"
    rmdir "$acl/lun_$2" "$tpg/lun/lun_$2"
}

# fc_port_up CARD: makes the card an FC port.
fc_port_up() {
    local controller
    ip link set "$1" up
    echo "$1" >/sys/bus/fcoe/ctlr_create
    for controller in /sys/bus/fcoe/devices/ctlr_*; do
        [ "$(cat "$controller/enabled")" = 0 ] || continue
        echo vn2vn >"$controller/mode"
        echo 1 >"$controller/enabled"
    done
}

# fc_paths COUNT: whether that many FC disks are there.
fc_paths() {
    local device count=0
    for device in /sys/block/sd*; do
        case $(readlink -f "$device") in */rport-*) count=$((count + 1)) ;; esac
    done
    [ "$count" -eq "$1" ]
}

fc_up() {
    local fabric lun store remote
    modprobe -a e1000 virtio_net fcoe
    for fabric in $fabrics; do
        lun=0
        for store in $fc_stores; do
            fc_export "$fabric" $lun "$store"
            lun=$((lun + 1))
        done
        fc_port_up "$(fc_card "$fabric" 02)"
        fc_port_up "$(fc_card "$fabric" 01)"
    done
    wait_for 60 "16 FC paths" fc_paths 16
    # A port that is gone fails its commands after 2 s and loses its disks after 5 minutes.
    for remote in /sys/class/fc_remote_ports/*; do
        echo 300 >"$remote/dev_loss_tmo"
        echo 2 >"$remote/fast_io_fail_tmo"
    done
}

# ---- iSCSI: two LIO targets, three sessions: IPv4 loopback, a second IPv4 address, IPv6

iqn=iqn.2026-01.org.example.lab

# iscsi_target NAME PORTAL... -- STORE...
iscsi_target() {
    local tpg=$target/iscsi/$iqn:$1/tpgt_1 lun=0
    shift
    mkdir -p "$tpg"
    while [ "$1" != -- ]; do mkdir -p "$tpg/np/$1"; shift; done
    shift
    while [ $# -gt 0 ]; do
        mkdir -p "$tpg/lun/lun_$lun"
        ln -s "$target/core/$1" "$tpg/lun/lun_$lun/store"
        lun=$((lun + 1))
        shift
    done
    echo 0 >"$tpg/attrib/authentication"
    echo 1 >"$tpg/attrib/generate_node_acls"
    echo 1 >"$tpg/attrib/cache_dynamic_acls"
    echo 1 >"$tpg/enable"
}

iscsi_paths() {
    local device count=0
    for device in /sys/block/sd*; do
        case $(readlink -f "$device") in */session*) count=$((count + 1)) ;; esac
    done
    [ "$count" -eq "$1" ]
}

iscsi_up() {
    modprobe -a iscsi_tcp crc32c_generic
    ip addr add 10.66.0.1/24 dev lo
    ip addr add fd66::1/64 dev lo nodad 2>/dev/null || ip addr add fd66::1/64 dev lo
    iscsi_target one 127.0.0.1:3260 -- rd_mcp_0/is0 rd_mcp_0/is1 pscsi_0/plain
    iscsi_target two 10.66.0.1:3260 "[fd66::1]:3260" -- rd_mcp_0/is2 rd_mcp_0/is3 pscsi_0/emc
    echo "InitiatorName=$iqn:initiator" >/etc/iscsi/initiatorname.iscsi
    cat >>/etc/iscsi/iscsid.conf <<CONF
node.session.timeo.replacement_timeout = 5
node.conn[0].timeo.noop_out_interval = 2
node.conn[0].timeo.noop_out_timeout = 2
CONF
    mkdir -p /run/lock/iscsi /var/lib/iscsi
    iscsid
    wait_for 30 "iscsid" iscsiadm -m discovery -t sendtargets -p 127.0.0.1
    iscsiadm -m discovery -t sendtargets -p 10.66.0.1
    iscsiadm -m node -T "$iqn:one" -p 127.0.0.1 --login
    iscsiadm -m node -T "$iqn:two" -p 10.66.0.1 --login
    iscsiadm -m node -T "$iqn:two" -p "[fd66::1]:3260" --login
    wait_for 30 "9 iSCSI paths" iscsi_paths 9
}

# A virtual disk, which only /proc/partitions leads to.
loop_up() {
    modprobe loop
    truncate -s 4M /tmp/loop.img
    losetup /dev/loop0 /tmp/loop.img
}

storage_up() {
    loop_up
    direct_disks_up
    targets_up
    ramdisk fc0 lab-fc-0; ramdisk fc1 lab-fc-1; ramdisk fc2 lab-fc-2; ramdisk fc3 lab-fc-3
    ramdisk is0 lab-iscsi-0; ramdisk is1 lab-iscsi-1; ramdisk is2 lab-iscsi-2; ramdisk is3 lab-iscsi-3
    passthrough naa "$(disk_by_serial VIRTIO-0)"
    passthrough plain "$(disk_by_serial VIRTIO-1)"
    passthrough emc "$(disk_by_serial 000190100123)"
    passthrough ata "$(disk_by_serial PIIX-0 AHCI-0 VIRTIO-3)"
    passthrough debug "$(scsi_debug_disk)"
    fc_up
    iscsi_up
}
