# shellcheck shell=bash disable=SC2154,SC2034 # variables that the lab's files share
# The appliance's file system: cpio archives that the kernel unpacks one after the other.
#   system   Debian's programs, their libraries, the kernel's modules
#   product  what this repository installs
#   guest    the guest's scripts, a topology and a case; made anew for each guest
# The machine with systemd has a disk, and only what finds it in memory:
#   loader   busybox and the modules that the disk needs
# A layer is kept as long as nothing it is made of changes.

# What the guest runs of Debian's, besides busybox.
lab_programs=(
    bin/bash bin/dash bin/cp bin/ip sbin/bridge sbin/tc bin/ss usr/bin/chrt usr/bin/flock usr/bin/fping
    usr/bin/uuidgen sbin/ldconfig usr/bin/getconf sbin/ethtool usr/sbin/dhcpcd usr/sbin/dnsmasq
    usr/bin/ovs-vsctl usr/bin/ovs-appctl usr/bin/ovs-ofctl usr/bin/ovs-dpctl
    usr/bin/ovsdb-tool usr/bin/ovsdb-client usr/sbin/ovsdb-server
    usr/lib/openvswitch-switch/ovs-vswitchd
)

# What the kernel needs for the lab, in any order: what they need in turn is found below.
lab_modules=(openvswitch bonding 8021q bridge dummy veth virtio_net virtio_pci)
lab_disk_modules=(nfit nd_pmem ext4)

lab_busybox()
{
    "$lab_debian/bin/busybox" "$@"
}

