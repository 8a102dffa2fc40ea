# shellcheck shell=bash disable=SC2154,SC2034 # variables of the guest's other files

worst=0
lab_members_in_any_order=yes

# Nothing of the network program waits or works any more; telling where a bond is changes nothing.
network_rests()
{
    local pid
    for pid in $(processes_named rc.network); do
        network_program_does "$pid" announce || return 1
    done
}

count="$(points 10 40)"
remember_plain
points_spread "$count"
while points_next; do
    points_prepare
    step "Killed $point_seconds s after the beginning of $point_verb"
    killed_with_all_after "$point_seconds" vornovsctl "$point_verb" alpha
    expect_reachable 120
    wait_until 120 network_rests
    worst=$((reachable_after > worst ? reachable_after : worst))
    expect_safe_after_kill
    expect_repaired
done
points_leave
figure "kills" "$count" times
figure "reachable" "$worst" "hundredths of a second after a kill at most"
