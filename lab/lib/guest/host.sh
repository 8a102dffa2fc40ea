# shellcheck shell=bash disable=SC2154 # variables of the guest's other files
# The host under test: what it is told, and how it must look.

lab_ifcfg=/etc/sysconfig/network-scripts/ifcfg-
lab_state=/usr/vorn/etc/vornovs

# Two names for one lock: the one that clients know, and the one that only root can reach.
lab_lock_files='/tmp/ovs_config.lock /run/vornovs/file!tmp!ovs_config.lock'

# timed NAME COMMAND...: runs a command that must succeed and records how long it took.
timed()
{
    local name="$1" began status=0
    shift
    began="$EPOCHREALTIME"
    "$@" || status=$?
    figure "$name took" "$(awk -v a="$began" -v b="$EPOCHREALTIME" 'BEGIN { printf "%.2f", b - a }')" s
    [ "$status" -eq 0 ] || fail "'$*' ended with $status"
}

# The interfaces that have a file, in order of name.
host_interfaces()
{
    local file
    for file in /lab/topology/host"$lab_ifcfg"*; do
        echo "${file##*/ifcfg-}"
    done
}

# kind_of INTERFACE: bond, slave, vlan or port, as its file says.
kind_of()
{
    local file="/lab/topology/host$lab_ifcfg$1"
    if grep -q '^BONDING_OPTS=' "$file"; then
        echo bond
    elif grep -q '^MASTER=' "$file"; then
        echo slave
    elif grep -q '^VLAN=yes' "$file"; then
        echo vlan
    else
        echo port
    fi
}

# host_of_kind KIND...: the interfaces of these kinds.
host_of_kind()
{
    local interface kind
    for interface in $(host_interfaces); do
        kind="$(kind_of "$interface")"
        case " $* " in
            *" $kind "*) echo "$interface" ;;
        esac
    done
}

# The interfaces that get a bridge of their own when the host goes on to the switch.
host_ports()
{
    host_of_kind port bond
}

# The slaves of a Linux bond, as its slaves' files say.
slaves_of()
{
    local interface
    for interface in $(host_of_kind slave); do
        if grep -q "^MASTER=$1\$" "/lab/topology/host$lab_ifcfg$interface"; then
            echo "$interface"
        fi
    done
}

# The VLAN on an interface; empty when there is none.
vlan_on()
{
    local interface
    for interface in $(host_of_kind vlan); do
        if [ "${interface%.*}" = "$1" ]; then
            echo "$interface"
        fi
    done
}

# The interface whose addresses the bridge of a port or bond takes over.
addressed()
{
    local vlan
    vlan="$(vlan_on "$1")"
    echo "${vlan:-$1}"
}

# The address and prefix length that a device has now, link-local ones left out.
addresses_of()
{
    ip -oneline address show dev "$1" scope global | awk '{ print $4 }' | sort
}

default_routes()
{
    { ip -4 route show default; ip -6 route show default; } |
        sed -e 's/ proto [^ ]*//' -e 's/ pref medium//' -e 's/ *$//' | sort
}

# Remembers how the interfaces look in plain Linux networking.
remember_plain()
{
    local name
    wait_until 30 bonds_settled
    snapshot plain
    default_routes >"$lab_out/plain-default-routes"
    for name in $(host_interfaces); do
        addresses_of "$name" >"$lab_out/plain-addresses-$name"
        cat "/sys/class/net/$name/address" >"$lab_out/plain-mac-$name"
        cat "/sys/class/net/$name/mtu" >"$lab_out/plain-mtu-$name"
        cp -p "$lab_ifcfg$name" "$lab_out/plain-ifcfg-$name"
    done
}

# True when the slave of an aggregate collects and distributes frames, which it does some time after
# both sides have found each other.
slave_distributes()
{
    local state
    state="$(cat "/sys/class/net/$1/bonding_slave/ad_actor_oper_port_state" 2>/dev/null)"
    [ $((${state:-0} & 48)) -eq 48 ]
}

# True when each Linux bond has as many ports in use as its mode gives it, and agrees with its
# partner where it has one.
bonds_settled()
{
    local bond folder slave
    for bond in $(host_of_kind bond); do
        folder="/sys/class/net/$bond/bonding"
        [ -d "$folder" ] || return 1
        for slave in $(slaves_of "$bond"); do
            [ "$(cat "/sys/class/net/$slave/bonding_slave/mii_status" 2>/dev/null)" = up ] || return 1
            if grep -q '802.3ad' "$folder/mode"; then
                slave_distributes "$slave" || return 1
            fi
        done
        if grep -q '802.3ad' "$folder/mode"; then
            expect_partner "$bond" || return 1
        fi
    done
}

