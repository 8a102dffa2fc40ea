# shellcheck shell=bash disable=SC2154 # variables of the guest's other files

options()
{
    sed -i "s/^BONDING_OPTS=.*/BONDING_OPTS=\"$2\"/" "$lab_ifcfg$1"
}

remember_plain

step "Typos in the file of the kernel's bond"
options bond0 "mode=active-backup miimon=soon updelay=100 colour=red primary=eth9 lacp_rate=fast downdelay=200"
# What is wrong is said each time, and the rest is done.
expect_status 1 /etc/rc.network stop
expect_status 1 /etc/rc.network start
topology_ready
expect_equal "the slaves" "eth0 eth1" "$(cat /sys/class/net/bond0/bonding/slaves)"
expect_logged '"miimon=soon" is not a number'
expect_logged 'ip failed at "link set dev bond0 type bond colour red": bond: unknown command'
expect_logged 'could not be done: .* lacp_rate fast'
cp -p "$lab_out/plain-ifcfg-bond0" "${lab_ifcfg}bond0"
expect_success /etc/rc.network stop
expect_success /etc/rc.network start
expect_plain

step "Typos in the file of the bond on the switch"
expect_success vornovsctl register home
expect_on_switch
cp -p "${lab_ifcfg}ovs_bond0" "$lab_out/switched"
options ovs_bond0 "bond_mode=balance-slb lacp=off bond_updelay=soon miimon=100 other_config:a[b]=c"
expect_success /etc/rc.network stop
expect_success /etc/rc.network start
topology_ready
expect_switch_bond bond0 balance-slb off eth0 eth1
expect_logged 'ifcfg-ovs_bond0: bond_updelay=soon is no number of milliseconds'
expect_logged "ifcfg-ovs_bond0: the switch's bonds have no option \"miimon\""
options ovs_bond0 "bond_mode=round-robin"
expect_success /etc/rc.network start
topology_ready
expect_logged "ifcfg-ovs_bond0: the switch has no bond mode \"round-robin\"; the bond keeps its own"

step "Mended, and home"
cp -p "$lab_out/switched" "${lab_ifcfg}ovs_bond0"
expect_success /etc/rc.network start
expect_on_switch
expect_success vornovsctl unregister home
expect_plain
expect_success vornovsctl check
