# shellcheck shell=bash disable=SC2154 # variables of the guest's other files
# The way to the switch and back, watched.

# round_trip LIMIT [COMMAND...]: registers a client, does something, and unregisters the client. The
# host must answer but for LIMIT ms, and be in everything what it was.
round_trip()
{
    local limit="$1"
    shift
    remember_plain

    step "Register"
    probes_start
    timed Register vornovsctl register alpha
    expect_registered alpha
    expect_on_switch
    expect_success vornovsctl check
    probes_finish Register "$limit"
    expect_lock_free

    if [ $# -gt 0 ]; then
        "$@"
        expect_on_switch
        expect_success vornovsctl check
    fi

    step "Unregister"
    probes_start
    timed UnRegister vornovsctl unregister alpha
    expect_registered
    probes_finish UnRegister "$limit"
    expect_plain
    expect_success vornovsctl check
    expect_lock_free
}

# pull_each_cable BOND LIMIT: each slave in turn loses its cable and gets it back.
pull_each_cable()
{
    local bond="$1" limit="$2" slave
    for slave in $(slaves_of "$bond"); do
        step "Pull the cable of $slave"
        probes_start
        in_outside ip link set "out-$slave" down
        pause 2
        in_outside ip link set "out-$slave" up
        lab_probe_after=5 probes_finish "cable of $slave" "$limit"
    done
}

# An administrator stops the network and starts it.
stop_and_start()
{
    local family address
    step "Stop and start"
    expect_success /etc/rc.network stop
    while read -r family address; do
        if in_outside fping "-$family" -q -r 0 -t 200 "$address"; then
            fail "$address answers although its network was stopped"
        fi
    done < <(topology_addresses)
    expect_success /etc/rc.network start
    topology_ready
}
