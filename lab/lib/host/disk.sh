# shellcheck shell=bash disable=SC2154,SC2034 # variables that the lab's files share
# The disk of the machine with systemd: Debian from its packages, as an installation leaves it.
#   base.tar     what mmdebstrap makes of the packages below
#   fresh.ext4   the same as a file system, with the lab's settings; no guest ever writes to it
#   ready.ext4   that with this repository's packages, which an emulated processor would take a
#                minute to install; the case `packages` does, with the disk above

# What a host has before this repository's packages come: every network manager, none in charge.
lab_disk_packages=(
    systemd systemd-sysv udev dbus kmod libpam-systemd procps
    ifupdown isc-dhcp-client ifenslave vlan network-manager netplan.io
    iproute2 iputils-ping ethtool fping dnsmasq-base tcpdump
)

# What apt is offered as a folder of packages: what the repository's need besides, and one that
# excludes another.
lab_offered_packages=(
    openvswitch-switch dhcpcd-base openresolv libnl-3-200 libnl-route-3-200 libsystemd0 libstdc++6
    systemd-resolved
)

# lab_make_disks KIND...: sets $lab_disk_fresh and $lab_disk_ready, and makes the named ones of them
# unless they were made of the same things.
lab_make_disks()
{
    local folder=$lab_build/disk here=${BASH_SOURCE[0]} base made_of kind image turn
    base=$folder/base-$(lab_disk_packages_print).tar
    made_of=("$here" "${here%/*}/write-disk" "$lab_debian/.packages")
    lab_disk_fresh=$folder/fresh-$(printf '%s\n' "${made_of[@]}" | fingerprint).ext4
    made_of+=("$lab_packages_folder/Packages")
    lab_disk_ready=$folder/ready-$(printf '%s\n' "${made_of[@]}" | fingerprint).ext4
    mkdir -p "$folder"
    exec {turn}>"$folder/.turn"
    flock "$turn"
    for kind in "$@"; do
        image=lab_disk_$kind
        image=${!image}
        if [[ ! -f $image ]]; then
            ensure_host_packages mmdebstrap e2fsprogs dpkg-dev
            rm -f "$folder/$kind"-*.ext4
            [[ -f $base ]] || lab_bootstrap "$base"
            lab_write_disk "$base" "$kind" "$image"
        fi
    done
    exec {turn}>&-
}

lab_disk_packages_print()
{
    printf '%s\n' "${lab_disk_packages[@]}" - "${lab_offered_packages[@]}" | sha256sum | cut -c 1-16
}

# lab_bootstrap ARCHIVE: Debian, and in /lab/packages/debian the packages offered.
lab_bootstrap()
{
    local archive=$1 suite
    say_note "making Debian for the lab's machine with systemd"
    rm -f "${archive%/*}"/base-*.tar
    suite=$(. /etc/os-release && echo "$VERSION_CODENAME")
    # One after the other, for some of those offered exclude each other.
    # shellcheck disable=SC2016 # $1 is the hook's
    lab_package_sources | as_root mmdebstrap --mode=root --variant=minbase --format=tar \
        --aptopt='APT::Install-Recommends "false"' --aptopt='APT::Sandbox::User "root"' \
        --dpkgopt='path-exclude=/usr/share/doc/*' --dpkgopt='path-exclude=/usr/share/man/*' \
        --dpkgopt='path-exclude=/usr/share/locale/*' \
        --include="$(IFS=,; echo "${lab_disk_packages[*]}")" \
        --customize-hook='chroot "$1" apt-get clean' \
        --customize-hook="for package in ${lab_offered_packages[*]}; do
            chroot \"\$1\" apt-get install -y -q --download-only \$package; done" \
        --customize-hook='mkdir -p "$1/lab/packages/debian"' \
        --customize-hook='mv "$1"/var/cache/apt/archives/*.deb "$1/lab/packages/debian/"' \
        "$suite" - - >"$archive.new" 2>"$lab_build/bootstrap.log" ||
        die "mmdebstrap failed: see $lab_build/bootstrap.log"
    mv "$archive.new" "$archive"
}

# Where this machine gets Debian's packages from; nobody else's come into the guest.
lab_package_sources()
{
    if [[ -f /etc/apt/sources.list.d/debian.sources ]]; then
        cat /etc/apt/sources.list.d/debian.sources
    else
        cat /etc/apt/sources.list
    fi
}

# lab_write_disk ARCHIVE KIND IMAGE: only root may make the files of a whole system.
lab_write_disk()
{
    local archive=$1 kind=$2 image=$3 modules packages=()
    say_note "writing the $kind disk of the lab's machine with systemd"
    if [[ $kind == ready ]]; then
        for kind in "${lab_product_packages[@]}"; do
            packages+=("$lab_packages_folder/$kind"_*.deb)
        done
    fi
    modules=$(echo "$lab_debian"/lib/modules/*)
    as_root "$lab_source/lib/host/write-disk" "$archive" "$modules" "$image.new" "${packages[@]}" \
        >"$lab_build/disk.log" 2>&1 || die "the disk cannot be written: see $lab_build/disk.log"
    as_root chown "$(id -u):$(id -g)" "$image.new"
    mv "$image.new" "$image"
}
