# The faults, one function each; read by the other scripts of the guest. To add one, write a function stage_NAME that
# breaks something, calls faulty_run, and mends it; add NAME to STAGES in lab/run; and say in lab/judge.py what must be seen.
# shellcheck shell=bash disable=SC2154 # names of storage.sh

# fact STAGE NAME VALUE: a fact that the judge needs to know about the fault.
fact() {
    mkdir -p "/out/$1"
    echo "$2=$3" >>"/out/$1/facts"
}

# faulty_run STAGE: the inventory with the fault in force, then Morvane.
faulty_run() {
    inventory "$1"
    run_morvane "$1"
}

# fc_host FABRIC: the hostN of the fabric's initiator port.
fc_host() {
    basename "$(dirname "$(grep -l "0x2000525400fa${1}01" /sys/class/fc_host/*/port_name)")"
}

# fc_disk FABRIC LUN: the sdX of that path.
fc_disk() {
    local host
    host=$(fc_host "$1")
    basename /sys/class/scsi_device/"${host#host}":0:0:"$2"/device/block/*
}

# One path of an FC LUN and one direct disk are taken offline.
stage_lun_offline() {
    local fc direct disk
    fc=$(fc_disk 0a 1)
    direct=$(disk_by_serial LSI-0 VIRTIO-4)
    fact lun-offline fc "/dev/$fc"
    fact lun-offline direct "/dev/$direct"
    for disk in "$fc" "$direct"; do echo offline >"/sys/block/$disk/device/state"; done
    faulty_run lun-offline
    for disk in "$fc" "$direct"; do echo running >"/sys/block/$disk/device/state"; done
}

# The disk of scsi_debug, which is also LUN 7 of both FC targets, swallows every command.
stage_command_lost() {
    local debug=/sys/bus/pseudo/drivers/scsi_debug disk
    disk=$(basename $debug/adapter0/host*/target*/*/block/*)
    fact command-lost direct "/dev/$disk"
    fact command-lost fc "/dev/$(fc_disk 0a 7)"
    echo 1 >$debug/every_nth
    echo 4 >$debug/opts
    faulty_run command-lost
    echo 0 >$debug/opts
    echo 0 >$debug/every_nth
}

# reaches PLACE TEXT: lets the Morvane that runs in PLACE go on until its log holds the text, and stops it there. It runs
# in slices of a few milliseconds, so that it cannot get far past the text while the log is searched.
reaches() {
    local started=$SECONDS
    until [ -s "$1/pid" ]; do [ $((SECONDS - started)) -lt 30 ] || return 1; done
    until grep -qs "$2" "$1/MorvaneLogs/Morvane.log"; do
        [ $((SECONDS - started)) -lt 60 ] && kill -CONT "$(<"$1/pid")" || return 1
        read -rt 0.005 <> <(:)
        kill -STOP "$(<"$1/pid")"
    done
}

# The link of an initiator port goes down while Morvane reads that adapter's disks.
stage_link_down() {
    local place=/tmp/run/link-down adapter card
    inventory link-down
    rm -rf $place
    run_morvane link-down &
    reaches $place "Added to DevMap" || echo "lab: link-down: Morvane did not get to an FC disk"
    adapter=$(sed -n 's/^Going to open adapter, adapter name = <\(.*\)>$/\1/p' $place/MorvaneLogs/Morvane.log | tail -1)
    fact link-down adapter "$adapter"
    card=${adapter#fcoe:}
    card=${card%-*}
    fact link-down port "20:00:$(cat "/sys/class/net/$card/address")"
    ip link set "$card" down
    kill -CONT "$(<$place/pid)"
    wait %%
    ip link set "$card" up
    wait_for 60 "16 online FC paths" fc_online 16
}

# fc_online COUNT: whether that many FC paths answer.
fc_online() {
    local device count=0
    for device in /sys/block/sd*; do
        case $(readlink -f "$device") in */rport-*) grep -q running "$device/device/state" && count=$((count + 1)) ;; esac
    done
    [ "$count" -eq "$1" ]
}

# The target of two iSCSI sessions disappears; the sessions' recovery time-out is 5 s.
stage_iscsi_target_gone() {
    local tpg=$target/iscsi/$iqn:two/tpgt_1
    inventory iscsi-target-gone
    fact iscsi-target-gone target "$iqn:two"
    echo 0 >"$tpg/enable"
    run_morvane iscsi-target-gone
    echo 1 >"$tpg/enable"
}

# A LUN that has no identifier, and no bytes in its INQUIRY data to make one of, appears on one fabric.
stage_lun_without_identifier() {
    local disk
    fc_export 0a 8 pscsi_0/plain
    echo "0 0 8" >"/sys/class/scsi_host/$(fc_host 0a)/scan"
    wait_for 20 "the new LUN" fc_paths 17
    disk=$(fc_disk 0a 8)
    fact lun-without-identifier fc "/dev/$disk"
    faulty_run lun-without-identifier
    echo 1 >"/sys/block/$disk/device/delete"
    fc_unexport 0a 8
}
