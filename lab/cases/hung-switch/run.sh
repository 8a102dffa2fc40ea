# shellcheck shell=bash disable=SC2154 # variables of the guest's other files

stop_database()
{
    local pid
    for pid in $(processes_named ovsdb-server); do
        kill "-$1" "$pid"
    done
}

remember_plain
expect_success /etc/init.d/vornovs-db start
expect_success /etc/init.d/vornovs-vswitch start

step "Register at a hung switch"
stop_database STOP
probes_start
began="$SECONDS"
status=0
timeout 120 vornovsctl register alpha || status=$?
took="$((SECONDS - began))"
figure "Register at a hung switch took" "$took" s
note "it ended with $status"
expect_at_most "seconds until a registration gave up" "$took" 60
wait_until 60 client_is_gone
expect_lock_free
lab_probe_after=2 probes_finish "hung switch" 100

step "The switch goes on"
stop_database CONT
wait_until 30 ovs-vsctl --timeout=1 list-br
probes_start
bring_home
lab_probe_after=2 probes_finish "way home" 100
expect_registered
expect_plain
