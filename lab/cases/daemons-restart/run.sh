# shellcheck shell=bash disable=SC2154 # variables of the guest's other files

# kill_all SIGNAL NAME: one of them may end with the one before it.
kill_all()
{
    local pid
    for pid in $(processes_named "$2"); do
        kill "-$1" "$pid" 2>/dev/null || true # it may have ended by now
    done
}

remember_plain
expect_success vornovsctl register alpha
expect_on_switch

step "Restart the services"
expect_success /etc/init.d/vornovs-vswitch stop
expect_success /etc/init.d/vornovs-db stop
expect_failure /etc/init.d/vornovs-vswitch status
expect_success /etc/init.d/vornovs-db start
expect_success /etc/init.d/vornovs-vswitch start
expect_success /etc/init.d/vornovs-vswitch status
topology_ready
expect_on_switch

step "Kill the daemons"
for name in ovs-vswitchd ovsdb-server; do
    # The first of them watches over the other and would start it again.
    while process_named "$name"; do
        kill_all KILL "$name"
        pause 0.05
    done
done
expect_failure /etc/init.d/vornovs-db status
expect_success /etc/init.d/vornovs-db start
expect_success /etc/init.d/vornovs-vswitch start
topology_ready
expect_on_switch

step "Unregister"
expect_success vornovsctl unregister alpha
expect_plain
