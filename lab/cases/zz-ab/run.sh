# shellcheck shell=bash disable=SC2154
S=/etc/sysconfig/network-scripts
state() {
    echo "--- $1"
    ip -br link; ip -br addr; ip route; ip -6 route | grep -v fe80
    ovs-vsctl --timeout=5 show 2>/dev/null || true
    cat /proc/net/bonding/* 2>/dev/null | grep -E "Slave|Mode|Active" || true
    cat /run/vornovs/handover.json 2>/dev/null || true
}
hold() { export VORNOVS_HOLD=1; rc=0; "$@" || rc=$?; unset VORNOVS_HOLD; echo "rc=$rc: $*"; }
dry() { VORNOVS_HOLD=1 /etc/rc.network --dry-run "$@" || true; }
stage() { probes_start; local n="$1"; shift; hold "$@"; lab_probe_after=2 probes_finish "$n" 60000; }
edit() { # file key=value...
    local f=$1 kv; shift
    for kv in "$@"; do sed -i "/^${kv%%=*}=/d" $f; case $kv in *=) ;; *) echo "$kv" >>$f ;; esac; done
}
to_switch_slave() { cp -f $S/ifcfg-$1 $S/ifcfg-ovs_$1; edit $S/ifcfg-ovs_$1 DEVICE=ovs_$1 TYPE=OVS PRIMARY=$1 BONDING_OPTS= BRIDGE= SLAVE=; edit $S/ifcfg-$1 BRIDGE=ovs_$1; }
state boot
remember_plain
# LinkAggrSet 0
cp $S/ifcfg-bond0 /run/bond0.keep; for i in eth0 eth1; do cp $S/ifcfg-$i /run/$i.keep; done
step "apart"
sed -e '/^DEVICE=/d;/^TYPE/d;/^BONDING_OPTS/d' /run/bond0.keep >$S/ifcfg-eth0; echo DEVICE=eth0 >>$S/ifcfg-eth0
edit $S/ifcfg-eth1 MASTER= SLAVE=
rm $S/ifcfg-bond0
dry start bond0 eth0 eth1
touch /run/rcrecord
stage apart /etc/rc.network start bond0 eth0 eth1
state apart
step "single"
hold /etc/rc.network stop
for i in eth0 eth1; do to_switch_slave $i; done
dry start
stage single /etc/rc.network start
state single
step "bond"
hold /etc/rc.network stop ovs_eth0 eth0 ovs_eth1 eth1
cp -f $S/ifcfg-ovs_eth0 $S/ifcfg-ovs_bond0
edit $S/ifcfg-ovs_bond0 DEVICE=ovs_bond0 SLAVE_LIST='"eth0 eth1 "' BOND_MODE=ovs-active-backup BONDING_OPTS='"bond_mode=active-backup lacp=off"'
for i in eth0 eth1; do edit $S/ifcfg-ovs_$i SLAVE=yes; edit $S/ifcfg-$i SLAVE=yes MASTER=ovs_bond0; done
dry start ovs_bond0
stage bond /etc/rc.network start ovs_bond0
state bond
step "mode"
edit $S/ifcfg-ovs_bond0 BOND_MODE=x BONDING_OPTS='"bond_mode=balance-slb lacp=off other_config:bond-rebalance-interval=5000"'
stage mode /etc/rc.network set-ovs-bond ovs_bond0
edit $S/ifcfg-ovs_bond0 BOND_MODE=x BONDING_OPTS='"bond_mode=active-backup lacp=off"'
stage mode /etc/rc.network set-ovs-bond ovs_bond0
ovs-vsctl list port bond0
step "back: delete"
ACTION=delete HOOK_ACTION=4 /usr/vorn/etc/hooks/net/ovs_change/10-vornovs-handover; cat /run/vornovs/handover.json
hold /etc/rc.network stop eth0 eth1 ovs_bond0
cp -f $S/ifcfg-ovs_bond0 $S/ifcfg-ovs_eth0; rm $S/ifcfg-ovs_bond0; edit $S/ifcfg-ovs_eth0 DEVICE=ovs_eth0 BONDING_OPTS= SLAVE_LIST= BOND_MODE=
for i in eth0 eth1; do edit $S/ifcfg-ovs_$i SLAVE=; edit $S/ifcfg-$i SLAVE= MASTER=; done
dry start ovs_eth0 ovs_eth1
stage unbond /etc/rc.network start ovs_eth0 ovs_eth1
state unbond
step "plain"
hold /etc/rc.network stop
for i in eth0 eth1; do cp -f $S/ifcfg-ovs_$i $S/ifcfg-$i; rm $S/ifcfg-ovs_$i; edit $S/ifcfg-$i DEVICE=$i TYPE= PRIMARY=; done
dry start
stage plain /etc/rc.network start
state plain
step "again"
cp /run/bond0.keep $S/ifcfg-bond0; for i in eth0 eth1; do cp /run/$i.keep $S/ifcfg-$i; done
dry start bond0 eth0 eth1
stage again /etc/rc.network start bond0 eth0 eth1
state again
ovs-vsctl show
expect_plain
