# shellcheck shell=bash disable=SC2154 # variables of the guest's other files
# What a case says: steps, figures, and failures with their reason.

# True on the machine with systemd.
machine_has_systemd()
{
    [ -d /lab/machine ]
}

# True in namespaces of another machine's kernel, whose clock goes on while programs wait.
machine_shares_kernel()
{
    [ -d /lab/namespaces ]
}

# True where a disk keeps what a case left before a reboot.
machine_has_disk()
{
    machine_has_systemd || [ -e /lab/case/disk ]
}

# sampled EVERY ALL: prints the first unless everything is asked for, which is the second.
sampled()
{
    if grep -qw lab.daily /proc/cmdline; then
        echo "$1"
    else
        echo "$2"
    fi
}

# points FEW MANY: prints how many points to spread: as many as were asked for, FEW in a sample.
points()
{
    local asked
    asked="$(sed -n 's/.* lab\.points=\([0-9]*\).*/\1/p' /proc/cmdline)"
    echo "${asked:-$(sampled "$1" "$2")}"
}

# On the disk where there is one: what a case left before a reboot is there after it.
lab_out=/run/lab
if machine_has_disk; then
    lab_out=/lab/out
fi

# All that programs said to the system's log, of all boots.
system_log()
{
    if machine_has_systemd; then
        journalctl --quiet --no-pager --output=short-monotonic
    else
        cat /var/log/messages
    fi
}

# Guest time in seconds since boot, with hundredths: the clock that counts instructions.
guest_time()
{
    cut -d ' ' -f 1 /proc/uptime
}

# Announces a step of the case.
step()
{
    printf '[%8s] %s\n' "$(guest_time)" "$*"
}

# A line of detail under a step.
note()
{
    printf '             %s\n' "$*"
}

# Prints standard input as detail.
show()
{
    sed 's/^/             /'
}

# Records a measured value: figure NAME VALUE UNIT.
figure()
{
    printf '%s\t%s\t%s\n' "$1" "$2" "$3" >>"$lab_out/figures"
    note "$1: $2 $3"
}

# Ends the case: what did not hold.
fail()
{
    printf 'FAILED: %s\n' "$*"
    printf '%s\n' "$*" >>"$lab_out/failure"
    exit 1
}

# Tells which command ended the case's script: status, file, line, command.
report_ended_at()
{
    if [ ! -e "$lab_out/failure" ]; then
        echo "${2##*/} line $3: '$4' ended with $1" >>"$lab_out/failure"
    fi
}

# The case's last line, which the host reads.
report_verdict()
{
    if [ "$1" -eq 0 ] && [ ! -e "$lab_out/failure" ]; then
        printf 'lab-verdict: passed\n'
    else
        if [ ! -e "$lab_out/failure" ]; then
            echo "the case's script ended with status $1" >"$lab_out/failure"
        fi
        printf 'lab-verdict: failed: %s\n' "$(head -n 1 "$lab_out/failure")"
    fi
}

# expect_equal WHAT WANTED GOT
expect_equal()
{
    [ "$2" = "$3" ] || fail "$1: wanted '$2', got '$3'"
}

# expect_status WANTED COMMAND...: runs a command and holds its exit status against the one wanted.
expect_status()
{
    local wanted="$1" status=0
    shift
    "$@" || status=$?
    [ "$status" -eq "$wanted" ] || fail "'$*' ended with $status, not $wanted"
}

# expect_success COMMAND...
expect_success()
{
    "$@" || fail "'$*' ended with $?"
}

# expect_failure COMMAND...
expect_failure()
{
    if "$@"; then
        fail "'$*' succeeded"
    fi
}

# expect_at_most WHAT VALUE LIMIT, decimals allowed
expect_at_most()
{
    awk -v value="$2" -v limit="$3" 'BEGIN { exit !(value + 0 <= limit + 0) }' ||
        fail "$1: $2 is more than $3"
}

# expect_logged PATTERN: a line of the system log matches.
expect_logged()
{
    system_log | grep -E -- "$1" >/dev/null || fail "the system log has no line '$1'"
}

expect_not_logged()
{
    if system_log | grep -E -- "$1"; then
        fail "the system log has a line '$1'"
    fi
}

# expect_line FILE LINE: the file holds exactly this line.
expect_line()
{
    grep -Fqx -- "$2" "$1" || fail "$1 has no line '$2'"
}

expect_no_line()
{
    if grep -Fqx -- "$2" "$1"; then
        fail "$1 has a line '$2'"
    fi
}
