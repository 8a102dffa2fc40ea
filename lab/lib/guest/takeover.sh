# shellcheck shell=bash disable=SC2154 # variables of the guest's other files
# A host that its manager has brought up is taken over, goes on to the switch, reboots there, and is
# given back; what must be the same all the while.

# The interfaces whose addresses the case is about and how many addresses each has, one a line, as
# the topology's file `expected` says.
takeover_expected()
{
    grep -v '^#' /lab/topology/expected
}

takeover_interfaces()
{
    takeover_expected | cut -d ' ' -f 1
}

# bearer INTERFACE: the device that bears its addresses now.
bearer()
{
    local port="${1%%.*}"
    if [ -e "/sys/class/net/ovs_$port" ]; then
        echo "ovs_$port"
    else
        echo "$1"
    fi
}

# Addresses without what changes by itself: temporary ones and those that once were, and the time
# that they are good for.
steady_addresses()
{
    ip -oneline address show dev "$1" scope global | grep -v -e ' temporary ' -e ' deprecated ' |
        awk '{ for (i = 3; i <= NF; i++) if ($i == "inet" || $i == "inet6") print $i, $(i + 1) }' |
        sort
}

# True when every interface has as many addresses as it should, none of them tentative, and all of
# them answer the outside.
host_answers()
{
    local interface count device address
    while read -r interface count; do
        device="$(bearer "$interface")"
        [ "$(steady_addresses "$device" | wc -l)" -eq "$count" ] || return 1
        [ -z "$(ip -6 -oneline address show dev "$device" tentative)" ] || return 1
        while read -r _ address; do
            in_outside fping -q -r 0 -t 200 "${address%/*}" || return 1
        done < <(steady_addresses "$device")
    done < <(takeover_expected)
}

# The default routes, without what makes no difference or changes by itself: that a gateway was said
# to be on the link, where it is; the link's MTU and hop limit, which some managers write to a
# router's routes; how long these are good for; the source address, where it is the one that the
# kernel would take without a word.
ways_out()
{
    local line device source
    while read -r line; do
        device="$(word_after dev "$line")"
        source="$(word_after src "$line")"
        if [ -n "$source" ] && [ "$source" = "$(first_address "$device" "$source")" ]; then
            line="${line/ src $source/}"
        fi
        echo "$line"
    done < <(default_routes |
        sed -E -e 's/ onlink//' -e 's/ (mtu|hoplimit) [0-9]+//g' -e 's/ expires [0-9]+sec//')
}

# word_after WORD LINE
word_after()
{
    sed -n "s/.* $1 \([^ ]*\).*/\1/p" <<<"$2"
}

# first_address DEVICE ADDRESS: the first one of the device of the same family.
first_address()
{
    local family=-4
    [[ $2 != *:* ]] || family=-6
    ip "$family" -oneline address show dev "$1" scope global |
        awk 'NR == 1 { sub("/.*", "", $4); print $4 }'
}

host_has_routes()
{
    [ "$(ways_out | wc -l)" -ge "$(wc -l <"$lab_out/managed-routes")" ]
}

# The name servers and search domains of the host, whoever wrote them; a domain is a search list of
# one.
resolver_settings()
{
    { grep -E '^(nameserver|search|domain) ' /etc/resolv.conf || true; } |
        sed -e 's/ *$//' -e 's/^domain /search /' | sort -u
}

# Who the servers take the host for. ifupdown's client of IPv6 does not say the host's name; ours
# says it to servers of both families or to none.
known_clients()
{
    if [ "$(manager_name)" = ifupdown ]; then
        servers_leases | sed -E 's/^([0-9]+ [^ ]+) [^ ]+/\1 */'
    else
        servers_leases
    fi
}

# Remembers how the host looks under its own manager.
remember_managed()
{
    local interface
    wait_until 90 host_answers
    for interface in $(takeover_interfaces); do
        steady_addresses "$interface" >"$lab_out/managed-addresses-$interface"
        show <"$lab_out/managed-addresses-$interface"
    done
    while read -r _ address; do
        echo "$([[ $address == *:* ]] && echo 6 || echo 4) ${address%/*}"
    done < <(cat "$lab_out"/managed-addresses-*) >"$lab_out/host-addresses"
    ways_out >"$lab_out/managed-routes"
    show <"$lab_out/managed-routes"
    resolver_settings >"$lab_out/managed-resolver"
    show <"$lab_out/managed-resolver"
    known_clients >"$lab_out/managed-leases"
    for interface in $(ip -brief link show | sed 's/[@ ].*//'); do
        cat "/sys/class/net/$interface/address" >"$lab_out/managed-mac-$interface"
    done
    snapshot managed
    packages_units >"$lab_out/managed-units"
}

