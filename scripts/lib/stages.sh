# shellcheck shell=bash disable=SC2154,SC2034 # variables of the script that has the stages
# Stages of a long check: each in a process of its own with a log, a time limit and counts, some of
# them beside the others. Whoever has them sets $logs and $beside_stages, has a function deadline_of,
# and runs stage_STAGE when called with "--in-process STAGE".

# Adds to the counts of the running stage.
count()
{
    echo "$1 $2" >>"$counts"
}

# Runs one check and counts it.
check()
{
    local name=$1
    shift
    if "$@"; then
        echo "ok: $name"
        count 1 0
    else
        echo "FAILED: $name"
        count 0 1
    fi
}

# Runs one stage in a process of its own, under its time limit, and keeps how it ended.
run_stage()
{
    local stage=$1 counts=$logs/$1.counts start=$SECONDS status=0 TIMEFORMAT='%U %S'
    : >"$counts"
    {
        time timeout --foreground "$(deadline_of "$stage")m" "$0" --in-process "$stage" 2>&1 |
            tee "$logs/$stage.log" || status=$?
    } 2>"$logs/$stage.times"
    echo "$((SECONDS - start))" >"$logs/$stage.seconds"
    if [[ $status -eq 124 ]]; then
        echo "the stage took longer than $(deadline_of "$stage") minutes" | tee -a "$logs/$stage.log"
    elif [[ ! -s $counts ]]; then
        echo "the stage checked nothing" | tee -a "$logs/$stage.log"
        status=1
    fi
    if [[ $status -ne 0 ]]; then
        echo "0 1" >>"$counts"
    fi
}

# Adds how a stage ended to the sums, and a line about it to the summary.
add_stage()
{
    local stage=$1 passed=0 failed=0 user system ok bad
    while read -r ok bad; do
        passed=$((passed + ok))
        failed=$((failed + bad))
    done <"$logs/$stage.counts"
    read -r user system < <(tail -n 1 "$logs/$stage.times")
    all_passed=$((all_passed + passed))
    all_failed=$((all_failed + failed))
    summary+=("$(printf '%-11s %-6s %5d passed, %d failed, %4d s, %4d s of processors' "$stage" \
        "$([[ $failed -eq 0 ]] && echo ok || echo FAILED)" "$passed" "$failed" \
        "$(<"$logs/$stage.seconds")" "$((${user%.*} + ${system%.*}))")")
}

# Runs stages in the background, in a process group of its own so that it ends with this command.
run_beside()
{
    local stage
    say_note "beside what follows: $* (see $logs)"
    set -m
    for stage in "$@"; do run_stage "$stage"; done >/dev/null 2>&1 &
    set +m
    # shellcheck disable=SC2064 # the number as it is now
    trap "kill -- -$! 2>/dev/null || true" EXIT # it has ended when this command ends as it should
    trap 'exit 130' INT TERM HUP
}

run_stages()
{
    local stage before=() beside=() after=()
    for stage in "$@"; do
        if [[ " ${beside_stages[*]} " == *" $stage "* ]]; then
            beside+=("$stage")
        elif [[ $stage == format || $stage == build ]]; then
            before+=("$stage")
        else
            after+=("$stage")
        fi
    done
    for stage in "${before[@]}"; do
        say_heading "stage $stage"
        run_stage "$stage"
    done
    if [[ ${#beside[@]} -gt 0 && ${#after[@]} -gt 0 ]]; then
        run_beside "${beside[@]}"
    else
        after+=("${beside[@]}")
        beside=()
    fi
    for stage in "${after[@]}"; do
        say_heading "stage $stage"
        run_stage "$stage"
    done
    wait
    for stage in "${beside[@]}"; do
        say_heading "stage $stage"
        cat "$logs/$stage.log"
    done
}
