# shellcheck shell=bash disable=SC2154 # variables of the guest's other files
# Echo requests every 5 ms to and from the host, and how long they went unanswered.
#
# The probes run with a real-time priority: the other host is a machine of its own, so what the
# appliance computes must not delay it.

lab_probe_interval=5

# Seconds to go on probing after the last command: neighbours that believe an old hardware address
# find out only after seconds.
lab_probe_after=10

# probes_start: begins to probe every address of the appliance from outside, and the outside from
# the appliance; returns when each of them has been answered.
probes_start()
{
    local target
    probes_stop
    rm -rf "$lab_out/probes"
    mkdir -p "$lab_out/probes"
    topology_addresses >"$lab_out/addresses"

    probes_launch in-4 outside "$(awk '$1 == 4 { print $2 }' "$lab_out/addresses")"
    probes_launch in-6 outside "$(awk '$1 == 6 { print $2 }' "$lab_out/addresses")"
    probes_launch out-4 here "$(topology_outside_addresses 4)"
    probes_launch out-6 here "$(topology_outside_addresses 6)"
    for target in "$lab_out"/probes/*.targets; do
        wait_until 20 probes_all_answered "${target%.targets}"
    done
    # While the probes were started, each kept the others waiting.
    echo "$EPOCHREALTIME" >"$lab_out/probes/begin"
}

# probes_launch NAME outside|here TARGETS
probes_launch()
{
    local name="$1" place="$2" file="$lab_out/probes/$1"
    if [ -z "$3" ]; then
        return
    fi
    echo "$3" >"$file.targets"
    set -- chrt -f 50 fping "-${name#*-}" -D -l -p "$lab_probe_interval" -i 0 -t 1000
    if [ "$place" = outside ]; then
        set -- ip netns exec outside "$@"
    fi
    # shellcheck disable=SC2046 # one argument an address
    "$@" $(cat "$file.targets") >"$file" 2>"$file.errors" &
    echo "$!" >>"$lab_out/probes/pids"
}

probes_all_answered()
{
    local target
    while read -r target; do
        grep -q " $target : .* bytes" "$1" || return 1
    done <"$1.targets"
}

probes_stop()
{
    if [ -e "$lab_out/probes/pids" ]; then
        echo "$EPOCHREALTIME" >"$lab_out/probes/end"
        # shellcheck disable=SC2046 # one argument a pid
        kill $(cat "$lab_out/probes/pids") 2>/dev/null || true
        # Their last lines are written when they end.
        # shellcheck disable=SC2046
        wait $(cat "$lab_out/probes/pids") || true
        rm -f "$lab_out/probes/pids"
    fi
}

# probes_outage NAME: milliseconds that the worst target of a probe went unanswered: the longest time
# between two answers beyond the interval, the time from the last answer to the end included.
probes_outage()
{
    probes_table "$1" | awk -F '\t' '$2 > worst { worst = $2 } END { printf "%.1f\n", worst }'
}

# A line a target: address, outage in ms, probes answered, probes sent.
probes_table()
{
    # A probe that cannot even be sent leaves no line with a time, so the end is asked for.
    awk -v interval="$lab_probe_interval" -v begin="$(cat "$lab_out/probes/begin")" \
        -v end="$(cat "$lab_out/probes/end")" '
        /^\[[0-9.]+\]/ && substr($1, 2) + 0 >= begin {
            time = substr($1, 2) * 1000
            target = $2
            sent[target]++
            if ($0 ~ / bytes, /) {
                if (target in last && time - last[target] - interval > gap[target]) {
                    gap[target] = time - last[target] - interval
                }
                last[target] = time
                answered[target]++
            }
        }
        END {
            for (target in sent) {
                if (end * 1000 - last[target] - interval > gap[target]) {
                    gap[target] = end * 1000 - last[target] - interval
                }
                printf "%s\t%.1f\t%d\t%d\n", target, gap[target], answered[target], sent[target]
            }
        }' "$lab_out/probes/$1" | sort
}

# probes_finish NAME LIMIT: goes on probing for a while, stops, and records the outage of each direction
# as figures "NAME in" and "NAME out"; fails the case when one is longer than LIMIT ms.
probes_finish()
{
    local name="$1" limit="$2" direction family outage worst file
    sleep "$lab_probe_after"
    probes_stop
    for direction in in out; do
        worst=0
        for family in 4 6; do
            file="$lab_out/probes/$direction-$family"
            [ -e "$file.targets" ] || continue
            outage="$(probes_outage "$direction-$family")"
            probes_table "$direction-$family" | while IFS="$(printf '\t')" read -r target gap got all; do
                note "$name, $direction, $target: longest $gap ms without an answer, $got of $all"
            done
            worst="$(printf '%s\n%s\n' "$worst" "$outage" | sort -n | tail -n 1)"
        done
        figure "$name $direction" "$worst" ms
    done
    rm -rf "$lab_out/probes-$name"
    cp -r "$lab_out/probes" "$lab_out/probes-$name"
    for direction in in out; do
        worst="$(awk -F '\t' -v name="$name $direction" '$1 == name { print $2 }' \
            "$lab_out/figures" | tail -n 1)"
        expect_at_most "$name $direction: ms without an answer" "$worst" "$limit"
    done
}