# What starts with the machine: links of systemd's, to units or to nothing. Asking systemd itself
# takes it seconds here.
packages_units()
{
    find /etc/systemd /etc/rc?.d -type l -printf '%p %l\n' | grep -v vornovs | sort
}

# expect_same_host WHEN: at whatever device its addresses are now, the host answers at the ones it
# had, goes out by the same ways and asks the same name servers, and the servers see one client.
expect_same_host()
{
    local interface device
    wait_until 90 host_answers
    wait_until 30 host_has_routes
    cp "$lab_out/managed-routes" "$lab_out/wanted-routes"
    for interface in $(takeover_interfaces); do
        device="$(bearer "$interface")"
        steady_addresses "$device" >"$lab_out/got-addresses"
        expect_same_text "$1, the addresses of $interface, now on $device" \
            "$lab_out/managed-addresses-$interface" "$lab_out/got-addresses"
        sed -i "s/ dev $interface\\b/ dev $device/" "$lab_out/wanted-routes"
        expect_equal "$1, the hardware address of $device" \
            "$(cat "$lab_out/managed-mac-$interface")" "$(cat "/sys/class/net/$device/address")"
    done
    sort -o "$lab_out/wanted-routes" "$lab_out/wanted-routes"
    ways_out >"$lab_out/got-routes"
    expect_same_text "$1, the default routes" "$lab_out/wanted-routes" "$lab_out/got-routes"
    resolver_settings >"$lab_out/got-resolver"
    comm -23 "$lab_out/managed-resolver" "$lab_out/got-resolver" >"$lab_out/difference"
    if [ -s "$lab_out/difference" ]; then
        show <"$lab_out/difference"
        fail "$1, the host does not ask these name servers any more"
    fi
    known_clients >"$lab_out/got-leases"
    expect_same_text "$1, the leases" "$lab_out/managed-leases" "$lab_out/got-leases"
    takeover_also
}

# What a case looks at besides, each time: it may have a function of this name.
takeover_also()
{
    :
}

# expect_no_new_client WHEN: nobody has asked for an address as one who has none does.
expect_no_new_client()
{
    expect_equal "$1, clients that asked as new ones" "$(cat "$lab_out/managed-asked")" \
        "$(servers_asked DHCPDISCOVER DHCPSOLICIT)"
}

# What bears the addresses is a bridge, and every port is in one.
expect_ports_on_switch()
{
    local name
    for name in $(takeover_interfaces); do
        expect_success ovs-vsctl --timeout=10 br-exists "ovs_${name%%.*}"
    done
    for name in $(topology_ports); do
        expect_success ovs-vsctl --timeout=10 iface-to-br "$name" | show
    done
}

expect_no_switch_devices()
{
    local left
    left="$(ip -brief link show | awk '$1 ~ /^ovs_/ { print $1 }')"
    expect_equal "devices of the switch" "" "$left"
}

# Routes, for the time after a release without what is lost on the way: who made a route, and that
# its gateway was said to be on the link.
routes_when()
{
    if [ "$1" = released ]; then
        sed -E 's/^(.*) proto (boot|static)( .*)?/\1\3/; s/ onlink//'
    else
        cat
    fi
}

# True when addresses and routes are those that the manager had set up, how long they are good for
# and who set them up included: a lease that it keeps is asked for again.
manager_has_settled()
{
    [ "$(snapshot_addresses)" = "$(cat "$lab_out/snapshots/managed/addresses")" ] &&
        [ "$(snapshot_routes | routes_when "$1")" = \
            "$(routes_when "$1" <"$lab_out/snapshots/managed/routes")" ]
}