# The place of a path in a tree whose /bin, /sbin and /lib are links into /usr.
lab_merged_path()
{
    case $1 in
        bin/* | sbin/* | lib/* | lib64/*) printf 'usr/%s' "$1" ;;
        *) printf '%s' "$1" ;;
    esac
}

# Copies the libraries that a program or library needs into a tree, found first in the tree itself
# and then among Debian's packages.
lab_copy_libraries()
{
    local root=$1 program=$2 list library place
    local folder=usr/lib/x86_64-linux-gnu
    if ! head -c 4 "$program" | grep -q ELF; then
        return
    fi
    if ! list=$("$lab_debian/lib64/ld-linux-x86-64.so.2" --inhibit-cache --library-path \
        "$root/usr/lib:$root/$folder:$lab_debian/lib/x86_64-linux-gnu:$lab_debian/$folder" \
        --list "$program" 2>&1); then
        # A static program asks for nothing.
        if [[ $list == *"not a dynamic executable"* || $list == *"statically linked"* ]]; then
            return
        fi
        die "cannot load $program: $list"
    fi
    while read -r library; do
        place=$folder/${library##*/}
        [[ $library == "$lab_debian"/* && ! -e $root/$place ]] || continue
        cp -L "$library" "$root/$place"
    done < <(sed -n 's/.* => \(\/.*\) (0x.*/\1/p' <<<"$list")
}

# Prints a module's file and those of the modules it needs, needed ones first.
lab_module_order()
{
    local modules=$1 name=$2 file needs
    file=$(find "$modules" -name "${name//_/[-_]}.ko" -print -quit)
    if [[ -z $file ]]; then
        if grep -q "/${name//_/[-_]}\.ko$" "$modules/modules.builtin"; then
            return
        fi
        die "the kernel has no module $name"
    fi
    needs=$(lab_busybox strings "$file" | sed -n "s/^depends=//p")
    for name in ${needs//,/ }; do
        lab_module_order "$modules" "$name"
    done
    printf '%s\n' "$file"
}

# lab_install_modules FOLDER MODULE...
lab_install_modules()
{
    local folder=$1 modules name file
    shift
    modules=$(echo "$lab_debian"/lib/modules/*)
    mkdir -p "$folder"
    for name in "$@"; do
        lab_module_order "$modules" "$name"
    done | awk '!seen[$0]++' | while read -r file; do
        cp "$file" "$folder/"
        printf '%s\n' "${file##*/}" >>"$folder/order"
    done
}

lab_make_loader()
{
    local root=$1
    mkdir -p "$root"/{bin,dev,proc,sys,root}
    cp "$lab_debian/bin/busybox" "$root/bin/"
    lab_install_modules "$root/modules" "${lab_disk_modules[@]}"
}

lab_make_system()
{
    local root=$1 path place applet folder
    mkdir -p "$root"/{dev,proc,sys,run,tmp,root,var/lib,var/log/openvswitch,etc/openvswitch} \
        "$root"/usr/{bin,sbin,lib/x86_64-linux-gnu,lib64,share,local/bin}
    for folder in bin sbin lib lib64; do
        ln -s "usr/$folder" "$root/$folder"
    done
    ln -s /run "$root/var/run"
    ln -s /run/lock "$root/var/lock"
    chmod 1777 "$root/tmp"

    cp "$lab_debian/bin/busybox" "$root/usr/bin/busybox"
    while read -r applet; do
        ln -s busybox "$root/usr/bin/$applet"
    done < <(lab_busybox --list | grep -vx -e busybox -e init -e linuxrc)

    cp -L "$lab_debian/lib64/ld-linux-x86-64.so.2" "$root/usr/lib64/"
    for path in "${lab_programs[@]}"; do
        place=$root/$(lab_merged_path "$path")
        mkdir -p "${place%/*}"
        # The applet of the same name gives way to Debian's program.
        rm -f "$place" "$root/usr/bin/${path##*/}"
        cp -L "$lab_debian/$path" "$place"
        lab_copy_libraries "$root" "$place"
    done
    ln -sf dash "$root/usr/bin/sh"
    ln -s ../bin/ip "$root/usr/sbin/ip"
    ln -s ../lib/openvswitch-switch/ovs-vswitchd "$root/usr/sbin/ovs-vswitchd"
    cp -r "$lab_debian/usr/share/openvswitch" "$root/usr/share/"
    mkdir -p "$root/etc/default" "$root/etc/iproute2"
    cp "$lab_debian/etc/default/openvswitch-switch" "$root/etc/default/"
    find "$lab_debian/etc/iproute2" -maxdepth 1 -type f -exec cp -t "$root/etc/iproute2" {} +

    cp -r "$lab_debian/usr/lib/dhcpcd" "$root/usr/lib/"
    cp "$lab_debian/etc/dhcpcd.conf" "$root/etc/"
    mkdir -p "$root/var/lib/dhcpcd"

    printf 'root:x:0:0:root:/root:/bin/sh\n' >"$root/etc/passwd"
    printf 'dhcpcd:x:102:65534::/usr/lib/dhcpcd:/bin/false\n' >>"$root/etc/passwd"
    printf 'root:x:0:\nnogroup:x:65534:\n' >"$root/etc/group"
    printf '127.0.0.1 localhost appliance\n::1 localhost\n' >"$root/etc/hosts"
    printf 'passwd: files\ngroup: files\nhosts: files\n' >"$root/etc/nsswitch.conf"
    printf 'icmp 1 ICMP\nudp 17 UDP\ntcp 6 TCP\nipv6-icmp 58 IPv6-ICMP\n' >"$root/etc/protocols"
    printf '12\n' >"$root/etc/debian_version"
    : >"$root/etc/resolv.conf"
    printf 'appliance\n' >"$root/etc/hostname"
    lab_install_modules "$root/lab/modules" "${lab_modules[@]}"
    lab_install_modules "$root/lab/disk-modules" "${lab_disk_modules[@]}"
}

# What the repository installs, and the libraries of Debian's that it needs.
lab_make_product()
{
    local root=$1 file
    mkdir -p "$root/usr/lib/x86_64-linux-gnu"
    if lab_is_installed; then
        lab_copy_installed "$root"
    else
        DESTDIR=$root cmake --install "$lab_release" --strip --prefix /usr >"$lab_build/install.log" ||
            die "cmake --install failed: see $lab_build/install.log"
        lab_build_clients "$root"
    fi
    rm -rf "$root/usr/include" "$root"/usr/share/{man,vornovs-lab,zsh,bash-completion}
    while read -r file; do
        lab_copy_libraries "$root" "$file"
    done < <(find "$root" -type f \( -perm -u+x -o -name '*.so*' \))
}

# What this machine has of the repository's packages, without settings and state.
lab_copy_installed()
{
    local root=$1 path
    while read -r path; do
        if [[ -d $path && ! -L $path ]]; then
            mkdir -p "$root$path"
        else
            cp -P "$path" "$root$path"
        fi
    done < <(dpkg-query -L "${lab_product_packages[@]}" | sed -e '/^$/d' -e '/^\/\.$/d' \
        -e '/^\/usr\/share\/doc/d' | LC_ALL=C sort -u)
}

# The lab's own clients, one source file each: lib*.cpp are loaded into other programs, the others
# are programs that are linked to the installed library.
lab_build_clients()
{
    local root=$1 source name folder
    folder=$(dirname "$(find "$root/usr/lib" -name libvornovs.so -print -quit)")
    mkdir -p "$root/lab/clients"
    for source in "$lab_source"/clients/*.cpp; do
        name=$(basename "$source" .cpp)
        set -- -std=c++20 -O1 -fcf-protection=full -Wall -Wextra -Werror \
            -I "$lab_root/include" -I "$lab_root/src/platform" "$source"
        if [[ $name == lib* ]]; then
            set -- "$@" -shared -fPIC -o "$root/lab/clients/$name.so" -ldl
        else
            set -- "$@" -o "$root/lab/clients/$name" -L "$folder" -Wl,-rpath-link,"$folder" \
                -Wl,--as-needed -lvornovs
        fi
        "${CXX:-c++}" "$@" || die "the client $source does not build"
    done
}

# Makes an archive of a tree; everything in it belongs to root.
lab_archive()
{
    local root=$1 archive=$2
    (cd "$root" && find . -mindepth 1 | LC_ALL=C sort |
        lab_busybox cpio -o -H newc -R 0:0 2>/dev/null) >"$archive.new"
    mv "$archive.new" "$archive"
}

# Makes a layer with the function given unless it was made of the same things, and sets
# $lab_layer to its archive.
lab_layer()
{
    local name=$1 make=$2 print=$3
    local root=$lab_layers/$name
    lab_layer=$lab_layers/$name-$print.cpio
    if [[ -f $lab_layer ]]; then
        return
    fi
    say_note "making the lab's $name layer"
    rm -rf "$root" "$lab_layers/$name"-*.cpio
    mkdir -p "$root"
    "$make" "$root"
    lab_archive "$root" "$lab_layer"
}

# Makes the layers; sets $lab_kernel, $lab_image and $lab_loader.
lab_make_image()
{
    local here=${BASH_SOURCE[0]} system product turn
    mkdir -p "$lab_layers"
    # Two runs of the lab share what they make.
    exec {turn}>"$lab_build/.turn"
    flock "$turn"
    lab_fetch_packages
    lab_kernel=$(echo "$lab_debian"/boot/vmlinuz-*)

    lab_layer system lab_make_system \
        "$(printf '%s\n' "$here" "$lab_debian/.packages" | fingerprint)"
    system=$lab_layer
    lab_layer loader lab_make_loader "$(printf '%s\n' "$here" "$lab_debian/.packages" | fingerprint)"
    lab_loader=$lab_layer
    lab_layer product lab_make_product "$(lab_product_files | fingerprint)"
    product=$lab_layer

    lab_image=$lab_layers/image.cpio
    if [[ ! $lab_image -nt $system || ! $lab_image -nt $product ]]; then
        cat "$system" "$product" >"$lab_image.new"
        mv "$lab_image.new" "$lab_image"
    fi
    exec {turn}>&-
}

# Everything that decides what the product layer holds.
lab_product_files()
{
    printf '%s\n' "${BASH_SOURCE[0]}" "$lab_debian/.packages"
    if lab_is_installed; then
        dpkg-query -L "${lab_product_packages[@]}" | while read -r path; do
            [[ ! -f $path ]] || printf '%s\n' "$path"
        done
        return
    fi
    find "$lab_root/lab/clients" -name '*.cpp'
    find "$lab_release/bin" "$lab_release/lib" -type f
    find "$lab_root/host" "$lab_root/tools" -type f ! -name '*.cpp' ! -name '*.h'
    find "$lab_release" -name cmake_install.cmake
}

# Fills a folder with what is a guest's own: $1 folder, $2 machine, $3 topology, $4 case folder or
# empty, $5 network manager, empty for the case's.
lab_fill_guest()
{
    local root=$1 machine=$2 topology=$3 case_folder=$4 manager=$5
    mkdir -p "$root/lab/topology" "$root/lab/case"
    cp "$lab_source"/lib/guest/* "$root/lab/"
    cp -r "$(lab_topology_folder "$topology")/." "$root/lab/topology/"
    if [[ -n $case_folder ]]; then
        cp -r "$case_folder/." "$root/lab/case/"
    fi
    if [[ -n $manager ]]; then
        echo "$manager" >"$root/lab/case/manager"
    fi
    # What kind of machine it is, it sees by these.
    case $machine in
        systemd) cp -r "$lab_source/lib/machine" "$root/lab/" ;;
        namespaces) cp -r "$lab_source/lib/namespaces" "$root/lab/" ;;
    esac
}

# Writes the archive that a guest starts from: $1 archive, and as above.
lab_make_guest_image()
{
    local archive=$1 machine=$2 root base=$lab_image
    shift
    root=$(mktemp -d "$lab_build/guest.XXXXXX")
    lab_fill_guest "$root" "$@"
    if [[ $machine == systemd ]]; then
        base=$lab_loader
        cp -r "$lab_layers/product/lab/clients" "$root/lab/"
        mkdir -p "$root/lab/packages/vornovs"
        cp "$lab_packages_folder"/{*.deb,Packages} "$root/lab/packages/vornovs/"
        # What it tells people to do is done in a case.
        cp "$lab_root/README.md" "$root/lab/"
        ln -s lab/machine/init "$root/init"
    else
        ln -s lab/init "$root/init"
    fi
    chmod 755 "$root/init"
    lab_archive "$root" "$root.cpio"
    cat "$base" "$root.cpio" >"$archive"
    rm -rf "$root" "$root.cpio"
}

# Builds the packages that the host with systemd installs.
lab_build_packages()
{
    "$lab_root/scripts/package" >"$lab_build/packages.log" 2>&1 || {
        tail -n 30 "$lab_build/packages.log" >&2
        die "the packages do not build: see $lab_build/packages.log"
    }
}

# Builds what the appliance runs; the tests are not part of it.
lab_build_release()
{
    say_note "building the release"
    ensure_host_packages "${build_packages[@]}"
    mkdir -p "$lab_build"
    (cd "$lab_root" && cmake --preset release &&
        cmake --build --preset release --target src/all host/all tools/all man/all) \
        >"$lab_build/release.log" 2>&1 || {
        tail -n 30 "$lab_build/release.log" >&2
        die "the release does not build: see $lab_build/release.log"
    }
}
