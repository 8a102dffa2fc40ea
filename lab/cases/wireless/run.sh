# shellcheck shell=bash disable=SC2154 # variables of the guest's other files

remember_plain

step "Register"
probes_start
timed Register vornovsctl register alpha
expect_equal "the bridge of eth0" ovs_eth0 "$(ovs-vsctl --timeout=10 port-to-br eth0 2>&1)"
expect_equal "the bridge of wlan0" ovs_eth0 "$(ovs-vsctl --timeout=10 port-to-br wlan0 2>&1)"
expect_equal "the addresses of ovs_eth0" "$(cat "$lab_out/plain-addresses-br0")" "$(addresses_of ovs_eth0)"
expect_line "${lab_ifcfg}br0" ONBOOT=no
expect_line "${lab_ifcfg}wlan0" BRIDGE=ovs_eth0
# The bridge may be gone altogether, which leaves it without addresses too.
expect_equal "the addresses of br0" "" "$(addresses_of br0 2>/dev/null || true)"
probes_finish Register 1000

step "A station answers"
in_outside ip address add 10.10.0.77/24 dev out-wlan0
wait_until 10 fping -q -r 0 -t 200 10.10.0.77
in_outside ip address delete 10.10.0.77/24 dev out-wlan0

step "Unregister"
probes_start
timed UnRegister vornovsctl unregister alpha
probes_finish UnRegister 1000
expect_plain
