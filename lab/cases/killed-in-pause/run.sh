# shellcheck shell=bash disable=SC2154,SC2034 # variables of the guest's other files

# The step number of the pause in the list of the last run.
pause_step()
{
    awk '$2 == "sleep" && !seen++ { print $1 }' "$lab_steps"
}

holder_is_gone()
{
    no_process_named rc.network
}

remember_plain
killed_at 0 vornovsctl register alpha
to_switch="$(pause_step)"
killed_at 0 vornovsctl unregister alpha
to_plain="$(pause_step)"
expect_plain learned

step "Killed in the pause of a registration"
lab_probe_interval=20
probes_start
killed_at "$to_switch" vornovsctl register alpha
expect_safe_after_kill
began="$SECONDS"
wait_until 60 holder_is_gone
figure "the network was held" "$((SECONDS - began))" s
default_routes >"$lab_out/got-routes"
expect_same_text "the default routes" "$lab_out/plain-default-routes" "$lab_out/got-routes"
bring_home
expect_plain registration

step "Killed in the pause of a withdrawal"
expect_success vornovsctl register alpha
killed_at "$to_plain" vornovsctl unregister alpha
expect_safe_after_kill
wait_until 60 holder_is_gone
bring_home
expect_plain withdrawal
lab_probe_after=2 probes_finish "killed clients" 100
