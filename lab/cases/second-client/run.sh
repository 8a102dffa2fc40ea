# shellcheck shell=bash disable=SC2154 # variables of the guest's other files

remember_plain
expect_success vornovsctl register alpha
expect_on_switch
snapshot switched

step "A second client joins, the first one tries once more and leaves"
probes_start
timed "second Register" vornovsctl register beta
expect_registered alpha beta
expect_status 5 vornovsctl register alpha
expect_registered alpha beta
timed "first UnRegister" vornovsctl unregister alpha
expect_registered beta
expect_status 5 vornovsctl unregister gamma
expect_registered beta
lab_probe_after=2 probes_finish "joining and leaving" 5
expect_on_switch

step "The host itself did not change"
snapshot after
expect_changed switched after '^\+beta$'
# Finding no line is what is hoped for.
snapshot_difference switched after | grep -v -e '^[-+]alpha$' -e '^[-+]beta$' \
    -e '^---' -e '^+++' >"$lab_out/rest" || [ $? -eq 1 ]
expect_same_text "the rest of the host" /dev/null "$lab_out/rest"

step "The last one leaves"
expect_success vornovsctl unregister beta
expect_registered
expect_plain
expect_lock_free
