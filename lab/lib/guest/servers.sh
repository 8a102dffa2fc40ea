# shellcheck shell=bash disable=SC2154 # variables of the guest's other files
# The outside world's DHCP servers and routers: dnsmasq, as the topology's dnsmasq.conf says, and
# what it has been asked. Leases and log outlive a reboot where the machine has a disk.

lab_servers_log=$lab_out/servers.log
lab_leases=$lab_out/leases

# Starts them where a topology has any.
servers_start()
{
    if [ ! -e /lab/topology/dnsmasq.conf ]; then
        return
    fi
    in_outside dnsmasq --conf-file=/lab/topology/dnsmasq.conf --user=root --pid-file=/run/servers.pid \
        --bind-dynamic --except-interface=lo --no-resolv --no-hosts --no-ping --dhcp-authoritative \
        --log-dhcp --log-facility="$lab_servers_log" --dhcp-leasefile="$lab_leases"
}

servers_stop()
{
    kill "$(cat /run/servers.pid)"
}

# servers_asked WORD...: how often a client sent one of these, as dnsmasq names them: DHCPDISCOVER,
# DHCPREQUEST, DHCPRELEASE, DHCPSOLICIT, RTR-SOLICIT...
servers_asked()
{
    local words="$*"
    { grep -Eo "(${words// /|})\(out-[^)]*\)" "$lab_servers_log" 2>/dev/null || true; } | wc -l
}

# Who has what now, one a line, without until when: MAC ADDRESS NAME CLIENT-ID, and of IPv6
# IAID ADDRESS NAME DUID.
servers_leases()
{
    { grep -E '^[0-9]+ [^ ]+ [0-9a-f.:]+ ' "$lab_leases" 2>/dev/null || true; } |
        cut -d ' ' -f 2- | sort
}
