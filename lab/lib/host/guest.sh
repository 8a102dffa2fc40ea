# shellcheck shell=bash disable=SC2154,SC2034 # variables that the lab's files share
# Starting a guest.

# With -icount the guest's clock counts instructions: one nanosecond each, and while the processor
# idles it jumps to the next timer, so the guest's pauses cost no real time and its figures do not
# depend on what else this machine does. The seed makes the guest's random numbers repeat as well.
lab_qemu_arguments()
{
    printf '%s\n' -machine pc,accel=tcg,usb=off -cpu Nehalem,+rdrand -smp 1 \
        -icount shift=0,sleep=off,align=off -rtc base=2030-01-01,clock=vm -seed 1 \
        -nodefaults -display none -no-reboot -no-user-config -monitor none
    local memory=768
    if [[ $1 == systemd ]]; then
        memory=1024
    fi
    if [[ -f $2 ]]; then
        printf '%s\n' -m "$memory,slots=1,maxmem=4G" -machine nvdimm=on \
            -object "memory-backend-file,id=disk,mem-path=$2,size=$(stat -c %s "$2"),share=on" \
            -device nvdimm,memdev=disk
    else
        printf '%s\n' -m "$memory"
    fi
}

# lab_make_guest_disk FILE KIND: a disk of the guest's own, like the one that it begins with, fresh
# or ready, or an empty one. To the guest it is memory: for an answer of a real disk's it would have to wait while its
# clock jumps ahead, by minutes when this machine is busy.
lab_make_guest_disk()
{
    local base=lab_disk_$2
    if [[ $2 == empty ]]; then
        rm -f "$1"
        mke2fs -q -t ext4 -m 0 -E lazy_itable_init=1,lazy_journal_init=1 "$1" 128M >/dev/null
    else
        cp --sparse=always "${!base}" "$1"
    fi
}

# Cards for the topology's virtio ports: each is connected to one of the outside's through a hub.
lab_qemu_cards()
{
    local word name kind mac hub=0
    while read -r word name kind mac; do
        if [[ $word == port && $kind == virtio ]]; then
            printf '%s\n' \
                -netdev "hubport,id=in-$name,hubid=$hub" \
                -device "virtio-net-pci,netdev=in-$name,mac=$mac,romfile=" \
                -netdev "hubport,id=out-$name,hubid=$hub" \
                -device "virtio-net-pci,netdev=out-$name,mac=06${mac#??},romfile="
            hub=$((hub + 1))
        fi
    done <"$(lab_topology_folder "$1")/topology"
}

# Memory is not cleared before each use, which takes an emulated processor a tenth of its time.
lab_kernel_line()
{
    echo "console=ttyS0 quiet panic=-1 init_on_alloc=0 mitigations=off nokaslr random.trust_cpu=on" \
        "tsc=reliable nolapic_timer no_timer_check net.ifnames=0 audit=0" \
        "modprobe.blacklist=ata_piix,ata_generic,loop,dm_mod,floppy,psmouse $*"
}

# lab_start_guest SECONDS MACHINE TOPOLOGY IMAGE DISK WORDS QEMU-ARGUMENT...: replaces the calling
# process by the guest, which is ended after that many seconds (0: never). The serial lines are, in
# this order: console, report, results.
lab_start_guest()
{
    local seconds=$1 machine=$2 topology=$3 image=$4 disk=$5 words=$6 arguments
    shift 6
    mapfile -t arguments < <(lab_qemu_arguments "$machine" "$disk"; lab_qemu_cards "$topology")
    exec timeout --foreground -k 5 "$seconds" qemu-system-x86_64 "${arguments[@]}" \
        -kernel "$lab_kernel" -initrd "$image" -append "$(lab_kernel_line "$words")" "$@"
}

# lab_line FILE: a serial line that goes on where an earlier boot ended.
lab_line()
{
    local id=${1##*/}
    printf '%s\n' -chardev "file,id=line-$id,path=$1,append=on" -serial "chardev:line-$id"
}

# A guest on this terminal: $1 machine, $2 topology, $3 case folder or empty, $4 network manager or
# empty, $5 its disk: fresh, ready, empty, or none. A guest with a disk is started again when it restarts.
lab_stay()
{
    local folder lines
    folder=$(mktemp -d "$lab_build/shell.XXXXXX")
    # shellcheck disable=SC2064 # the folder's name as it is now
    trap "rm -rf '$folder'" EXIT
    if [[ $1 == namespaces ]]; then
        lab_make_namespaces_tree "$folder/tree" "$2" "$3"
        (lab_start_namespaces 0 "$folder/tree" lab.here "$folder/results.tar")
        return
    fi
    lab_make_guest_image "$folder/image" "$1" "$2" "$3" "$4"
    if [[ -n $5 ]]; then
        lab_make_guest_disk "$folder/disk" "$5"
    fi
    mapfile -t lines < <(lab_line "$folder/report")
    while true; do
        (lab_start_guest 0 "$1" "$2" "$folder/image" "$folder/disk" lab.here -serial mon:stdio \
            "${lines[@]}" -serial null) || true
        if [[ -z $5 ]] || grep -q '^lab-left' "$folder/report"; then
            return
        fi
    done
}
