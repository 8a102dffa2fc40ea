# shellcheck shell=bash disable=SC2154,SC2034 # variables of the guest's other files
# Points that are spread over a registration and a withdrawal.

lab_points="$lab_out/points"

# points_spread COUNT: learns how long both take, and writes the points to $lab_points, a line each:
# VERB SECONDS-AFTER-ITS-BEGINNING; of both verbs in turn, since one begins where the other leads to.
# The host is plain before and afterwards.
points_spread()
{
    local verb
    for verb in register unregister; do
        killed_at 0 vornovsctl "$verb" alpha
        echo "0 end $(awk '{ print int($1 * 1000) }' /proc/uptime)" >>"$lab_steps"
        mv "$lab_steps" "$lab_out/learned-$verb"
    done
    expect_plain learned
    paste -d '\n' \
        <(points_over "$lab_out/learned-register" register $((($1 + 1) / 2))) \
        <(points_over "$lab_out/learned-unregister" unregister $(($1 / 2))) |
        sed '/^$/d' >"$lab_points"
}

# points_over STEPS VERB COUNT: prints points between the first step and the end. In a pause nothing
# happens: it counts as a fifth of a second, however long it is.
points_over()
{
    awk -v verb="$2" -v count="$3" '
        NR > 1 { length_of[NR - 1] = $3 - former }
        { former = $3; name[NR] = $2 }
        END {
            for (i = 1; i < NR; i++) {
                weight[i] = name[i] == "sleep" && length_of[i] > 200 ? 200 : length_of[i]
                whole += weight[i]
            }
            for (point = 1; point <= count; point++) {
                left = (point - 0.5) * whole / count
                at = 0
                for (i = 1; i < NR && left > weight[i]; i++) {
                    left -= weight[i]
                    at += length_of[i]
                }
                if (i < NR && weight[i] > 0) {
                    at += left * length_of[i] / weight[i]
                }
                printf "%s %.3f\n", verb, at / 1000
            }
        }' "$1"
}

# points_next: takes the first point off the list and sets $point_verb and $point_seconds; false when
# there is none left.
points_next()
{
    read -r point_verb point_seconds <"$lab_points" || return 1
    sed -i 1d "$lab_points"
}

# Brings a whole host to where the verb of the point begins: on the switch or off it.
points_prepare()
{
    if [ "$point_verb" = register ]; then
        points_leave
    elif [ -z "$(registered_clients)" ]; then
        expect_success vornovsctl register alpha
    fi
}

# Takes a whole host off the switch, and it is in everything what it was.
points_leave()
{
    if [ -n "$(registered_clients)" ]; then
        expect_success vornovsctl unregister alpha
        expect_plain
    fi
}

# expect_reachable SECONDS: every address of the host answers the outside within that time. Sets
# $reachable_after to how long it took.
expect_reachable()
{
    local family address began ticks
    guest_ticks
    began="$ticks"
    while read -r family address; do
        wait_until "$1" in_outside fping "-$family" -q -r 0 -t 200 "$address"
    done < <(topology_addresses)
    guest_ticks
    reachable_after=$((ticks - began))
}

# A repair takes the host from where an interrupted client left it to a whole state: on the switch
# with all it had, or off it and in everything what it was.
expect_repaired()
{
    vornovsctl check 2>&1 | show || true # its status is the class of what it found
    repair_host >"$lab_out/repair" 2>&1 || fail "not repaired: $(tail -n 3 "$lab_out/repair")"
    if [ -n "$(registered_clients)" ]; then
        expect_registered alpha
        expect_on_switch
    else
        expect_plain
    fi
    expect_reachable 5
    expect_whole_files
    expect_lock_free
}
