# shellcheck shell=bash disable=SC2154 # variables of the guest's other files

step "Set what no file knows"
ip address add 10.10.0.200/24 dev eth0
ip -6 address add fd10:0:0:a0::200/64 dev eth0 nodad
ip route add 10.77.0.0/16 via 10.10.0.1 dev eth0 metric 7
ip -6 route add fd10:0:0:77::/64 via fd10:0:0:a0::1 dev eth0 metric 7
remember_plain

step "Register"
probes_start
expect_success vornovsctl register alpha
expect_on_switch
expect_equal "the route by hand" "10.77.0.0/16 via 10.10.0.1 dev ovs_eth0 metric 7" \
    "$(ip route show 10.77.0.0/16 | sed 's/ *$//')"
in_outside fping -q -r 3 10.10.0.200 || fail "the address by hand does not answer"
in_outside fping -6 -q -r 3 fd10:0:0:a0::200 || fail "the address by hand does not answer"
lab_probe_after=2 probes_finish Register 100

step "Unregister"
expect_success vornovsctl unregister alpha
expect_plain
