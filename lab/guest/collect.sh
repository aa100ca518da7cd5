# Runs Morvane, and collects the answers of the tools that it is compared with; read by the other scripts of the guest.
# shellcheck shell=bash

# now: seconds since boot, with hundredths.
now() {
    cut -d' ' -f1 /proc/uptime
}

# run_morvane STAGE: leaves log, output, status and the times of start and end in /out/STAGE.
run_morvane() {
    local place=/tmp/run/$1 out=/out/$1
    rm -rf "$place"
    mkdir -p "$place" "$out"
    (
        cd "$place" || exit
        now >started
        /lab/morvane >stdout 2>stderr &
        echo $! >pid
        wait $!
        echo $? >status
        now >ended
    )
    cp "$place"/{stdout,stderr,status,started,ended} "$place/MorvaneLogs/Morvane.log" "$out/"
}

# directory_values DIRECTORY...: every readable file of the directories, as PATH:VALUE.
directory_values() {
    find "$@" -maxdepth 1 -type f -perm -400 -exec grep -Hs . {} +
}

# disk_reference DEVICE DIRECTORY: what sg3-utils reads from one disk. The standard INQUIRY data is asked for as Morvane
# asks for it, 36 bytes into a buffer of 256: some adapters report such a short transfer as an error.
disk_reference() {
    mkdir -p "$2"
    sg_raw --readonly --binary --request=256 --outfile="$2/inquiry36" "/dev/$1" 12 00 00 00 24 00 >"$2/inquiry36.txt" 2>&1
    echo $? >"$2/inquiry36.status"
    sg_inq --raw "/dev/$1" >"$2/inquiry" 2>/dev/null
    sg_vpd --page=di --raw "/dev/$1" >"$2/vpd83" 2>/dev/null
    sg_vpd --page=di "/dev/$1" >"$2/vpd83.txt" 2>&1
    sg_vpd --page=sn --raw "/dev/$1" >"$2/vpd80" 2>/dev/null
}

# inventory STAGE: leaves what the kernel and iscsiadm list, without a command to any disk, in /out/STAGE/reference.
inventory() {
    local out=/tmp/reference entry
    rm -rf $out
    mkdir -p $out "/out/$1"
    hostname >$out/hostname
    # In the order of the directory.
    find /sys/block -mindepth 1 | while read -r entry; do
        echo "${entry##*/} $(readlink "$entry")"
    done >$out/sys-block
    cp /proc/partitions $out/proc-partitions
    directory_values /sys/class/fc_host/*/ >$out/fc-hosts
    directory_values /sys/class/fc_remote_ports/*/ >$out/fc-remote-ports
    directory_values /sys/class/fc_transport/*/ >$out/fc-targets
    cp /etc/iscsi/initiatorname.iscsi $out/
    iscsiadm -m session --print=3 >$out/iscsiadm-3 2>/dev/null
    iscsiadm -m session --print=1 >$out/iscsiadm-1 2>/dev/null
    lsscsi --transport >$out/lsscsi
    rm -rf "/out/$1/reference"
    cp -r $out "/out/$1/reference"
}

# reference STAGE: the inventory, and what sg3-utils reads from every SCSI disk.
reference() {
    local disks=/tmp/disks entry
    inventory "$1"
    rm -rf $disks
    for entry in /sys/block/sd* /sys/block/sr*; do
        disk_reference "$(basename "$entry")" "$disks/$(basename "$entry")"
    done
    cp -r $disks "/out/$1/reference/disks"
}