# without_filters FOLDER: where IPv6 is off and was on in between, as that of a port that comes up is,
# the card goes on to let through what is for all of its listeners, and nobody hears it.
without_filters()
{
    local interface
    while read -r interface; do
        sed -i "/^${interface//./\\.} link 33:33:/d" "$1/groups"
    done < <(sed -n 's|^net/ipv6/conf/\([^/]*\)/disable_ipv6:1$|\1|p' "$1/sysctls")
}

# The old manager's host: files, units and live network are what they were before.
expect_given_back()
{
    local folder
    # What differs after that is told by the comparison.
    (wait_until 60 manager_has_settled "$1" >/dev/null) || rm -f "$lab_out/failure"
    snapshot "$1"
    rm -rf "$lab_out/snapshots/managed-$1"
    cp -r "$lab_out/snapshots/managed" "$lab_out/snapshots/managed-$1"
    if [ "$1" = released ] && [ "$(manager_name)" != ifupdown ]; then
        # Only where the kernel itself listens to routers does it matter what the kernel would do
        # with a prefix; it is as it was after the reboot.
        sed -i '/^net\/ipv6\/conf\/[^/]*\/autoconf:/d' "$lab_out/snapshots/released/sysctls" \
            "$lab_out/snapshots/managed-released/sysctls"
    fi
    for folder in "$1" "managed-$1"; do
        routes_when "$1" <"$lab_out/snapshots/$folder/routes" >"$lab_out/routes"
        cp "$lab_out/routes" "$lab_out/snapshots/$folder/routes"
        if [ "$1" = released ]; then
            # A port whose IPv6 was on in between can count its VLAN twice as one who listens.
            sed -i 's/ users [0-9]*$//' "$lab_out/snapshots/$folder/groups"
            without_filters "$lab_out/snapshots/$folder"
        fi
    done
    expect_unchanged "managed-$1" "$1"
    packages_units >"$lab_out/got-units"
    expect_same_text "$1: what starts with the machine" "$lab_out/managed-units" \
        "$lab_out/got-units"
}

# The way through: run.sh of a case that is this way and nothing else calls takeover_phases.
takeover_phases()
{
    # shellcheck disable=SC2034 # of the snapshots
    lab_any_member_works=yes
    # shellcheck disable=SC2317 # called by name
    {
        phase_start() { takeover_start; }
        phase_switched() { takeover_switched; }
        phase_home() { takeover_home; }
    }
}

# Probes that come often enough for the limits here, at a quarter of the work.
takeover_probes()
{
    lab_probe_interval=20 probes_start
}

# The packages are there already; `packages` is the case about installing them.
takeover_begin()
{
    step "The host as its manager has it"
    remember_managed
    servers_asked DHCPDISCOVER DHCPSOLICIT >"$lab_out/managed-asked"
}

takeover_adopt()
{
    step "Adopt"
    expect_success vornovsctl adopt --dry-run | show
    expect_nothing_done
    takeover_probes
    timed adopt vornovsctl adopt
    expect_same_host "after adopt"
    lab_probe_after=3 probes_finish adopt "${takeover_limit:-100}"
    expect_no_new_client "after adopt"
}

expect_nothing_done()
{
    snapshot dry
    expect_unchanged managed dry
}

takeover_register()
{
    step "Register"
    takeover_probes
    timed register vornovsctl register alpha
    expect_ports_on_switch
    expect_same_host "on the switch"
    lab_probe_after=3 probes_finish register "${takeover_limit:-100}"
    expect_no_new_client "on the switch"
}

takeover_start()
{
    takeover_begin
    takeover_adopt
    takeover_register
    reboot_machine switched
}

takeover_switched()
{
    expect_same_host "after a reboot on the switch"
    expect_ports_on_switch
    expect_no_new_client "after a reboot on the switch"
    expect_registered alpha

    step "Unregister"
    takeover_probes
    timed unregister vornovsctl unregister alpha
    expect_no_switch_devices
    expect_same_host "plain again"
    lab_probe_after=3 probes_finish unregister "${takeover_limit:-100}"
    expect_no_new_client "plain again"

    step "Release"
    takeover_probes
    timed release vornovsctl release
    expect_same_host "after release"
    lab_probe_after=3 probes_finish release "${takeover_limit:-100}"
    expect_given_back released
    reboot_machine home
}

takeover_home()
{
    expect_same_host "at home after a reboot"
    expect_given_back home
    expect_no_switch_devices
}
