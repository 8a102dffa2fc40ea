# shellcheck shell=bash disable=SC2154 # variables of the guest's other files

# kill_client INTERFACE
kill_client()
{
    local process
    process="$(cat "/run/vornovs/dhcp/$1.pid")"
    kill -KILL "$process"
    wait_until 5 process_gone "$process"
}

process_gone()
{
    [ ! -e "/proc/$1" ] || grep -q '^State:.Z' "/proc/$1/status"
}

# expect_client INTERFACE: it runs, and there is nothing left to do.
expect_client()
{
    local process
    process="$(cat "/run/vornovs/dhcp/$1.pid")"
    expect_equal "the client's process" dhcpcd "$(cat "/proc/$process/comm")"

    expect_equal "what is left to do" "" "$(/etc/rc.network --dry-run start 2>&1)"
}

remember_plain

step "Killed on the plain port"
kill_client eth0
expect_success /etc/rc.network start
expect_client eth0
pause 70
topology_ready
expect_plain killed

step "Killed on the switch, without a server"
timed Register vornovsctl register alpha
servers="$(cat /run/servers.pid)"
kill -STOP "$servers"
kill_client ovs_eth0
expect_success /etc/rc.network start
expect_client ovs_eth0
pause 40
topology_ready
kill -CONT "$servers"
pause 100
topology_ready
timed UnRegister vornovsctl unregister alpha
pause 10
expect_plain

step "Stop and start"
expect_success /etc/rc.network stop
expect_equal "the addresses after a stop" "" "$(addresses_of eth0)"
expect_success /etc/rc.network start
wait_until 30 served_as_asked eth0
pause 15
topology_ready
expect_plain started
expect_equal "requests for a new lease" 1 "$(grep -c DHCPDISCOVER "$lab_servers_log")"
