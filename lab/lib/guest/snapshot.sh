# shellcheck shell=bash disable=SC2154 # variables of the guest's other files
# The state of the host's network as text, and the difference of two states.

# snapshot NAME: writes the present state to $lab_out/snapshots/NAME, a file a subject.
snapshot()
{
    local folder="$lab_out/snapshots/$1"
    wait_until 10 addresses_settled
    wait_until 10 vlans_settled
    rm -rf "$folder"
    mkdir -p "$folder"
    snapshot_links >"$folder/links"
    snapshot_addresses >"$folder/addresses"
    snapshot_routes >"$folder/routes"
    snapshot_groups >"$folder/groups"
    snapshot_sysctls >"$folder/sysctls"
    snapshot_bonds >"$folder/bonds"
    snapshot_switch >"$folder/switch"
    snapshot_files "$folder"
}

# snapshot_network NAME: only what is live in the kernel.
snapshot_network()
{
    local folder="$lab_out/snapshots/$1"
    wait_until 10 addresses_settled
    rm -rf "$folder"
    mkdir -p "$folder"
    snapshot_links >"$folder/links"
    snapshot_addresses >"$folder/addresses"
    snapshot_routes >"$folder/routes"
}

# An address of IPv6 is tentative until nobody else has claimed it.
addresses_settled()
{
    [ -z "$(ip -6 -oneline address show tentative)" ]
}

# The kernel tells up to a second later that a VLAN made anew is up.
vlans_settled()
{
    ! ip -oneline link show type vlan | grep -q ' state UNKNOWN '
}

# Numbers of interfaces and aggregates change when a device is made anew, failures of a cable are
# counted from then on, the clock of a bridge runs, and all that says nothing; the switch's own
# device is part of the switch.
snapshot_links()
{
    ip -details -oneline link show |
        sed -E -e 's/^[0-9]+: //' -e 's/@(if)?[0-9]+:/:/' -e 's/ link-netns(id)? [^ ]+//' \
            -e 's/ (ad_aggregator(_id)?|link_failure_count) [0-9]+//g' -e 's/ gc_timer +[0-9.]+//' \
            -e 's/\\//g' -e 's/  +/ /g' |
        sed '/^ovs-system:/d' | without_working_member | sort
}

# With $lab_any_member_works set leaves out which member of a bond works: where nobody has said which
# shall, it is the one whose cable was found first.
without_working_member()
{
    if [ -z "${lab_any_member_works:-}" ]; then
        cat
    else
        sed -E -e 's/ active_slave [^ ]+//' -e 's/ bond_slave state [A-Z]+/ bond_slave/' \
            -e '/\/active_slave:/d' -e "/^($(bond_members | tr '\n' '|')-) link 33:33:ff:/d"
    fi
}