# True when the Linux bond's aggregate has all its ports and a partner.
expect_partner()
{
    local folder="/sys/class/net/$1/bonding" slave end state ports=0
    for slave in $(slaves_of "$1"); do
        ports=$((ports + 1))
        for end in actor partner; do
            state="$(cat "/sys/class/net/$slave/bonding_slave/ad_${end}_oper_port_state")"
            # Collecting and distributing.
            [ $((state & 48)) -eq 48 ] || return 1
        done
    done
    [ "$(cat "$folder/ad_num_ports")" = "$ports" ] &&
        [ "$(cat "$folder/ad_partner_mac")" != 00:00:00:00:00:00 ]
}

# Every port and bond of the host is carried by its bridge.
expect_on_switch()
{
    local name
    for name in $(host_of_kind port); do
        expect_port_on_switch "$name"
        [ -n "$(vlan_on "$name")" ] || expect_bridge_files "$name"
    done
    for name in $(host_of_kind bond); do
        expect_bond_on_switch "$name"
    done
    for name in $(host_of_kind vlan); do
        expect_vlan_on_switch "$name"
    done
    sed -E 's/ dev ([^. ]*)(\.[0-9]+)?/ dev ovs_\1/' "$lab_out/plain-default-routes" | sort \
        >"$lab_out/wanted-routes"
    default_routes >"$lab_out/got-routes"
    expect_same_text "the default routes" "$lab_out/wanted-routes" "$lab_out/got-routes"
}

expect_port_on_switch()
{
    local port="$1" bridge="ovs_$1"
    expect_equal "the bridge of $port" "$bridge" "$(ovs-vsctl --timeout=10 port-to-br "$port" 2>&1)"
    expect_equal "the hardware address of $port" "$(cat "$lab_out/plain-mac-$port")" \
        "$(cat "/sys/class/net/$port/address")"
    expect_equal "the addresses of $port" "" "$(addresses_of "$port")"
    expect_bridge_like "$port"
}

# The bridge has the hardware address, MTU and addresses of the interface that it stands for.
expect_bridge_like()
{
    local name="$1" bridge="ovs_$1"
    expect_equal "the hardware address of $bridge" "$(cat "$lab_out/plain-mac-$name")" \
        "$(cat "/sys/class/net/$bridge/address")"
    expect_equal "the MTU of $bridge" "$(cat "$lab_out/plain-mtu-$(addressed "$name")")" \
        "$(cat "/sys/class/net/$bridge/mtu")"
    expect_equal "the addresses of $bridge" \
        "$(cat "$lab_out/plain-addresses-$(addressed "$name")")" "$(addresses_of "$bridge")"
}

# switch_value TABLE RECORD COLUMN, without quotes
switch_value()
{
    ovs-vsctl --timeout=10 --if-exists get "$1" "$2" "$3" | tr -d '"'
}

# The Linux bond is gone and its slaves are one bond of the switch, in the mode that stands for the
# Linux bond's.
expect_bond_on_switch()
{
    local bond="$1" bridge="ovs_$1" slave linux mode lacp name slaves
    linux="$(sed -n 's/^BONDING_OPTS=.*mode=\([^ "]*\).*/\1/p' "$lab_out/plain-ifcfg-$bond")"
    case $linux in
        active-backup | 1) mode=active-backup lacp=off name=ovs-active-backup ;;
        802.3ad | 4) mode=balance-tcp lacp=active name=ovs-balance-tcp ;;
        *) mode=balance-slb lacp=off name=ovs-balance-slb ;;
    esac
    mapfile -t slaves < <(slaves_of "$bond")
    expect_switch_bond "$bond" "$mode" "$lacp" "${slaves[@]}"
    expect_bridge_like "$bond"
    expect_line "$lab_ifcfg$bridge" "DEVICE=$bridge"
    expect_line "$lab_ifcfg$bridge" "BOND_MODE=$name"
    expect_line "$lab_ifcfg$bridge" "BONDING_OPTS=\"bond_mode=$mode lacp=$lacp\""
    expect_line "$lab_ifcfg$bridge" "SLAVE_LIST=\"$(printf '%s ' "${slaves[@]}")\""
    for slave in "${slaves[@]}"; do
        expect_line "$lab_ifcfg$slave" "MASTER=$bridge"
        expect_line "$lab_ifcfg$slave" "SLAVE=yes"
        expect_line "${lab_ifcfg}ovs_$slave" "SLAVE=yes"
    done
    [ ! -e "/sys/class/net/$bond" ] || fail "the Linux bond $bond is there still"
    [ ! -e "$lab_ifcfg$bond" ] || fail "the Linux bond $bond has a file still"
}

# expect_switch_bond BOND MODE LACP SLAVE...: the bridge of a bond, its mode and its members.
expect_switch_bond()
{
    local bridge="ovs_${1#ovs_}" mode="$2" lacp="$3" port slave
    shift 3
    expect_equal "the members of $bridge" "$(printf '%s\n' "$@" | sort)" \
        "$(ovs-vsctl --timeout=10 list-ifaces "$bridge" 2>&1 | sort)"
    port="$(ovs-vsctl --timeout=10 list-ports "$bridge")"
    expect_equal "the mode of $bridge" "$mode" "$(switch_value Port "$port" bond_mode)"
    expect_equal "LACP of $bridge" "$lacp" "$(switch_value Port "$port" lacp)"
    if [ "$lacp" = active ]; then
        wait_until 30 switch_negotiated "$port"
    fi
    for slave in "$@"; do
        [ ! -e "/sys/class/net/ovs_$slave" ] || fail "the bridge ovs_$slave is there still"
        expect_equal "the addresses of $slave" "" "$(addresses_of "$slave")"
        expect_equal "IPv6 of $slave is off" 1 "$(cat "/proc/sys/net/ipv6/conf/$slave/disable_ipv6")"
    done
}

