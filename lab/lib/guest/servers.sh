# shellcheck shell=bash disable=SC2154 # variables of the guest's other files
# The outside's servers: DHCP, DHCPv6 and router advertisements on the segments that a topology's
# `server` lines name.

lab_servers_log=/var/log/servers

# One process for all segments: two would contend for the ports of DHCPv6.
servers_start()
{
    local word name options option configuration=/etc/servers.conf
    grep -q '^server ' /lab/topology/topology || return 0
    printf '%s\n' port=0 no-ping user=root bind-dynamic dhcp-authoritative \
        "log-facility=$lab_servers_log" dhcp-leasefile=/var/lib/servers.leases \
        pid-file=/run/servers.pid >"$configuration"
    while read -r word name options; do
        [ "$word" = server ] || continue
        echo "interface=out-$name" >>"$configuration"
        for option in $options; do
            echo "$option" >>"$configuration"
        done
    done </lab/topology/topology
    in_outside dnsmasq --conf-file="$configuration"
}

# True when dnsmasq serves anybody.
servers_there()
{
    [ -e /run/servers.pid ]
}

# servers_key INTERFACE KEY: the value in the file of the interface.
servers_key()
{
    sed -n "s/^$2=\"\{0,1\}\([^\"]*\)\"\{0,1\}\$/\1/p" "/lab/topology/host$lab_ifcfg$1"
}

# servers_gave: the addresses that the appliance got once, one a line: FAMILY ADDRESS.
servers_gave()
{
    if [ -e "$lab_out/served" ]; then
        cat "$lab_out/served"
    fi
}

# served_addresses INTERFACE: the addresses that it has of servers and routers, as above.
served_addresses()
{
    ip -oneline address show dev "$1" scope global dynamic |
        awk '{ sub("/.*", "", $4); print $3 == "inet" ? 4 : 6, $4 }'
}

# True when an interface has of servers and routers what its file asks for.
served_as_asked()
{
    local addresses
    addresses="$(served_addresses "$1")"
    if [ "$(servers_key "$1" BOOTPROTO)" = dhcp ]; then
        grep -q '^4 ' <<<"$addresses" || return 1
    fi
    # Two addresses where both the server and the routers give some.
    if [ "$(servers_key "$1" DHCPV6C)" = yes ]; then
        grep -q '^6 .*' <<<"$addresses" || return 1
    fi
    if [ "$(servers_key "$1" IPV6_AUTOCONF)" = yes ]; then
        grep -q '^6 .*ff:fe' <<<"$addresses" || return 1
        [ "$(servers_key "$1" DHCPV6C)" != yes ] || [ "$(grep -c '^6 ' <<<"$addresses")" -ge 2 ]
    fi
}

# Waits until the appliance has its addresses, and notes down which they are the first time.
servers_ready()
{
    local interface
    servers_there || return 0
    [ ! -e "$lab_out/served" ] || return 0
    for interface in $(host_interfaces); do
        wait_until 60 served_as_asked "$interface"
        served_addresses "$interface" >>"$lab_out/served.new"
    done
    mv "$lab_out/served.new" "$lab_out/served"
    servers_count >"$lab_out/first-requests"
}

# The requests of a client that knows nothing of an earlier lease.
servers_count()
{
    awk '/DHCPDISCOVER/ { discover++ } /DHCPSOLICIT/ { solicit++ }
        END { printf "DISCOVER %d SOLICIT %d\n", discover, solicit }' "$lab_servers_log"
}

# Nobody asked for a lease anew since the first boot, and nothing was refused or given back.
expect_one_client()
{
    local words
    expect_equal "requests for a new lease" "$(cat "$lab_out/first-requests")" "$(servers_count)"
    for words in DHCPNAK DHCPRELEASE DHCPDECLINE 'no addresses'; do
        if grep -e "$words" "$lab_servers_log"; then
            fail "the servers' log tells of $words"
        fi
    done
}

# expect_renewed COUNT: the server has confirmed a lease so many times since the first boot.
expect_renewed()
{
    local acknowledged
    acknowledged="$(grep -c DHCPACK "$lab_servers_log")"
    [ "$acknowledged" -gt "$1" ] || fail "the lease was confirmed $acknowledged times, not $1 more"
}
