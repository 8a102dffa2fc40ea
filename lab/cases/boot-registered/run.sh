# shellcheck shell=bash disable=SC2154 # variables of the guest's other files

expect_registered alpha
expect_equal "the bridge of eth0" ovs_eth0 "$(ovs-vsctl --timeout=10 port-to-br eth0)"
expect_equal "the addresses of eth0" "" "$(addresses_of eth0)"

step "Unregister"
probes_start
timed UnRegister vornovsctl unregister alpha
expect_registered
probes_finish UnRegister 100
expect_failure test -e "${lab_ifcfg}ovs_eth0"
expect_same_text "the file of eth0" /lab/case/ifcfg-eth0 "${lab_ifcfg}eth0"
expect_equal "the switch's bridges" "" "$(ovs-vsctl --timeout=10 list-br)"
expect_equal "the addresses of eth0" "$(printf '10.10.0.2/24\nfd10:0:0:a0::2/64')" \
    "$(addresses_of eth0)"