# True when the switch agreed with its partner on every member of a bond.
switch_negotiated()
{
    ovs-appctl --timeout=10 lacp/show "$1" >"$lab_out/lacp" || return 1
    grep -q 'status: .*negotiated' "$lab_out/lacp" &&
        ! grep -E '^(member|slave):' "$lab_out/lacp" | grep -v ': current attached'
}

# The VLAN's interface is gone, and its id is the tag of its parent's bridge.
expect_vlan_on_switch()
{
    local parent="${1%.*}" id="${1##*.}"
    expect_equal "the tag of ovs_$parent" "$id" "$(switch_value Port "ovs_$parent" tag)"
    expect_line "${lab_ifcfg}ovs_$parent" "OVS_VLAN_ID=$id"
    [ ! -e "/sys/class/net/$1" ] || fail "the VLAN interface $1 is there still"
    [ ! -e "$lab_ifcfg$1" ] || fail "the VLAN interface $1 has a file still"
}

# The bridge's file is the port's with three keys changed, and the port's gained one.
expect_bridge_files()
{
    local port="$1" plain="$lab_out/plain-ifcfg-$1"
    { cat "$plain"; echo "BRIDGE=ovs_$port"; } >"$lab_out/wanted"
    expect_same_text "the file of $port" "$lab_out/wanted" "$lab_ifcfg$port"

    sed -E "s/^DEVICE=.*/DEVICE=ovs_$port/" "$plain" >"$lab_out/wanted"
    grep -Ev '^(TYPE|PRIMARY)=' "${lab_ifcfg}ovs_$port" >"$lab_out/got"
    expect_same_text "the file of ovs_$port" "$lab_out/wanted" "$lab_out/got"
    expect_line "${lab_ifcfg}ovs_$port" "TYPE=OVS"
    expect_line "${lab_ifcfg}ovs_$port" "PRIMARY=$port"
}

# expect_same_text WHAT WANTED-FILE GOT-FILE
expect_same_text()
{
    if ! diff -U 0 "$2" "$3" >"$lab_out/difference"; then
        show <"$lab_out/difference"
        fail "$1 are not what they must be"
    fi
}

# The host is plain again and in everything what it was.
expect_plain()
{
    wait_until 60 bonds_settled
    snapshot "${1:-home}"
    expect_unchanged plain "${1:-home}"
}

# A name a line. There is no file while there is no client.
registered_clients()
{
    if [ -e "$lab_state/ovs_reg.conf" ]; then
        cat "$lab_state/ovs_reg.conf"
    fi
}

# expect_registered NAME...: these and no others.
expect_registered()
{
    local wanted
    wanted="$(printf '%s\n' "$@" | sed '/^$/d' | sort)"
    expect_equal "the registered clients" "$wanted" "$(registered_clients)"
}

# True when no process holds the configuration lock.
lock_is_free()
{
    local file
    for file in $lab_lock_files; do
        if [ -e "$file" ] && ! flock -n "$file" true; then
            return 1
        fi
    done
}

expect_lock_free()
{
    lock_is_free || fail "the configuration lock is held: $(grep -h . /proc/locks)"
}

# True when no program runs for a client: neither the client nor what it started.
client_is_gone()
{
    no_process_named vornovsctl vornrun vornnetdtool
}

# Brings a host home as its manual says, whatever state a killed client left.
bring_home()
{
    local name
    expect_success /etc/rc.network start
    if [ -s "$lab_state/ovs_reg.conf" ]; then
        while read -r name; do
            expect_success vornovsctl unregister "$name"
        done < <(registered_clients)
        if ! bridge_files_left; then
            return
        fi
        note "a bridge's file is left"
    fi
    expect_success vornovsctl register home
    expect_success vornovsctl unregister home
}

# For a host whose client was killed: one command takes it to a whole state, with which a second one
# has nothing to do.
repair_host()
{
    expect_success vornovsctl repair
    expect_equal "what a second repair says" "Everything fits together." "$(vornovsctl repair 2>&1)"
}

# The same, and who is registered then can leave.
mend()
{
    local name
    repair_host
    if [ -s "$lab_state/ovs_reg.conf" ]; then
        while read -r name; do
            expect_success vornovsctl unregister "$name"
        done < <(registered_clients)
    fi
}

# True when a bridge has a configuration file.
bridge_files_left()
{
    compgen -G "${lab_ifcfg}ovs_*" >/dev/null
}
