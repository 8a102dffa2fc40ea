# shellcheck shell=bash disable=SC2154,SC2034 # variables that the lab's files share
# The Debian packages of the appliance: downloaded and unpacked into the build folder, never
# installed.

# Programs of the appliance.
lab_packages=(
    linux-image-cloud-amd64
    bash busybox-static coreutils dash dhcpcd-base dnsmasq-base ethtool fping iproute2 libc-bin
    util-linux uuid-runtime
    openvswitch-common openvswitch-switch
)

# The repository's own that an installed lab takes from this machine.
lab_product_packages=(vornovs-host libvornovs1 vornovs-tools)

# Libraries that those and the repository's own programs need. One that is missing here is named
# when the image is made.
lab_packages+=(
    libacl1 libattr1 libbpf1 libbsd0 libc6 libcap-ng0 libcap2 libcom-err2 libdb5.3 libelf1
    libdbus-1-3 libevent-2.1-7 libgcc-s1 libgcrypt20 libgmp10 libgpg-error0 libidn2-0 libjansson4
    liblz4-1 liblzma5 libnetfilter-conntrack3 libnfnetlink0 libnftables1 libnftnl11 libsystemd0
    libudev1 libunistring2 libzstd1 libgssapi-krb5-2 libhogweed6 libk5crypto3 libkeyutils1
    libkrb5-3 libkrb5support0 libmd0 libmnl0 libnettle8 libnghttp2-14 libnl-3-200
    libnl-route-3-200 libnuma1 libpcre2-8-0 libselinux1 libssl3 libstdc++6 libtinfo6
    libtirpc3 libunbound8 libuuid1 libxdp1 libxtables12 zlib1g
)

# Prints package=version of everything the appliance is made of, as apt offers it now.
lab_wanted_packages()
{
    local kernel
    ensure_package_lists linux-image-cloud-amd64
    ensure_package_lists openvswitch-switch
    kernel=$(apt-cache depends --important linux-image-cloud-amd64 |
        sed -n 's/^ *Depends: \(linux-image-.*\)/\1/p' | head -n 1)
    [[ -n $kernel ]] || die "apt offers no linux-image-cloud-amd64"

    LC_ALL=C apt-cache policy "$kernel" "${lab_packages[@]}" |
        awk '/^[^ ].*:$/ { name = $1; sub(/:$/, "", name) }
             $1 == "Candidate:" { print name "=" $2 }' |
        grep -v '^linux-image-cloud-amd64=' | LC_ALL=C sort -u
}

# Unpacks every package into $lab_debian; does nothing when what is there is what apt offers. Tests of
# the platform want them as well, and may run beside the lab: one of them does it.
lab_fetch_packages()
{
    local stamp=$lab_debian/.packages turn
    mkdir -p "$lab_build"
    exec {turn}>"$lab_build/.fetching"
    flock "$turn"
    # apt offers the same as long as its lists are the same, and asking takes seconds.
    if [[ ! $stamp -nt /var/lib/apt/lists || ! $stamp -nt ${BASH_SOURCE[0]} ]]; then
        lab_unpack_packages "$(lab_wanted_packages)"
    fi
    exec {turn}>&-
}

lab_unpack_packages()
{
    local stamp=$lab_debian/.packages wanted=$1 archive
    if [[ -f $stamp && $(<"$stamp") == "$wanted" ]]; then
        touch "$stamp"
        return
    fi

    say_note "fetching Debian's packages for the lab"
    rm -rf "$lab_debian" "$lab_build/archives"
    mkdir -p "$lab_debian" "$lab_build/archives"
    # The sandbox user of apt cannot enter a build folder in somebody's home.
    (cd "$lab_build/archives" && xargs apt-get -q -o APT::Sandbox::User=root download <<<"$wanted") \
        >"$lab_build/fetch.log" 2>&1 ||
        die "apt cannot download the lab's packages: see $lab_build/fetch.log"
    for archive in "$lab_build"/archives/*.deb; do
        dpkg-deb -x "$archive" "$lab_debian"
    done
    rm -rf "$lab_build/archives"
    printf '%s\n' "$wanted" >"$stamp"
}
