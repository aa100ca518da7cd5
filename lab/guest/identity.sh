# Device-mapper maps over every LUN with several paths, and what parts a device, the kernel's memory of it and
# multipath's; read by the other scripts of the guest.
# shellcheck shell=bash disable=SC2154 # names of storage.sh

# map_paths COUNT: whether the maps have that many paths, each of them usable.
map_paths() {
    [ "$(multipathd show paths raw format "%t %o %T" | grep -c "^active running ready")" -eq "$1" ]
}

# Eight LUNs have two FC paths, three an iSCSI path for each of two sessions (one of them is an FC LUN too), five a direct
# disk of this guest, one of these a single iSCSI path beside it: 28 paths in 11 maps.
maps_up() {
    modprobe -a dm_multipath dm_round_robin dm_service_time scsi_dh_alua
    cp /lab/multipath.conf /etc/
    /usr/lib/systemd/systemd-udevd --daemon
    udevadm trigger --action=add --subsystem-match=block --property-match=DEVTYPE=disk
    udevadm settle
    multipathd
    wait_for 120 "28 paths in maps" map_paths 28
}

# Leaves nothing of udev or multipath to the stages that follow.
maps_down() {
    multipathd shutdown
    wait_for 20 "multipathd's end" no_multipathd
    multipath -F
    udevadm control --exit
    rm -rf /run/udev /dev/disk
}

no_multipathd() {
    ! pgrep -x multipathd
}

# names PLACE: what everyone calls the disks, a line each: the kernel's name; scsi_id's, which asks the device now;
# the kernel's wwid, which it made when it first saw the device; udev's links. And the maps: name, UUID and disks.
names() {
    local disks=(/sys/block/sd*) links index disk wwid
    disks=("${disks[@]##*/}")
    mapfile -t links <<<"$(udevadm info --query=symlink "${disks[@]/#//dev/}")"
    for index in "${!disks[@]}"; do
        disk=${disks[index]}
        { wwid=$(<"/sys/block/$disk/device/wwid"); } 2>/dev/null # unreadable where there is none
        printf '%s\t%s\t%s\t%s\n' "$disk" "$(/usr/lib/udev/scsi_id --whitelisted "--device=/dev/$disk")" "$wwid" \
            "${links[index]}"
    done >"$1/names"
    multipathd show paths raw format "%d|%w" >"$1/multipath-paths"
    dmsetup info --columns --noheadings --separator '|' --options name,uuid,blkdevs_used >"$1/maps"
    multipathd show maps json >"$1/maps.json"
}

# compared CASE PATHS DISK...: what everyone says with the fault in force, which leaves that many paths in the maps and
# hit these disks; then Morvane, and what 'morvane-view verify' says and records of this very host.
compared() {
    local case=$1 paths=$2
    shift 2
    udevadm settle
    wait_for 60 "$paths paths in maps" map_paths "$paths"
    fact "$case" disks "$*"
    inventory "$case"
    names "/out/$case/reference"
    run_morvane "$case"
    (
        cd "/tmp/run/$case" || exit
        /lab/morvane-view verify --json --maps "/out/$case/reference/maps.json" --record recording \
            >"/out/$case/verify.json" 2>"/out/$case/verify.stderr"
        echo $? >"/out/$case/verify.status"
        tar -cf "/out/$case/recording.tar" recording
    )
}

# swap FABRIC LUN LUN: each of the two numbers leads to the other's back store. The initiator is not told to look again.
swap() {
    local tpg=$target/fc/20:00:52:54:00:fa:$1:02/tpgt_1 one other
    one=$(readlink -f "$tpg/lun/lun_$2/store")
    other=$(readlink -f "$tpg/lun/lun_$3/store")
    fc_unexport "$1" "$2"
    fc_unexport "$1" "$3"
    fc_export "$1" "$2" "${other#"$target/core/"}"
    fc_export "$1" "$3" "${one#"$target/core/"}"
}

# Everyone agrees.
identity_healthy() {
    compared identity-healthy 28
}

# Behind the numbers of two LUNs the target swaps the back stores, on both fabrics.
stale_identity() {
    swap 0a 1 2
    swap 0b 1 2
    compared stale-identity 28 "$(fc_disk 0a 1)" "$(fc_disk 0b 1)" "$(fc_disk 0a 2)" "$(fc_disk 0b 2)"
    swap 0a 1 2
    swap 0b 1 2
}

# The same on one fabric, so that two maps hold a path to each of both LUNs.
mixed_map() {
    swap 0a 1 2
    compared mixed-map 28 "$(fc_disk 0a 1)" "$(fc_disk 0a 2)"
    swap 0a 1 2
}

# One of a map's two paths leaves it.
path_missing() {
    local disk
    disk=$(fc_disk 0b 3)
    multipathd del path "$disk"
    compared path-missing 27 "$disk"
    multipathd add path "$disk"
}

# A snapshot that has its origin's identifier is shown beside it, on both fabrics; multipath takes its paths into the
# origin's map.
snapshot() {
    local fabric disk
    ramdisk snapshot lab-fc-1
    for fabric in $fabrics; do
        fc_export "$fabric" 9 rd_mcp_0/snapshot
        echo "0 0 9" >"/sys/class/scsi_host/$(fc_host "$fabric")/scan"
    done
    wait_for 20 "the snapshot" fc_paths 18
    compared snapshot 30 "$(fc_disk 0a 1)" "$(fc_disk 0b 1)" "$(fc_disk 0a 9)" "$(fc_disk 0b 9)"
    for fabric in $fabrics; do
        disk=$(fc_disk "$fabric" 9)
        multipathd del path "$disk"
        echo 1 >"/sys/block/$disk/device/delete"
        fc_unexport "$fabric" 9
    done
    rmdir "$target/core/rd_mcp_0/snapshot"
}

stage_identity() {
    maps_up
    identity_healthy
    stale_identity
    mixed_map
    path_missing
    snapshot
    maps_down
}
