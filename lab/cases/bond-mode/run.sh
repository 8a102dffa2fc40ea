# shellcheck shell=bash disable=SC2154 # variables of the guest's other files

bond_mode()
{
    cut -d ' ' -f 1 /sys/class/net/bond0/bonding/mode
}

ip address add fd10:0:0:a0::77/64 dev bond0
ip route add 203.0.113.0/24 via 10.10.0.1 dev bond0
remember_plain
mac="$(cat /sys/class/net/bond0/address)"

step "Another mode"
sed -i 's/mode=[a-z-]*/mode=balance-xor/' "${lab_ifcfg}bond0"
probes_start
expect_success /etc/rc.network start
expect_equal "the mode" balance-xor "$(bond_mode)"
expect_equal "the slaves" "eth0 eth1" "$(cat /sys/class/net/bond0/bonding/slaves)"
expect_equal "the address of bond0" "$mac" "$(cat /sys/class/net/bond0/address)"
expect_equal "the addresses of bond0" "$(cat "$lab_out/plain-addresses-bond0")" "$(addresses_of bond0)"
expect_success ip route show 203.0.113.0/24 dev bond0
expect_equal "what is left to do" "" "$(/etc/rc.network --dry-run start)"
probes_finish "Another mode" 3000

step "The former mode"
cp -p "$lab_out/plain-ifcfg-bond0" "${lab_ifcfg}bond0"
expect_success /etc/rc.network start
expect_equal "the mode" active-backup "$(bond_mode)"
expect_plain
