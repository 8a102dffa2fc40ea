# shellcheck shell=bash disable=SC2154 # variables of the guest's other files
# Echo requests every few milliseconds to and from the host, and how long they went unanswered.

# Milliseconds. Requests are what a case with many addresses spends most of its time on.
lab_probe_interval="$(sampled 10 5)"

# Seconds to go on probing after the last command: neighbours that believe an old hardware address
# find out only after seconds.
lab_probe_after=10

# probes_start: begins to probe every address of the appliance from outside, and the outside from
# the appliance; returns when each of them has been answered, which is when the counting begins.
probes_start()
{
    local family target
    local far
    probes_stop
    set --
    for family in 4 6; do
        for target in $(topology_addresses | awk -v family="$family" '$1 == family { print $2 }'); do
            set -- "$@" in outside "$target"
        done
        for target in $(topology_outside_addresses "$family"); do
            set -- "$@" out here "$target"
        done
        # The far host's requests are answered through the appliance's default route.
        far="$(topology_far_address "$family")"
        target="$(topology_addresses | awk -v family="$family" '$1 == family && !seen++ { print $2 }')"
        if [ -n "$far" ] && [ -n "$target" ]; then
            set -- "$@" in outside "$target@$far"
        fi
    done
    rm -f "$lab_out"/probes*
    /lab/clients/probe "$lab_probe_interval" "$lab_out/probes" "$@" &
    lab_probe=$!
    wait_until 20 test -e "$lab_out/probes.ready"
}

# Probes a fifth as often from now on.
probes_relax()
{
    kill -USR2 "$lab_probe"
}

# Begins the next phase of the probes' counts.
probes_next_phase()
{
    kill -USR1 "$lab_probe"
}

# Ends the probes; $lab_out/probes then has a line for each target. Whoever reads it notices when
# one that died early has left none.
probes_stop()
{
    if [ -n "${lab_probe:-}" ]; then
        kill "$lab_probe" 2>/dev/null || true # it may have ended by now
        wait "$lab_probe" || true # its status is that it was ended
        lab_probe=''
    fi
}

# probes_outage DIRECTION: milliseconds that the worst target went unanswered.
probes_outage()
{
    awk -F '\t' -v label="$1" '$1 == label && $3 > worst { worst = $3 }
        END { printf "%.1f\n", worst }' "$lab_out/probes"
}

# Prints what the probes saw, a line a target.
probes_tell()
{
    awk -F '\t' '{
        printf "%-3s %-40s longest %s ms without an answer", $1, $2, $3
        if ($3 > 0) {
            printf ", %s s after the beginning", $4
        }
        print ""
    }' "$lab_out/probes" | show
}

# probes_finish NAME LIMIT: goes on probing for a while, stops, and records the outage of each
# direction as figures "NAME in" and "NAME out"; fails the case when one is longer than LIMIT ms.
probes_finish()
{
    local name="$1" limit="$2" direction
    # What goes wrong afterwards does so for longer than the moments of a conversion.
    probes_relax
    sleep "$lab_probe_after"
    probes_stop
    [ -s "$lab_out/probes" ] || fail "the probes ended by themselves"
    cp "$lab_out/probes" "$lab_out/probes-$name"
    probes_tell
    for direction in in out; do
        figure "$name $direction" "$(probes_outage "$direction")" ms
    done
    for direction in in out; do
        expect_at_most "$name $direction: ms without an answer" "$(probes_outage "$direction")" \
            "$limit"
    done
}
