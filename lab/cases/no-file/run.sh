# shellcheck shell=bash disable=SC2154 # variables of the guest's other files

[ -e /sys/class/net/eth1/device ] || fail "eth1 is no card"
ip link show eth1 >"$lab_out/eth1"
remember_plain

step "Register"
probes_start
timed Register vornovsctl register alpha
expect_registered alpha
expect_on_switch
expect_logged 'Failed to copy the config .*/ifcfg-eth1 .*/ifcfg-ovs_eth1'
expect_logged 'Failed to create ovs for eth1'
expect_failure ovs-vsctl --timeout=10 port-to-br eth1
expect_failure test -e "${lab_ifcfg}eth1"
expect_failure test -e "${lab_ifcfg}ovs_eth1"
probes_finish Register 100

step "Unregister"
expect_success vornovsctl unregister alpha
expect_plain
