# shellcheck shell=bash disable=SC2154,SC2034 # variables that the lab's files share
# Running cases: each in a guest of its own.

# The machine that a case is for: small, systemd or namespaces.
lab_case_machine()
{
    local file=$lab_source/cases/$1/machine
    if [[ -f $file ]]; then
        cat "$file"
    else
        echo small
    fi
}

# The disk that a case begins with: fresh, ready or empty; nothing for a machine without.
lab_case_disk()
{
    if [[ -e $lab_source/cases/$1/fresh ]]; then
        echo fresh
    elif [[ $(lab_case_machine "$1") == systemd ]]; then
        echo ready
    elif [[ -e $lab_source/cases/$1/disk ]]; then
        echo empty
    fi
}

# lab_case_names DAILY MACHINE...: the cases for these machines (none: all). With DAILY "daily" a
# case for the machine with systemd must have a file `daily`, and another one no file `seldom`. Long
# cases, which have a deadline of their own, come first: the short ones fill the gaps.
lab_case_names()
{
    local daily=$1 folder name its
    shift
    for folder in "$lab_source"/cases/*/; do
        name=$(basename "$folder")
        its=$(lab_case_machine "$name")
        if [[ ($# -eq 0 || " $* " == *" $its "*) &&
            (-z $daily || ($its == systemd && -e $folder/daily) ||
            ($its != systemd && ! -e $folder/seldom)) ]]; then
            printf '%d %s\n' "$([[ -e $folder/deadline ]] && echo 0 || echo 1)" "$name"
        fi
    done | sort | cut -d ' ' -f 2
}

lab_case_title()
{
    sed -n 's/^# //p' "$lab_source/cases/$1/README.md"
}

lab_case_deadline()
{
    local file=$lab_source/cases/$1/deadline
    if [[ -f $file ]]; then
        cat "$file"
    else
        echo 1200
    fi
}

# Words for the guests' kernel line: lab.daily has long cases take samples, lab.points=N has those
# that spread kills and power cuts over a conversion spread so many.
lab_words=''

# Runs one case and leaves in its results folder: console, report, syslog, figures, verdict and
# whatever else the case kept.
lab_run_case()
{
    local name=$1 results=$lab_results/$1 machine began status=0 verdict
    machine=$(lab_case_machine "$name")
    rm -rf "$results"
    mkdir -p "$results"

    began=$(date +%s)
    if [[ $machine == namespaces ]]; then
        lab_run_namespaces "$name" || status=$?
    else
        lab_run_guest "$name" "$machine" "$(<"$lab_source/cases/$name/topology")" || status=$?
    fi
    echo $(($(date +%s) - began)) >"$results/seconds"

    # A guest that hung sends no results; the verdict is read from its report all the same.
    tar -C "$results" -xf "$results/results.tar" 2>/dev/null || true
    rm -rf "$results"/{results.tar,guest.cpio,disk,tree,tree.root}
    verdict=$(lab_report_verdict "$results/report")
    if [[ -z $verdict ]]; then
        verdict="failed: $(lab_why_no_verdict "$status" "$name")"
    fi
    echo "$verdict" >"$results/verdict"
}

# Runs a case's guest, again after each reboot that the case asked for.
lab_run_guest()
{
    local name=$1 machine=$2 topology=$3 results=$lab_results/$1 disk lines deadline left boots=0
    # The deadline is of this machine's time: it ends a guest whose own clock may stand still.
    deadline=$(($(date +%s) + $(lab_case_deadline "$name")))
    lab_make_guest_image "$results/guest.cpio" "$machine" "$topology" \
        "$lab_source/cases/$name" ''
    disk=$(lab_case_disk "$name")
    if [[ -n $disk ]]; then
        lab_make_guest_disk "$results/disk" "$disk"
    fi
    mapfile -t lines < <(lab_line "$results/console"; lab_line "$results/report";
        lab_line "$results/results.tar")
    while [[ $(lab_reboots "$results/report") -eq $boots ]]; do
        boots=$((boots + 1))
        left=$((deadline - $(date +%s)))
        (lab_start_guest "$((left > 0 ? left : 1))" "$machine" "$topology" "$results/guest.cpio" \
            "$results/disk" "$lab_words" "${lines[@]}") </dev/null >>"$results/qemu" 2>&1 || return
    done
}

# Runs a case in namespaces.
lab_run_namespaces()
{
    local name=$1 results=$lab_results/$1
    lab_make_namespaces_tree "$results/tree" "$(<"$lab_source/cases/$name/topology")" \
        "$lab_source/cases/$name"
    (lab_start_namespaces "$(lab_case_deadline "$name")" "$results/tree" "$lab_words" \
        "$results/results.tar") </dev/null >>"$results/report" 2>&1
}

# lab_reboots REPORT: how often the case has asked for a reboot.
lab_reboots()
{
    { cat "$1" 2>/dev/null || true; } | grep -c '^lab-reboot' || true
}

lab_report_verdict()
{
    { sed -n 's/^lab-verdict: //p' "$1" 2>/dev/null || true; } | tr -d '\r' | tail -n 1
}

lab_why_no_verdict()
{
    if [[ $1 -eq 124 || $1 -eq 137 ]]; then
        echo "the guest hung; ended after $(lab_case_deadline "$2") s"
    else
        echo "the guest ended without a verdict (status $1)"
    fi
}

# A case's closing line: verdict, time and figures; for a failed one the tail of its output.
lab_print_case()
{
    local name=$1 results=$lab_results/$1 verdict figures=''
    verdict=$(<"$results/verdict")
    if [[ -s $results/figures ]]; then
        figures=$(awk -F '\t' '{ printf "%s%s %s %s", (NR > 1 ? ", " : ""), $1, $2, $3 }' \
            "$results/figures")
    fi
    printf '%-6s %-28s %4s s  %s\n' "${verdict%%:*}" "$name" "$(<"$results/seconds")" "$figures"
    if [[ $verdict == passed ]]; then
        return
    fi
    printf '       %s\n' "${verdict#failed: }"
    printf '       the end of its report (all of it, and more, is in %s):\n' "$results"
    tail -n 15 "$results/report" 2>/dev/null | sed 's/^/         | /'
    if ! grep -q '^lab-verdict' "$results/report" 2>/dev/null; then
        printf '       the end of its console:\n'
        tail -n 25 "$results/console" "$results/qemu" 2>/dev/null | sed 's/^/         | /'
    fi
}
