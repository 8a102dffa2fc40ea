# shellcheck shell=bash disable=SC2154 # variables of the guest's other files

hardware_address_of()
{
    cat "/sys/class/net/$1/address"
}

expect_bond()
{
    expect_answers
    expect_equal "the hardware address of bond0" 02:00:0a:0a:00:02 "$(hardware_address_of bond0)"
    expect_equal "the members of bond0" "eth0 eth1" "$(cat /sys/class/net/bond0/bonding/slaves)"
    expect_equal "failed units" "" "$(systemctl list-units --failed --plain --no-legend)"
}

phase_start()
{
    boots_enable
    reboot_machine plain
}

phase_plain()
{
    expect_bond
    step "Register"
    expect_success vornovsctl register alpha
    expect_answers
    reboot_machine switched
}

phase_switched()
{
    expect_answers
    expect_equal "the hardware address of ovs_bond0" 02:00:0a:0a:00:02 \
        "$(hardware_address_of ovs_bond0)"
    expect_equal "the tag of ovs_bond0" 5 "$(ovs-vsctl --timeout=10 get Port ovs_bond0 tag)"
    step "Unregister"
    expect_success vornovsctl unregister alpha
    expect_bond
    reboot_machine home
}

phase_home()
{
    expect_bond
}
