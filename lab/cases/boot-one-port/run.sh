# shellcheck shell=bash disable=SC2154 # variables of the guest's other files

late_has_address()
{
    addresses_of late0 | grep -qx 192.0.2.9/24
}

# moment UNIT: when it became active, in microseconds since the boot.
moment()
{
    systemctl show --value --property ActiveEnterTimestampMonotonic "$1"
}

phase_start()
{
    boots_enable
    reboot_machine plain
}

phase_plain()
{
    expect_answers
    expect_active vornovs-network.service vornovs-network-wait-online.service
    expect_success no_process_named ovsdb-server
    expect_success no_process_named ovs-vswitchd
    expect_equal "the mode of /run/vornovs" 700 "$(stat -c %a /run/vornovs)"

    step "A card that is late, and one that has no file"
    printf 'DEVICE=late0\nIPADDR=192.0.2.9\nPREFIX=24\n' >"${lab_ifcfg}late0"
    ip link add late0 type veth peer name other0
    wait_until 30 late_has_address
    expect_equal "the addresses of other0" "" "$(addresses_of other0)"
    rm "${lab_ifcfg}late0"
    ip link del late0

    step "Register"
    expect_success systemd-run --quiet --wait --unit client vornovsctl register alpha
    expect_answers
    expect_equal "the unit of ovsdb-server" vornovs-db.service "$(unit_of ovsdb-server)"
    expect_equal "the unit of ovs-vswitchd" vornovs-vswitch.service "$(unit_of ovs-vswitchd)"
    expect_equal "the bridge of eth0" ovs_eth0 "$(ovs-vsctl --timeout=10 port-to-br eth0)"

    step "Kill the whole service of a client that holds the network"
    systemd-run --quiet --unit client \
        sh -c 'VORNOVS_HOLD=1 /etc/rc.network stop && touch /run/client && exec sleep 1000'
    wait_until 30 test -e /run/client
    expect_success test -e /run/vornovs/network.hold
    systemctl kill --kill-whom=all --signal=KILL client
    wait_until 10 unit_is client failed
    expect_answers
    wait_until 60 test ! -e /run/vornovs/network.hold
    expect_success logged 'no start followed a stop'
    expect_answers
    expect_active vornovs-db.service vornovs-vswitch.service
    reboot_machine switched
}

phase_switched()
{
    expect_answers
    expect_active vornovs-network.service vornovs-db.service vornovs-vswitch.service
    expect_active network-online.target
    expect_equal "Debian's unit of the switch" inactive "$(unit_state ovs-vswitchd)"
    expect_equal "the bridge of eth0" ovs_eth0 "$(ovs-vsctl --timeout=10 port-to-br eth0)"
    expect_equal "the addresses of eth0" "" "$(addresses_of eth0)"
    expect_equal "the hardware address of ovs_eth0" "$(cat /sys/class/net/eth0/address)" \
        "$(cat /sys/class/net/ovs_eth0/address)"
    [ "$(moment network.target)" -ge "$(moment vornovs-network.service)" ] ||
        fail "network.target was reached before the network was there"

    step "Unregister"
    expect_success systemd-run --quiet --wait --unit client vornovsctl unregister alpha
    expect_answers
    reboot_machine home
}

phase_home()
{
    expect_answers
    expect_success no_process_named ovs-vswitchd
    expect_failure test -e /sys/class/net/ovs_eth0
    expect_equal "failed units" "" "$(systemctl list-units --failed --plain --no-legend)"
}