bond_members()
{
    local slaves
    for slaves in /sys/class/net/*/bonding/slaves; do
        # Without a bond the pattern stands for itself.
        [ ! -e "$slaves" ] || tr ' ' '\n' <"$slaves"
    done
}

# Fleeting IPv6 addresses, one a line: temporary ones, which the kernel makes now and then, and those
# that nobody uses any more; and the multicast groups, of IPv6 and of the link, that they are asked
# for by.
fleeting()
{
    ip -6 -oneline address show |
        awk '/ (temporary|deprecated) / {
            sub("/.*", "", $4)
            print $4
            groups = split($4, group, ":")
            high = substr("0000" group[groups - 1], length(group[groups - 1]) + 3)
            low = substr("0000" group[groups], length(group[groups]) + 1)
            printf "ff02::1:ff%s:%s\n", high, group[groups]
            printf "33:33:ff:%s:%s:%s\n", high, substr(low, 1, 2), substr(low, 3)
        }'
}

snapshot_addresses()
{
    # How long addresses of servers and routers are good changes by itself.
    ip -oneline address show | grep -v -e ' temporary ' -e ' deprecated ' |
        sed -E -e 's/^[0-9]+: //' -e 's/\\//g' -e 's/_lft [0-9]+sec/_lft SECONDS/g' -e 's/  +/ /g' |
        sort
}

snapshot_routes()
{
    ip -4 -details route show table all | sed -e 's/^/4 /' -e 's/ *$//' | sort
    ip -6 -details route show table all | grep -v -F -w -f <(fleeting) | sed -E -e 's/^/6 /' -e 's/ expires [0-9]+sec//' \
        -e 's/ *$//' | sort
    ip -4 rule show | sed 's/^/rule 4 /'
    ip -6 rule show | sed 's/^/rule 6 /'
}

# Multicast groups that each interface listens to.
snapshot_groups()
{
    ip maddress show |
        awk '/^[0-9]+:/ { name = $2; next } { $1 = $1; print name, $0 }' |
        grep -v -F -w -f <(fleeting) |
        sed '/^ovs-system /d' | without_working_member | sort
}

snapshot_sysctls()
{
    # Some of them cannot be read, which is no difference.
    { grep -rs . /proc/sys/net/ipv4/conf /proc/sys/net/ipv6/conf /proc/sys/net/ipv4/neigh \
        /proc/sys/net/ipv6/neigh || true; } |
        sed -e '/\/ovs-system\//d' -e 's|^/proc/sys/||' | sort
}

# The members of a bond in the order in which they joined, or in that of their names when
# $lab_members_in_any_order is set: what finishes another's work joins first what carries nothing.
bonds_in_order()
{
    if [ -z "${lab_members_in_any_order:-}" ]; then
        cat
    else
        awk -F : '/\/(slaves|queue_id):/ {
            line = $0
            sub(/^[^:]*:/, "", line)
            count = split(line, words, " ")
            for (i = 2; i <= count; i++)
                for (j = i; j > 1 && words[j] < words[j - 1]; j--) {
                    word = words[j]; words[j] = words[j - 1]; words[j - 1] = word
                }
            printf "%s:", $1
            for (i = 1; i <= count; i++) printf "%s%s", words[i], i < count ? " " : "\n"
            next
        }
        { print }'
    fi
}

# Every option of every bond, and the slaves in their order.
snapshot_bonds()
{
    local folder
    for folder in /sys/class/net/*/bonding; do
        [ -d "$folder" ] || continue
        grep -rs . "$folder" | sed -e "s|^/sys/class/net/||" -e '/\/ad_aggregator:/d'
    done | bonds_in_order | without_working_member | sort
}

snapshot_switch()
{
    local bridge
    if ! process_named ovsdb-server; then
        return
    fi
    for bridge in $(ovs-vsctl --timeout=10 list-br); do
        echo "bridge $bridge"
        ovs-vsctl --timeout=10 list-ports "$bridge" | sed "s/^/port $bridge /"
    done
}

# Files are kept whole, with their mode and owner in a list beside them. State that comes and goes
# with the switch's use is not configuration, and neither is an empty folder for it.
snapshot_files()
{
    mkdir -p "$1/files"
    # A host need not have each of them; one that comes or goes changes the list.
    { find /etc/sysconfig /usr/vorn/etc /etc/vornovs-host.conf /etc/vorninfo.conf \
        /etc/network /etc/systemd /etc/NetworkManager /etc/netplan /etc/udev /etc/sysctl.d \
        /etc/modprobe.d /etc/dhcp /etc/resolvconf.conf /etc/resolv.conf -type f \
        2>/dev/null || true; } | sort >"$1/file-list"
    # One process for all of them: a process is what an emulated processor is slowest at.
    if [ -s "$1/file-list" ]; then
        tr '\n' '\0' <"$1/file-list" | xargs -0 stat -c '%A %U:%G %n' >"$1/file-modes"
        # Names of folders above are taken as if this were the root.
        tr '\n' '\0' <"$1/file-list" | (cd / && xargs -0 cp -p --parents -t "$1/files")
    fi
    rm "$1/file-list"
}

# snapshot_difference ONE OTHER: prints what differs; empty when nothing does. A comparison that
# could not be made is a difference too.
snapshot_difference()
{
    (
        cd "$lab_out/snapshots" || { echo "there are no snapshots"; exit; }
        { diff -r -U 0 "$1" "$2" || [ $? -eq 1 ] || echo "\"$1\" and \"$2\" cannot be compared"; } |
            sed -e '/^@@/d' -e '/^diff /d'
    )
}

# expect_unchanged ONE OTHER
expect_unchanged()
{
    snapshot_difference "$1" "$2" >"$lab_out/difference"
    if [ -s "$lab_out/difference" ]; then
        printf 'Between "%s" and "%s":\n' "$1" "$2"
        show <"$lab_out/difference"
        fail "the host at '$2' is not what it was at '$1'"
    fi
}

# expect_changed ONE OTHER PATTERN: the difference has a line that matches.
expect_changed()
{
    snapshot_difference "$1" "$2" >"$lab_out/difference"
    grep -Eq -- "$3" "$lab_out/difference" ||
        fail "the difference of '$1' and '$2' has no '$3': $(cat "$lab_out/difference")"
}
