# shellcheck shell=bash disable=SC2154 # variables of the guest's other files

lab_daemon=/usr/lib/openvswitch-switch/ovs-vswitchd

phase_start()
{
    boots_enable
    expect_success vornovsctl register alpha
    expect_answers
    mv "$lab_daemon" "$lab_daemon.away"
    reboot_machine without_daemon
}

phase_without_daemon()
{
    expect_without_switch

    step "The daemon works again"
    mv "$lab_daemon.away" "$lab_daemon"
    expect_success systemctl start vornovs-vswitch.service
    expect_comes_to_switch 20
}
