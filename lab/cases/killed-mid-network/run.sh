# shellcheck shell=bash disable=SC2154 # variables of the guest's other files

remember_plain
probes_start
for verb in stop start; do
    step "Killed while registering, in rc.network $verb"
    killed_during "$verb" vornovsctl register alpha
    expect_safe_after_kill
    bring_home
    expect_registered
    expect_plain "register-$verb"

    step "Killed while unregistering, in rc.network $verb"
    expect_success vornovsctl register alpha
    killed_during "$verb" vornovsctl unregister alpha
    expect_safe_after_kill
    bring_home
    expect_registered
    expect_plain "unregister-$verb"
done
lab_probe_after=2 probes_finish "killed clients" 100
