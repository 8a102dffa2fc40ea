# shellcheck shell=bash disable=SC2154,SC2034 # variables of the guest's other files

rounds="$(sampled 2 12)"
seed=20260101
# The partner of an aggregate takes its time to agree.
limit=15000
lab_probe_after=1
lab_probe_interval=50

made_topology=/lab/topology/topology
made_files=/lab/topology/host$lab_ifcfg

# one_of WORD...: sets $chosen. Starts no subshell, which would throw dice of its own.
one_of()
{
    chosen=$((RANDOM % $# + 1))
    chosen="${!chosen}"
}

# True in so many of a hundred cases.
chance()
{
    [ $((RANDOM % 100)) -lt "$1" ]
}

# make_addressing INTERFACE NUMBER: the keys of an interface's network, and the outside's end of it.
make_addressing()
{
    local interface="$1" number="$2" prefix outside
    one_of 16 22 24 28 30
    prefix="$chosen"
    outside="outside $interface 10.$number.0.1/$prefix"
    echo "IPADDR=10.$number.0.2"
    echo "PREFIX=$prefix"
    if chance 40; then
        echo "GATEWAY=10.$number.0.1"
        echo "METRIC=$((100 + number))"
    fi
    if chance 60; then
        echo "IPV6ADDR=fd10:0:0:$number::2/64"
        outside="$outside fd10:0:0:$number::1/64"
        if chance 30 && [ -z "$ipv6_gateway" ]; then
            echo "IPV6_DEFAULTGW=fd10:0:0:$number::1"
            ipv6_gateway="$interface"
        fi
    fi
    echo "$outside" >>"$made_topology"
}

# bonding_options MODE SLAVE: sets $options.
bonding_options()
{
    one_of 50 100
    options="mode=$1 miimon=$chosen"
    if chance 30; then
        options="$options updelay=200 downdelay=200"
    fi
    case $1 in
        active-backup)
            if chance 50; then
                options="$options primary=$2"
            fi
            ;;
        802.3ad)
            one_of layer2 layer3+4
            options="$options lacp_rate=fast xmit_hash_policy=$chosen"
            ;;
        balance-xor)
            one_of layer2 layer2+3
            options="$options xmit_hash_policy=$chosen"
            ;;
    esac
}

# make_interface NAME NUMBER: a file's common keys and its network, on itself or on a VLAN.
make_interface()
{
    local name="$1" number="$2" vlan
    echo "DEVICE=$name"
    echo "ONBOOT=yes"
    if chance 30; then
        one_of 1400 1480 9000
        echo "MTU=$chosen"
    fi
    if chance 40; then
        vlan="$name.$((RANDOM % 4000 + 2))"
        {
            echo "DEVICE=$vlan"
            echo "VLAN=yes"
            make_addressing "$vlan" "$number"
        } >"$made_files$vlan"
    else
        make_addressing "$name" "$number"
    fi
}

# make_bond NUMBER PORT PORT
make_bond()
{
    local number="$1" mode slave
    shift
    one_of active-backup balance-xor 802.3ad
    mode="$chosen"
    case $mode in
        active-backup) echo "switch bond0 $*" ;;
        802.3ad) echo "partner bond0 mode=802.3ad,miimon=100,lacp_rate=fast $*" ;;
        *) echo "partner bond0 mode=balance-xor,miimon=100 $*" ;;
    esac >>"$made_topology"
    {
        make_interface bond0 "$number"
        bonding_options "$mode" "$1"
        echo "BONDING_OPTS=\"$options\""
    } >"${made_files}bond0"
    for slave in "$@"; do
        printf '# Cable %s\nDEVICE=%s\nMASTER=bond0\nSLAVE=yes\n' "${slave#eth}" "$slave" \
            >"$made_files$slave"
    done
}

make_host()
{
    local number single=(eth0 eth1 eth2 eth3) name
    ipv6_gateway=''
    rm -rf /lab/topology/host
    mkdir -p "${made_files%/*}"
    : >"$made_topology"
    for number in 0 1 2 3; do
        echo "port eth$number veth 02:00:0a:0$number:00:02" >>"$made_topology"
    done
    if chance 75; then
        number=$((RANDOM % 3))
        make_bond 20 "eth$number" "eth$((number + 1))"
        unset "single[$number]" "single[$((number + 1))]"
    fi
    for name in "${single[@]}"; do
        make_interface "$name" "$((10 + ${name#eth}))" >"$made_files$name"
    done
}

# Takes the host and the outside away, so that another can be built.
take_apart()
{
    local folder
    /etc/rc.network stop
    ip netns delete outside
    wait_until 10 no_ports_left
    for folder in /sys/class/net/*/bonding; do
        [ ! -d "$folder" ] || ip link delete "$(basename "${folder%/bonding}")"
    done
    rm -f "$lab_ifcfg"*
}

# The ends in a namespace take the host's with them, but not at once.
no_ports_left()
{
    ! compgen -G '/sys/class/net/eth*' >/dev/null
}

take_apart
RANDOM=$seed
for round in $(seq "$rounds"); do
    make_host
    step "Host $round of $rounds"
    show <"$made_topology"
    topology_build
    expect_success /etc/rc.network start
    topology_ready
    round_trip "$limit" topology_ready
    take_apart
done
note "$rounds hosts of seed $seed"
