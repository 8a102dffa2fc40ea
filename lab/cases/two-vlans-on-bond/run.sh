# shellcheck shell=bash disable=SC2154 # variables of the guest's other files

remember_plain

step "Register"
probes_start
timed Register vornovsctl register alpha
expect_registered alpha
for vlan in bond0.10 bond0.20 bond1.30; do
    expect_logged "VLAN $vlan.*one tag"
done
for bond in bond0 bond1; do
    expect_logged "bond $bond is not taken apart"
done
probes_finish Register 100
pull_each_cable bond0 1000

step "Start from the files, as after a loss of power"
for bridge in $(ovs-vsctl list-br); do
    ovs-vsctl del-br "$bridge"
done
ip link del bond0
ip link del bond1
rm -rf /run/vornovs/*
expect_success /etc/rc.network start
topology_ready

step "Unregister"
probes_start
timed UnRegister vornovsctl unregister alpha
expect_registered
probes_finish UnRegister 100
expect_plain
