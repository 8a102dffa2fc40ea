# shellcheck shell=bash disable=SC2154 # variables of the guest's other files

phase_start()
{
    boots_enable
    expect_success vornovsctl register alpha
    expect_answers

    mv "${lab_ifcfg}ovs_eth0" "${lab_ifcfg}eth0"
    cp "/lab/topology/host${lab_ifcfg}eth1" "${lab_ifcfg}eth1"
    cp "${lab_ifcfg}eth1" "${lab_ifcfg}ovs_eth1"
    rm "${lab_ifcfg}eth2"
    : >"${lab_ifcfg}ovs_eth3"
    sync
    reboot_machine half_written
}

phase_half_written()
{
    expect_answers
    expect_equal "the bridge of eth2" ovs_eth2 "$(ovs-vsctl --timeout=10 port-to-br eth2)"
    for port in eth0 eth1 eth3; do
        expect_success ip -oneline address show dev "$port" scope global
        [ -n "$(addresses_of "$port")" ] || fail "$port has no address of its own"
    done

    step "The same again, as an administrator asks for it"
    /etc/rc.network start || true # it says what it did not like about the files
    expect_answers
}
