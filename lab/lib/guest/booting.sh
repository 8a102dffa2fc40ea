# shellcheck shell=bash disable=SC2154 # variables of the guest's other files
# A host with systemd whose network has been ours since the packages were installed.

# Has the network start with the machine, for the files that are there.
boots_enable()
{
    step "Enable"
    expect_success systemctl enable --now vornovs-network.service
    expect_answers
}

# The addresses of the topology's files, without their lengths.
boots_addresses()
{
    sed -n -E 's/^(IPADDR[0-9]*|IPV6ADDR|IPV6ADDR_SECONDARIES)="?([^"]*)"?$/\2/p' \
        /lab/topology/host"$lab_ifcfg"* | tr ' ' '\n' | sed 's,/.*,,'
}

address_answers()
{
    in_outside fping -q -r 0 -t 200 "$1"
}

# Every address of the topology's files answers the outside, wherever it is now.
expect_answers()
{
    local address
    for address in $(boots_addresses); do
        wait_until 100 address_answers "$address"
    done
}

unit_state()
{
    systemctl is-active "$1" || true # which ends with 0 for active ones alone
}

expect_active()
{
    local unit
    for unit in "$@"; do
        expect_equal "$unit" active "$(unit_state "$unit")"
    done
}

unit_is()
{
    [ "$(unit_state "$1")" = "$2" ]
}

# unit_of PROCESS-NAME: the unit whose process it is.
unit_of()
{
    basename "$(cut -d: -f3 "/proc/$(processes_named "$1" | head -n 1)/cgroup")"
}

# logged WORDS: whether the network program has said so since this boot.
logged()
{
    journalctl -b -q --no-pager -t rc.network | grep -q -- "$1"
}

# The host of the topology one-port is on the switch.
is_on_switch()
{
    [ -n "$(addresses_of ovs_eth0)" ] && [ -z "$(addresses_of eth0)" ]
}

# It is not, although its files want it, and is reachable all the same.
expect_without_switch()
{
    expect_answers
    expect_equal "the addresses of eth0" "$(printf '10.10.0.2/24\nfd10:0:0:a0::2/64')" \
        "$(addresses_of eth0)"
    expect_success logged 'eth0 stay on the plain interface'
    expect_active network-online.target vornovs-network-retry.service
}

# expect_comes_to_switch SECONDS: by itself, within that time.
expect_comes_to_switch()
{
    wait_until "$1" is_on_switch
    expect_answers
    wait_until 30 unit_is vornovs-network-retry.service inactive
}
