# shellcheck shell=bash disable=SC2154 # variables of the guest's other files

remember_plain
expect_success vornovsctl register alpha

step "Set, read and clear a tag"
expect_success vornovsctl vlan set ovs_eth1 20
expect_equal "the tag" 20 "$(switch_value Port ovs_eth1 tag)"
expect_no_line "${lab_ifcfg}ovs_eth1" OVS_VLAN_ID=20
vornovsctl vlan get --json ovs_eth1 | tr -d ' \n' >"$lab_out/tag"
expect_success file_has "$lab_out/tag" '"vlan":20[,}]'
if in_outside fping -q -r 1 -t 200 10.11.0.2; then
    fail "ovs_eth1 answers outside its VLAN"
fi
expect_success vornovsctl vlan clear ovs_eth1
expect_equal "the tag" "[]" "$(switch_value Port ovs_eth1 tag)"
topology_ready

step "Create a tag"
expect_success vornovsctl vlan create ovs_eth1 30
expect_line "${lab_ifcfg}ovs_eth1" OVS_VLAN_ID=30
expect_success /etc/rc.network stop
expect_success /etc/rc.network start
expect_equal "the tag after a stop and a start" 30 "$(switch_value Port ovs_eth1 tag)"
in_outside ip link add link out-eth1 name out-eth1.30 type vlan id 30
in_outside ip link set out-eth1.30 up
in_outside ip address add 10.11.0.9/22 dev out-eth1.30
in_outside ip route add 10.11.0.2 dev out-eth1.30
wait_until 20 in_outside fping -q -r 0 -t 200 10.11.0.2
in_outside ip link delete out-eth1.30

step "Remove the tag"
expect_success vornovsctl vlan remove ovs_eth1
expect_equal "the tag" "[]" "$(switch_value Port ovs_eth1 tag)"
expect_no_line "${lab_ifcfg}ovs_eth1" OVS_VLAN_ID=30
topology_ready

step "Unregister"
expect_success vornovsctl unregister alpha
expect_plain
