# shellcheck shell=bash disable=SC2154 # variables of the guest's other files
# A case on a machine with a disk goes on after a reboot: its run.sh is a set of functions
# phase_NAME, of which each boot runs one, the first phase_start. The phase that a reboot leads to
# is named by the one before it.

lab_next=/lab/state/next

# reboot_machine NAME: ends this phase; the machine restarts as an administrator restarts it, and
# phase_NAME goes on.
reboot_machine()
{
    declare -F "phase_$1" >/dev/null || fail "the case has no phase_$1"
    step "Reboot, then $1"
    phase_goes_on "$1"
    exit 0
}

# phase_goes_on NAME: the machine may restart from now on, and is in phase_NAME then.
phase_goes_on()
{
    printf 'lab-reboot\n'
    echo "$1" >"$lab_next"
}

phase_ends_in_reboot()
{
    [ -s "$lab_next" ]
}

# Runs the phase that this boot is for.
phase_run()
{
    local phase=start boots
    boots=$(($(cat /lab/state/boots 2>/dev/null || echo 0) + 1))
    echo "$boots" >/lab/state/boots
    if [ -s "$lab_next" ]; then
        phase="$(cat "$lab_next")"
        rm "$lab_next"
    elif [ "$boots" -gt 1 ]; then
        fail "the machine restarted by itself"
    fi
    # What came before, the host's preparation or another phase, has told why it failed.
    [ ! -e "$lab_out/failure" ] || exit 1
    phase_wait_for_boot
    figure "boot $boots" "$(guest_time)" s
    step "Phase $phase"
    "phase_$phase"
}

# All that starts with the machine has started, or has failed.
phase_wait_for_boot()
{
    local status=0
    if ! machine_has_systemd; then
        # It fails when a power cut left files that it does not understand.
        /etc/rc.network --boot start || status=$?
        note "rc.network ended with $status"
        return
    fi
    systemctl is-system-running --wait >/dev/null || true # "degraded" is a failure, too
    systemctl list-units --failed --plain --no-legend --no-pager | show
}
