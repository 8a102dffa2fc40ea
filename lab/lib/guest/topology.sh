# shellcheck shell=bash disable=SC2154 # variables of the guest's other files
# The appliance's ports in this namespace, and the outside world in another.
#
# Each port is on a network segment of its own, as if on a switch of its own: on a shared one Linux
# answers for an address on every port, and a probe would not notice that a port is dead.
#
# A topology's file `topology` has these lines:
#   port NAME KIND MAC      KIND veth: a pair of the guest's kernel, fastest and exactly repeatable
#                                virtio: a PCI card, connected to one of the outside's
#   switch NAME PORT...     the other ends of these ports are on one Ethernet switch
#   partner NAME OPTION=VALUE[,OPTION=VALUE]... PORT...
#                           the other ends of these ports are a bond with these options
#   outside NAME ADDRESS... the outside's addresses on the segment of a port, a switch or a partner;
#                           NAME.ID means the VLAN of that id on it
#   far ADDRESS...          addresses of a host behind the gateways
# Its folder `host` is laid over the appliance's file system.

topology_ports()
{
    awk '$1 == "port" { print $2 }' /lab/topology/topology | tr '\n' ' '
}

topology_build()
{
    local word name kind mac rest
    ip netns add outside
    in_outside ip link set lo up
    # Each of the outside's segments keeps to itself.
    in_outside sysctl -q -w net.ipv4.conf.all.arp_ignore=1 net.ipv4.conf.all.arp_announce=2 \
        net.ipv4.conf.default.rp_filter=0 net.ipv6.conf.default.accept_dad=0 \
        net.ipv6.conf.all.accept_dad=0 net.ipv6.conf.all.keep_addr_on_down=1
    if servers_there; then
        # A kernel that hears routers forgets one that says of itself that it is none.
        in_outside sysctl -q -w net.ipv6.conf.all.forwarding=1
    fi

    topology_set_cards_aside
    while read -r word name kind mac rest; do
        if [ "$word" = port ]; then
            topology_port "$name" "$kind" "$mac"
        fi
    done </lab/topology/topology
    while read -r word name rest; do
        case $word in
            switch) topology_switch "$name" "$rest" ;;
            partner) topology_partner "$name" "${rest%% *}" "${rest#* }" ;;
        esac
    done </lab/topology/topology
    while read -r word name rest; do
        case $word in
            outside) topology_outside "$name" "$rest" ;;
            far) topology_far "$name $rest" ;;
        esac
    done </lab/topology/topology

    # A machine that has a disk gets them once, one with systemd with its manager.
    if [ -d /lab/topology/host ] && ! machine_has_systemd && [ ! -e /lab/state/boots ]; then
        cp -a /lab/topology/host/. /
    fi
}

topology_port()
{
    local name="$1" kind="$2" mac="$3"
    local peer_mac="06${mac#??}"
    if [ "$kind" = veth ]; then
        ip link add "$name" address "$mac" type veth peer name "out-$name" address "$peer_mac" \
            netns outside
    else
        # The hardware address tells which of the cards is meant.
        topology_rename "$mac" "$name"
        topology_rename "$peer_mac" "out-$name"
        ip link set "out-$name" netns outside
    fi
    in_outside ip link set "out-$name" mtu 9000 up
}

# The kernel numbers cards as it finds them, which takes names that ports want.
topology_set_cards_aside()
{
    local folder number=0
    for folder in /sys/class/net/eth*/; do
        [ -d "$folder" ] || continue
        ip link set "$(basename "$folder")" name "card$number"
        number=$((number + 1))
    done
}

# topology_rename MAC NAME
topology_rename()
{
    local folder
    for folder in /sys/class/net/card*/; do
        if [ "$(cat "$folder/address")" = "$1" ]; then
            ip link set "$(basename "$folder")" name "$2"
            return
        fi
    done
    fail "no card has the address $1"
}

# A switch that learns at once where an address is, and keeps nothing from passing.
topology_switch()
{
    local port
    in_outside ip link add "out-$1" type bridge stp_state 0 forward_delay 0
    for port in $2; do
        in_outside ip link set "out-$port" master "out-$1"
    done
    in_outside ip link set "out-$1" mtu 9000 up
}

# topology_partner NAME OPTIONS PORTS
topology_partner()
{
    local port options="${2//[,=]/ }"
    # shellcheck disable=SC2086 # words
    in_outside ip link add "out-$1" type bond $options
    for port in $3; do
        in_outside ip link set "out-$port" down
        in_outside ip link set "out-$port" master "out-$1"
    done
    in_outside ip link set "out-$1" up
}

topology_outside()
{
    local address
    if [[ $1 == *.* ]]; then
        in_outside ip link add link "out-${1%.*}" name "out-$1" type vlan id "${1##*.}"
        in_outside ip link set "out-$1" up
    fi
    for address in $2; do
        in_outside ip address add "$address" dev "out-$1"
    done
}

topology_far()
{
    local address
    for address in $1; do
        in_outside ip address add "$address" dev lo
    done
}

in_outside()
{
    ip netns exec outside "$@"
}

# The appliance's addresses as its files and the outside's servers give them, one a line: FAMILY
# ADDRESS; on a host with a manager of its own, those that it had at first.
topology_addresses()
{
    if [ -e "$lab_out/host-addresses" ]; then
        cat "$lab_out/host-addresses"
        return
    fi
    servers_gave
    cat /lab/topology/host/etc/sysconfig/network-scripts/ifcfg-* | tr -d '"' |
        awk -F = '
            $1 ~ /^IPADDR[0-9]*$/ && $2 != "" { print 4, $2 }
            $1 ~ /^IPV6ADDR(_SECONDARIES)?$/ {
                count = split($2, words, " ")
                for (i = 1; i <= count; i++) {
                    sub("/.*", "", words[i])
                    print 6, words[i]
                }
            }'
}

# What the appliance can probe: the outside's address on every port, and the far host, which is
# reached through a gateway. $1 is 4 or 6; a topology may have none of a family.
topology_outside_addresses()
{
    sed -n -e 's/^outside [^ ]* //p' -e 's/^far //p' /lab/topology/topology | tr ' ' '\n' |
        sed 's|/.*||' | if [ "$1" = 4 ]; then grep '\.'; else grep ':'; fi || true
}

# The address of the far host; $1 is 4 or 6. There need not be one.
topology_far_address()
{
    sed -n 's/^far //p' /lab/topology/topology | tr ' ' '\n' | sed 's|/.*||' |
        if [ "$1" = 4 ]; then grep '\.'; else grep ':'; fi || true
}

# Waits until every address of the appliance answers the outside.
topology_ready()
{
    local family address
    servers_ready
    topology_addresses >"$lab_out/addresses"
    while read -r family address; do
        wait_until 30 in_outside fping "-$family" -q -r 0 -t 200 "$address"
    done <"$lab_out/addresses"
}
