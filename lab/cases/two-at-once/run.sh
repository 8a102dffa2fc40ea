# shellcheck shell=bash disable=SC2154 # variables of the guest's other files

# both VERB: runs it for both clients at the same time; what was refused is tried again.
both()
{
    local alpha beta alpha_status=0 beta_status=0
    vornovsctl "$1" alpha &
    alpha=$!
    vornovsctl "$1" beta &
    beta=$!
    wait "$alpha" || alpha_status=$?
    wait "$beta" || beta_status=$?
    note "alpha ended with $alpha_status, beta with $beta_status"
    [ "$alpha_status" -eq 0 ] || [ "$beta_status" -eq 0 ] || fail "neither could $1"
    if [ "$alpha_status" -ne 0 ]; then
        expect_success vornovsctl "$1" alpha
    fi
    if [ "$beta_status" -ne 0 ]; then
        expect_success vornovsctl "$1" beta
    fi
}

remember_plain

step "Register both"
probes_start
both register
expect_registered alpha beta
expect_on_switch
lab_probe_after=2 probes_finish Register 100

step "Unregister both"
probes_start
both unregister
expect_registered
lab_probe_after=2 probes_finish UnRegister 100
expect_plain
expect_lock_free
