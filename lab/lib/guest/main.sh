# shellcheck shell=bash disable=SC2154 # variables of the guest's other files
# The guest's helpers, and the way through a case. A case's script is read by this shell, so every
# function of these files is its vocabulary.

# shellcheck source=report.sh
. /lab/report.sh
# shellcheck source=wait.sh
. /lab/wait.sh
# shellcheck source=topology.sh
. /lab/topology.sh
# shellcheck source=userspace.sh
. /lab/userspace.sh
# shellcheck source=servers.sh
. /lab/servers.sh
# shellcheck source=manager.sh
. /lab/manager.sh
# shellcheck source=phases.sh
. /lab/phases.sh
# shellcheck source=packages.sh
. /lab/packages.sh
# shellcheck source=booting.sh
. /lab/booting.sh
# shellcheck source=takeover.sh
. /lab/takeover.sh
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
# shellcheck source=points.sh
. /lab/points.sh
# shellcheck source=powercut.sh
. /lab/powercut.sh

# lab_main case|here: what the guest is for. The outside world is made here, but that of the machine
# with systemd, which is there since before its first program.
lab_main()
{
    mkdir -p "$lab_out"
    if ! machine_has_systemd; then
        topology_build
        servers_start
    fi
    if machine_shares_kernel; then
        userspace_bridges &
    fi
    if [ -e /lab/case/run.sh ]; then
        lab_run_case
        if phase_ends_in_reboot; then
            # As "systemctl reboot" does where nobody is asked first.
            systemctl start --no-block --job-mode=replace-irreversibly reboot.target
            return
        fi
    fi
    if [ "$1" = here ]; then
        printf '\nPorts: %s  The outside: ip netns exec outside ...  Leave with: exit\n\n' \
            "$(topology_ports)"
        cd /root || exit 1
        lab_shell
        machine_shares_kernel || printf 'lab-left\n' >/dev/ttyS1
    else
        lab_send_results
    fi
    if machine_has_systemd; then
        sync
        poweroff -ff
    fi
}

lab_shell()
{
    if machine_has_systemd || machine_shares_kernel; then
        bash -i
    else
        setsid cttyhack bash
    fi
}

# The case runs in a shell of its own: whatever ends it, the results leave the guest.
lab_run_case()
{
    (
        set -eEu -o pipefail
        trap 'report_ended_at "$?" "${BASH_SOURCE[0]}" "$LINENO" "$BASH_COMMAND"' ERR
        if machine_has_disk; then
            # shellcheck source=/dev/null
            . /lab/case/run.sh
            phase_run
        else
            lab_boot
            # shellcheck source=/dev/null
            . /lab/case/run.sh
        fi
    )
    lab_status=$?
    probes_stop >/dev/null 2>&1
    phase_ends_in_reboot || report_verdict "$lab_status"
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
    system_log >"$lab_out/syslog" 2>/dev/null
    # What the host looked like in the end tells why a case waited in vain.
    { ip -details address show; ip route show table all; ip -6 route show table all; } \
        >"$lab_out/network" 2>/dev/null
    # And what switches and neighbours outside believed.
    { in_outside bridge fdb show; in_outside ip neigh show; } >"$lab_out/outside" 2>/dev/null
    cp -r /var/log/openvswitch "$lab_out/openvswitch-log" 2>/dev/null
    # Set on the open line: a line that somebody closed may have forgotten how it was set.
    {
        machine_shares_kernel || stty raw -echo <&1
        tar -C "$lab_out" -cf - . 2>/dev/null | cat
    } >/dev/ttyS2
}
