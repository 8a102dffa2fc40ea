# shellcheck shell=bash disable=SC2154 # variables of the guest's other files

expect_large_echo()
{
    # -M forbids fragments.
    in_outside fping -q -r 3 -M -b 8900 10.10.0.2 || fail "an echo of 8900 bytes is not answered"
    in_outside fping -6 -q -r 3 -b 8900 fd10:0:0:a0::2 || fail "nor is one of IPv6"
}

expect_equal "the MTU of eth0" 9000 "$(cat /sys/class/net/eth0/mtu)"
expect_large_echo
remember_plain

step "Register"
probes_start
expect_success vornovsctl register alpha
expect_on_switch
expect_equal "the MTU of ovs_eth0" 9000 "$(cat /sys/class/net/ovs_eth0/mtu)"
expect_large_echo
lab_probe_after=2 probes_finish Register 100

step "Unregister"
expect_success vornovsctl unregister alpha
expect_large_echo
expect_plain
