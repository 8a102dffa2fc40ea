# shellcheck shell=bash disable=SC2154,SC2034 # variables that the lab's files share
# Starting a guest.

# With -icount the guest's clock counts instructions: one nanosecond each, and while the processor
# idles it jumps to the next timer, so the guest's pauses cost no real time and its figures do not
# depend on what else this machine does. The seed makes the guest's random numbers repeat as well.
lab_qemu_arguments()
{
    printf '%s\n' -machine pc,accel=tcg,usb=off -cpu Nehalem,+rdrand -smp 1 -m 768 \
        -icount shift=0,sleep=off,align=off -rtc base=2026-01-01,clock=vm -seed 1 \
        -nodefaults -display none -no-reboot -no-user-config -monitor none
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
    done <"$lab_source/topologies/$1/topology"
}

lab_kernel_line()
{
    echo "console=ttyS0 quiet panic=-1 mitigations=off nokaslr random.trust_cpu=on" \
        "tsc=reliable nolapic_timer no_timer_check net.ifnames=0 audit=0 $*"
}

# lab_start_guest SECONDS TOPOLOGY IMAGE WORDS QEMU-ARGUMENT...: replaces the calling process by the
# guest, which is ended after that many seconds (0: never). The serial lines are, in this order:
# console, report, results.
lab_start_guest()
{
    local seconds=$1 topology=$2 image=$3 words=$4 arguments
    shift 4
    mapfile -t arguments < <(lab_qemu_arguments; lab_qemu_cards "$topology")
    exec timeout --foreground -k 5 "$seconds" qemu-system-x86_64 "${arguments[@]}" \
        -kernel "$lab_kernel" -initrd "$image" -append "$(lab_kernel_line "$words")" "$@"
}

# Replaces the calling process by a guest on this terminal: $1 topology, $2 case folder or empty.
lab_stay()
{
    local image
    image=$(mktemp "$lab_build/shell.XXXXXX")
    lab_make_guest_image "$image" "$1" "$2"
    # The file goes as soon as the guest has read it: the descriptor keeps it.
    exec {lab_image_handle}<"$image"
    rm -f "$image"
    lab_start_guest 0 "$1" "/dev/fd/$lab_image_handle" lab.here -serial mon:stdio \
        -serial null -serial null
}
