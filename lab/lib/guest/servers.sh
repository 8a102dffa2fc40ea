# shellcheck shell=bash disable=SC2154 # variables of the guest's other files
# The outside world's DHCP servers and routers: dnsmasq, as the topology's dnsmasq.conf says, and
# what it has been asked. Leases and log outlive a reboot where the machine has a disk.

lab_servers_log=$lab_out/servers.log
lab_leases=$lab_out/leases

# True when the outside serves anybody.
servers_there()
{
    [ -e /lab/topology/dnsmasq.conf ]
}

# Starts them where a topology has any.
servers_start()
{
    servers_there || return 0
    in_outside dnsmasq --conf-file=/lab/topology/dnsmasq.conf --user=root --pid-file=/run/servers.pid \
        --bind-dynamic --except-interface=lo --no-resolv --no-hosts --no-ping --dhcp-authoritative \
        --log-dhcp --log-facility="$lab_servers_log" --dhcp-leasefile="$lab_leases"
}

servers_stop()
{
    kill "$(cat /run/servers.pid)"
}

# servers_asked WORD...: how often a client sent one of these, as dnsmasq names them: DHCPDISCOVER,
# DHCPREQUEST, DHCPRELEASE, DHCPSOLICIT, RTR-SOLICIT... Where there are no servers nobody is asked.
servers_asked()
{
    local words="$*"
    if [ ! -e "$lab_servers_log" ]; then
        echo 0
        return
    fi
    # Finding none is no failure, another one is.
    { grep -Eo "(${words// /|})\(out-[^)]*\)" "$lab_servers_log" || [ $? -eq 1 ]; } | wc -l
}

# Who has what now, one a line, without until when: MAC ADDRESS NAME CLIENT-ID, and of IPv6
# IAID ADDRESS NAME DUID. Before the first one there is no list, which is as good as an empty one.
servers_leases()
{
    if [ ! -e "$lab_leases" ]; then
        return
    fi
    # Finding none is no failure, another one is.
    { grep -E '^[0-9]+ [^ ]+ [0-9a-f.:]+ ' "$lab_leases" || [ $? -eq 1 ]; } |
        cut -d ' ' -f 2- | sort
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

# The requests of clients that know nothing of an earlier lease.
servers_count()
{
    echo "DISCOVER $(servers_asked DHCPDISCOVER) SOLICIT $(servers_asked DHCPSOLICIT)"
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
