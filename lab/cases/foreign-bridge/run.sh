# shellcheck shell=bash disable=SC2154 # variables of the guest's other files

tell_foreign()
{
    ovs-vsctl --timeout=10 list-ports br-vm
    ovs-vsctl --timeout=10 get Bridge br-vm external_ids datapath_id
    ip -oneline address show dev br-vm scope global | awk '{ print $4 }'
}

step "Another program's bridge"
expect_success /etc/init.d/vornovs-db start
expect_success /etc/init.d/vornovs-vswitch start
ip link add vm0 type dummy
ovs-vsctl --timeout=10 add-br br-vm -- add-port br-vm vm0 -- \
    set Bridge br-vm external_ids:owner=somebody other-config:datapath-id=00000000000000aa
ip link set br-vm up
ip address add 172.30.0.1/24 dev br-vm
wait_until 10 test -e /sys/class/net/br-vm
tell_foreign >"$lab_out/foreign-before"
remember_plain

step "Register"
probes_start
expect_success vornovsctl register alpha
expect_on_switch
tell_foreign >"$lab_out/foreign-now"
expect_same_text "the things of somebody else" "$lab_out/foreign-before" "$lab_out/foreign-now"

step "A foreign port on our bridge"
ip link add vm1 type dummy
ovs-vsctl --timeout=10 add-port ovs_eth0 vm1
expect_success /etc/rc.network start
expect_equal "the bridge of vm1" ovs_eth0 "$(ovs-vsctl --timeout=10 port-to-br vm1)"
ovs-vsctl --timeout=10 del-port ovs_eth0 vm1
ip link del vm1

step "Unregister"
expect_success vornovsctl unregister alpha
lab_probe_after=2 probes_finish "there and back" 100
tell_foreign >"$lab_out/foreign-now"
expect_same_text "the things of somebody else" "$lab_out/foreign-before" "$lab_out/foreign-now"
expect_plain
