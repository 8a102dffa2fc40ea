# shellcheck shell=bash disable=SC2154,SC2034 # variables of the guest's other files

worst=/lab/state/worst
lab_members_in_any_order=yes

phase_start()
{
    local count
    count="$(points 10 40)"
    topology_ready
    remember_plain
    points_spread "$count"
    echo 0 >"$worst"
    figure "power cuts" "$count" times
    go_on
}

# Cuts the power at the next point, if there is one.
go_on()
{
    if points_next; then
        points_prepare
        step "Power cut $point_seconds s after the beginning of $point_verb"
        cut_power_after "$point_seconds" cut vornovsctl "$point_verb" alpha
    fi
    points_leave
    figure "reachable after the boot" "$(cat "$worst")" "hundredths of a second at most"
}

phase_cut()
{
    expect_reachable 110
    note "reachable $reachable_after hundredths of a second after the boot"
    if [ "$reachable_after" -gt "$(cat "$worst")" ]; then
        echo "$reachable_after" >"$worst"
    fi
    expect_repaired
    go_on
}
