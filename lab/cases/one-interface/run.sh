# shellcheck shell=bash disable=SC2154 # variables of the guest's other files

ignore_list=$lab_state/ovs_ignore.conf
sysctl -q -w net.ipv4.conf.all.arp_ignore=1 net.ipv4.conf.all.arp_announce=2
remember_plain
expect_success vornovsctl register alpha
ip link add vm1 type dummy
expect_success vornovsctl port attach ovs_eth2 vm1

step "Take the uplink off the switch"
probes_start
timed RemoveInterface vornovsctl interface remove ovs_eth0
expect_equal "the bridges" "ovs_eth1 ovs_eth2" "$(ovs-vsctl --timeout=10 list-br | sort | xargs)"
expect_equal "the addresses of eth0" "$(cat "$lab_out/plain-addresses-eth0")" "$(addresses_of eth0)"
expect_equal "the file of eth0" "$(cat "$lab_out/plain-ifcfg-eth0")" "$(cat "${lab_ifcfg}eth0")"
expect_line "$ignore_list" eth0
expect_equal "the bridge of the client's port" ovs_eth2 "$(ovs-vsctl --timeout=10 port-to-br vm1)"
probes_finish RemoveInterface 100

step "Put it back"
probes_start
timed AddInterface vornovsctl interface add eth0
expect_on_switch
[ ! -e "$ignore_list" ] || expect_no_line "$ignore_list" eth0
expect_equal "the bridge of the client's port" ovs_eth2 "$(ovs-vsctl --timeout=10 port-to-br vm1)"
probes_finish AddInterface 100

step "Unregister"
expect_success vornovsctl port detach ovs_eth2 vm1
ip link delete vm1
expect_success vornovsctl unregister alpha
expect_plain
