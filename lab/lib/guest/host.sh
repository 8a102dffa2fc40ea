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

# The ports whose interfaces have a file, so that they go on to the switch; in order of name.
host_ports()
{
    local file
    for file in /lab/topology/host"$lab_ifcfg"*; do
        echo "${file##*/ifcfg-}"
    done
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

# Remembers how the ports look in plain Linux networking.
remember_plain()
{
    local port
    snapshot plain
    default_routes >"$lab_out/plain-default-routes"
    for port in $(host_ports); do
        addresses_of "$port" >"$lab_out/plain-addresses-$port"
        cp -p "$lab_ifcfg$port" "$lab_out/plain-ifcfg-$port"
    done
}

# Every port of the host is carried by its bridge.
expect_on_switch()
{
    local port
    for port in $(host_ports); do
        expect_port_on_switch "$port"
        expect_bridge_files "$port"
    done
    sed -E 's/ dev / dev ovs_/' "$lab_out/plain-default-routes" | sort >"$lab_out/wanted-routes"
    default_routes >"$lab_out/got-routes"
    expect_same_text "the default routes" "$lab_out/wanted-routes" "$lab_out/got-routes"
}

expect_port_on_switch()
{
    local port="$1" bridge="ovs_$1"
    expect_equal "the bridge of $port" "$bridge" "$(ovs-vsctl --timeout=10 port-to-br "$port" 2>&1)"
    expect_equal "the hardware address of $bridge" "$(cat "/sys/class/net/$port/address")" \
        "$(cat "/sys/class/net/$bridge/address")"
    expect_equal "the MTU of $bridge" "$(cat "/sys/class/net/$port/mtu")" \
        "$(cat "/sys/class/net/$bridge/mtu")"
    expect_equal "the addresses of $port" "" "$(addresses_of "$port")"
    expect_equal "the addresses of $bridge" "$(cat "$lab_out/plain-addresses-$port")" \
        "$(addresses_of "$bridge")"
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
    snapshot "${1:-home}"
    expect_unchanged plain "${1:-home}"
}

# expect_registered NAME...: these and no others. There is no file while there is no client.
expect_registered()
{
    local wanted
    wanted="$(printf '%s\n' "$@" | sed '/^$/d' | sort)"
    expect_equal "the registered clients" "$wanted" "$(cat "$lab_state/ovs_reg.conf" 2>/dev/null || true)"
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
    no_process_named vornovsctl && no_process_named vornrun && no_process_named vornnetdtool
}

# Brings a host home as its manual says, whatever state a killed client left.
bring_home()
{
    local name
    expect_success /etc/rc.network start
    if [ -s "$lab_state/ovs_reg.conf" ]; then
        while read -r name; do
            expect_success vornovsctl unregister "$name"
        done < <(cat "$lab_state/ovs_reg.conf")
        if ! bridge_files_left; then
            return
        fi
        note "a bridge's file is left"
    fi
    expect_success vornovsctl register home
    expect_success vornovsctl unregister home
}

# True when a bridge has a configuration file.
bridge_files_left()
{
    compgen -G "${lab_ifcfg}ovs_*" >/dev/null
}
