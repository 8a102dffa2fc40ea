# shellcheck shell=bash disable=SC2154,SC2034 # variables of the guest's other files

remember_plain

step "Learn the steps"
expect_success vornovsctl register alpha
killed_at 0 vornovsctl unregister alpha
last="$(steps_taken)"
sed 's/^/step /' "$lab_steps" | show
expect_plain learned

stride="$(sampled 8 1)"
step "Be killed before $((last / stride)) of $last steps"
# Minutes of probes: more seldom than elsewhere, still five times within the limit.
lab_probe_interval=20
probes_start
for ((number = stride; number <= last; number += stride)); do
    expect_success vornovsctl register alpha
    killed_at "$number" vornovsctl unregister alpha
    step "Killed before step $number, $(step_name)"
    expect_safe_after_kill
    mend >"$lab_out/way-home" 2>&1
    expect_registered
    expect_plain "after-$number"
done
lab_probe_after=2 probes_finish "killed clients" 100
figure "steps" "$((last / stride))" "kills"
