# A thousand disks of scsi_debug: Morvane's time beside that of the trusted tools; read by the course.
# shellcheck shell=bash

scale_disks() {
    local hosts
    hosts=$(echo /sys/bus/pseudo/drivers/scsi_debug/adapter1/host*/target*/*/block/*)
    echo "$hosts" | tr ' ' '\n' | sed -n 's,.*/,,p' | grep -v '\*'
}

thousand_disks() {
    [ "$(scale_disks | wc -l)" -eq 1000 ]
}

# timed NAME COMMAND...: writes "NAME seconds" to /out/scale/times.
timed() {
    local name=$1 start
    shift
    start=$(now)
    "$@"
    echo "$name $start $(now)" >>/out/scale/times
}

# On every tenth disk: all of them take minutes under emulation.
sg3_loop() {
    scale_disks | awk 'NR % 10 == 1' >/tmp/scale-disks
    sh -c 'while read -r disk; do
        sg_inq "/dev/$disk"
        sg_vpd --page=di "/dev/$disk"
    done </tmp/scale-disks >/tmp/sg3-loop'
}

stage_scale() {
    local debug=/sys/bus/pseudo/drivers/scsi_debug place=/tmp/run/scale
    mkdir -p /out/scale
    echo 10 >$debug/num_tgts
    echo 100 >$debug/max_luns
    echo 1 >$debug/vpd_use_hostno
    echo 1 >$debug/add_host
    wait_for 120 "1,000 disks" thousand_disks
    inventory scale
    for _ in 1 2 3; do
        run_morvane scale
        echo "morvane $(<$place/started) $(<$place/ended)" >>/out/scale/times
    done
    timed sg3-loop sg3_loop
    wc -l </tmp/scale-disks >/out/scale/sg3-disks
    timed lsscsi lsscsi -i >/tmp/lsscsi
    grep -c "designator type" /tmp/sg3-loop >/out/scale/sg3-designators
}
