# shellcheck shell=bash disable=SC2154 # variables of the guest's other files

ignore_list=$lab_state/ovs_ignore.conf
sysctl -q -w net.ipv4.conf.all.arp_ignore=1 net.ipv4.conf.all.arp_announce=2
remember_plain
expect_success vornovsctl register alpha
expect_on_switch

step "Take the bond off the switch"
probes_start
timed RemoveInterface vornovsctl interface remove ovs_bond0
expect_equal "the bridges" "ovs_eth2 ovs_eth3" "$(ovs-vsctl --timeout=10 list-br | sort | xargs)"
expect_equal "the addresses of eth0" "$(cat "$lab_out/plain-addresses-bond0")" "$(addresses_of eth0)"
expect_equal "the addresses of eth1" "" "$(addresses_of eth1)"
expect_equal "the ignore list" "eth0 eth1" "$(sort "$ignore_list" | xargs)"
probes_finish RemoveInterface 100

step "Put its ports back"
probes_start
expect_success vornovsctl interface add eth0
expect_success vornovsctl interface add eth1
expect_equal "the bridges" "ovs_eth0 ovs_eth1 ovs_eth2 ovs_eth3" \
    "$(ovs-vsctl --timeout=10 list-br | sort | xargs)"
expect_equal "the addresses of ovs_eth0" "$(cat "$lab_out/plain-addresses-bond0")" \
    "$(addresses_of ovs_eth0)"
probes_finish AddInterface 100

step "Unregister"
probes_start
expect_success vornovsctl unregister alpha
probes_finish UnRegister 100
expect_equal "the bridges" "" "$(ovs-vsctl --timeout=10 list-br)"
expect_equal "the addresses of eth0" "$(cat "$lab_out/plain-addresses-bond0")" "$(addresses_of eth0)"
