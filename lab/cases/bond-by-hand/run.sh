# shellcheck shell=bash disable=SC2154 # variables of the guest's other files

client_port_plugged()
{
    expect_equal "the bridge of the client's port" ovs_eth2 \
        "$(ovs-vsctl --timeout=10 port-to-br vm1 2>&1)"
    expect_equal "the tag of the client's port" 7 "$(switch_value Port vm1 tag)"
}

# Each cable goes to the same switch: only the port that has an address may answer for it.
sysctl -q -w net.ipv4.conf.all.arp_ignore=1 net.ipv4.conf.all.arp_announce=2
remember_plain
expect_success vornovsctl register alpha
ip link add vm1 type dummy
expect_success vornovsctl port attach ovs_eth2 vm1
expect_success vornovsctl vlan set vm1 7

step "Make a bond"
expect_equal "the free name" ovs_bond0 "$(vornovsctl bond free-name)"
probes_start
timed "making a bond" vornovsctl bond create ovs_bond0 ovs-active-backup eth0 eth1
expect_switch_bond bond0 active-backup off eth0 eth1
expect_equal "the next free name" ovs_bond1 "$(vornovsctl bond free-name)"
probes_finish "making a bond" 100
client_port_plugged

step "Read it"
vornovsctl bond get --json ovs_bond0 | tr -d ' \n' >"$lab_out/bond"
expect_success file_has "$lab_out/bond" '"ovs-active-backup"'
expect_success file_has "$lab_out/bond" '\["eth0","eth1"\]'

step "Change its mode"
probes_start
expect_success vornovsctl bond mode ovs_bond0 ovs-balance-slb
expect_switch_bond bond0 balance-slb off eth0 eth1
expect_success vornovsctl bond mode ovs_bond0 ovs-active-backup
expect_switch_bond bond0 active-backup off eth0 eth1
probes_finish "changing a mode" 50
client_port_plugged

for port in eth0 eth1; do
    step "Pull the cable of $port"
    probes_start
    in_outside ip link set "out-$port" down
    pause 2
    in_outside ip link set "out-$port" up
    lab_probe_after=3 probes_finish "cable of $port" 1000
done

step "Stop and start, and remove the bond"
stop_and_start
expect_switch_bond bond0 active-backup off eth0 eth1
client_port_plugged
probes_start
timed "removing a bond" vornovsctl bond remove ovs_bond0
expect_on_switch
probes_finish "removing a bond" 100
client_port_plugged

step "Unregister"
expect_success vornovsctl port detach ovs_eth2 vm1
ip link delete vm1
expect_success vornovsctl unregister alpha
expect_plain
