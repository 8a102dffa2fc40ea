# shellcheck shell=bash disable=SC2154 # variables of the guest's other files

expect_reachable()
{
    wait_until 60 in_outside fping -q -r 0 -t 200 10.10.0.2
    wait_until 60 in_outside fping -6 -q -r 0 -t 200 fd10:0:0:a0::2
}

expect_active()
{
    local unit
    for unit in "$@"; do
        expect_equal "$unit" active "$(systemctl is-active "$unit" || true)"
    done
}

late_has_address()
{
    addresses_of late0 | grep -qx 192.0.2.9/24
}

# unit_of PROCESS-NAME: the unit whose process it is.
unit_of()
{
    basename "$(cut -d: -f3 "/proc/$(processes_named "$1" | head -n 1)/cgroup")"
}

# moment UNIT PROPERTY: microseconds since boot
moment()
{
    systemctl show --value -p "$2" "$1"
}

phase_start()
{
    step "Install"
    tar -C / -xf /lab/case/product.tar
    ldconfig
    expect_success apt-get -q update
    expect_success apt-get -q -y install openvswitch-switch dhcpcd-base libnl-route-3-200 libsystemd0
    systemctl daemon-reload
    udevadm control --reload
    expect_success systemctl enable --now vornovs-network.service
    expect_reachable
    reboot_machine plain
}

phase_plain()
{
    expect_reachable
    expect_active vornovs-network.service vornovs-network-wait-online.service network-online.target
    expect_success no_process_named ovsdb-server
    expect_success no_process_named ovs-vswitchd
    expect_equal "who may read /run/vornovs" 700 "$(stat -c %a /run/vornovs)"

    step "A card that is late, and one that has no file"
    printf 'DEVICE=late0\nIPADDR=192.0.2.9\nPREFIX=24\n' >"${lab_ifcfg}late0"
    ip link add late0 type veth peer name other0
    wait_until 30 late_has_address
    expect_equal "the addresses of other0" "" "$(addresses_of other0)"
    rm "${lab_ifcfg}late0"
    ip link del late0

    step "Register"
    expect_success systemd-run --wait --unit client vornovsctl register alpha
    expect_reachable
    expect_equal "the unit of ovsdb-server" vornovs-db.service "$(unit_of ovsdb-server)"
    expect_equal "the unit of ovs-vswitchd" vornovs-vswitch.service "$(unit_of ovs-vswitchd)"
    expect_equal "the bridge of eth0" ovs_eth0 "$(ovs-vsctl --timeout=10 port-to-br eth0)"

    step "Kill the service of a client that holds the network"
    systemd-run --unit client sh -c 'VORNOVS_HOLD=1 /etc/rc.network stop; exec sleep 1000'
    wait_until 30 test -e /run/vornovs/network.hold
    wait_until 30 process_named sleep
    expect_equal "the unit of the holder" 1 "$(systemctl list-units --plain --no-legend 'vornovs-hold@*' | wc -l)"
    systemctl kill --kill-whom=all -s KILL client
    expect_reachable
    wait_until 60 test ! -e /run/vornovs/network.hold
    expect_reachable
    expect_active vornovs-db.service vornovs-vswitch.service
    reboot_machine switch
}

phase_switch()
{
    expect_reachable
    expect_active vornovs-network.service vornovs-db.service vornovs-vswitch.service
    expect_equal "Debian's own unit" inactive "$(systemctl is-active ovs-vswitchd.service || true)"
    expect_equal "the bridge of eth0" ovs_eth0 "$(ovs-vsctl --timeout=10 port-to-br eth0)"
    expect_equal "the addresses of eth0" "" "$(addresses_of eth0)"
    expect_equal "MAC of the bridge" "$(cat /sys/class/net/eth0/address)" \
        "$(cat /sys/class/net/ovs_eth0/address)"
    [ "$(moment network.target ActiveEnterTimestampMonotonic)" -ge \
        "$(moment vornovs-network.service ActiveEnterTimestampMonotonic)" ] ||
        fail "network.target was reached before the network"
    expect_success systemctl is-active network-online.target
    expect_success systemd-run --wait --unit client vornovsctl unregister alpha
    expect_reachable
    reboot_machine plain_again
}

phase_plain_again()
{
    expect_reachable
    expect_success no_process_named ovs-vswitchd
    expect_failure test -e /sys/class/net/ovs_eth0
    expect_equal "failed units" "" "$(systemctl list-units --failed --plain --no-legend)"
}
