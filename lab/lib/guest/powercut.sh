# shellcheck shell=bash disable=SC2154 # variables of the guest's other files
# Power cuts: the machine stops at once, and what was not written to its disk yet is lost.

# cut_power_after SECONDS NAME COMMAND...: runs a command and cuts the power so long after its
# beginning; phase_NAME follows.
cut_power_after()
{
    local seconds="$1" next="$2"
    shift 2
    phase_goes_on "$next"
    touch /lab/state/clock
    sync
    (
        pause "$seconds"
        echo b >/proc/sysrq-trigger
    ) &
    "$@" >/dev/null 2>&1 || true # what it comes to is of no account without power
    # It has ended before its power.
    sleep 3600
    fail "the power stayed on"
}
