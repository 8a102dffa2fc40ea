# shellcheck shell=bash disable=SC2154 # variables of the guest's other files
# The guest's helpers, and the way through a case. A case's script is read by this shell, so every
# function of these files is its vocabulary.

# shellcheck source=report.sh
. /lab/report.sh
# shellcheck source=wait.sh
. /lab/wait.sh
# shellcheck source=topology.sh
. /lab/topology.sh
# shellcheck source=servers.sh
. /lab/servers.sh
# shellcheck source=snapshot.sh
. /lab/snapshot.sh
# shellcheck source=probes.sh
. /lab/probes.sh
# shellcheck source=host.sh
. /lab/host.sh
# shellcheck source=roundtrip.sh
. /lab/roundtrip.sh
# shellcheck source=killed.sh
. /lab/killed.sh

lab_main()
{
    mkdir -p "$lab_out"
    topology_build
    servers_start
    if [ -e /lab/case/run.sh ]; then
        lab_run_case
    fi
    if [ "$1" = here ]; then
        printf '\nPorts: %s  The outside: ip netns exec outside ...  Leave with: exit\n\n' \
            "$(topology_ports)"
        cd /root || exit 1
        setsid cttyhack bash
    else
        lab_send_results
    fi
}

# The case runs in a shell of its own: whatever ends it, the results leave the guest.
lab_run_case()
{
    (
        set -eEu -o pipefail
        trap 'report_ended_at "$?" "${BASH_SOURCE[0]}" "$LINENO" "$BASH_COMMAND"' ERR
        lab_boot
        # shellcheck source=/dev/null
        . /lab/case/run.sh
    )
    report_verdict "$?"
    probes_stop >/dev/null 2>&1
}

# Brings the appliance's own network up as its boot does, unless the case does without it.
lab_boot()
{
    if [ -e /lab/case/no-boot ]; then
        return
    fi
    [ -x /etc/rc.network ] || fail "the appliance has no /etc/rc.network"
    /etc/rc.network start || fail "the appliance's network did not start"
    topology_ready
}

lab_send_results()
{
    cp /var/log/messages "$lab_out/syslog" 2>/dev/null
    cp "$lab_servers_log" "$lab_out/servers-log" 2>/dev/null
    cp -r /var/log/openvswitch "$lab_out/openvswitch-log" 2>/dev/null
    tar -C "$lab_out" -cf - . >/dev/ttyS2 2>/dev/null
}
