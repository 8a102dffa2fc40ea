# shellcheck shell=bash disable=SC2154 # variables of the guest's other files

# expect_dark ADDRESS...: none of them answers.
expect_dark()
{
    local address
    for address in "$@"; do
        if in_outside fping -q -r 1 -t 200 "$address"; then
            fail "$address answers although its network was stopped"
        fi
    done
}

remember_plain

step "Stop everything"
expect_success /etc/rc.network stop
expect_dark 10.10.0.2 10.11.0.2 10.13.0.2
expect_success /etc/rc.network start
topology_ready
expect_plain everything

step "Stop one port"
expect_success /etc/rc.network stop eth1
expect_dark 10.11.0.2
in_outside fping -q 10.10.0.2 || fail "eth0 does not answer"
expect_success /etc/rc.network start eth1
topology_ready
expect_plain one

step "Start what runs"
probes_start
expect_success /etc/rc.network start
lab_probe_after=1 probes_finish "start of what runs" 5
expect_plain again

step "Stop and start on the switch"
expect_success vornovsctl register alpha
expect_on_switch
expect_success /etc/rc.network stop
expect_dark 10.10.0.2 10.11.0.2 10.13.0.2
expect_equal "the switch's bridges" "" "$(ovs-vsctl --timeout=10 list-br)"
expect_success /etc/rc.network start
topology_ready
expect_on_switch
expect_success vornovsctl unregister alpha
expect_plain home
