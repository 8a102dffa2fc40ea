# shellcheck shell=bash disable=SC2154 # variables of the guest's other files
# Clients that are killed on their way.

lab_steps="$lab_out/steps"

# killed_at STEP COMMAND...: runs a client that is killed right before a step of the library; step 0
# lets it run to its end and leaves the list of its steps in $lab_steps.
killed_at()
{
    local step="$1" status=0
    shift
    rm -f "$lab_steps"
    # The shell would tell of the kill on its own standard error.
    {
        KILL_AT="$step" KILL_LOG="$lab_steps" LD_PRELOAD=/lab/clients/libkillstep.so "$@" \
            >"$lab_out/client-output" 2>&1 || status=$?
    } 2>/dev/null
    if [ "$step" -eq 0 ]; then
        [ "$status" -eq 0 ] || fail "'$*' ended with $status: $(cat "$lab_out/client-output")"
    else
        expect_equal "the end of '$*' killed at step $step" 137 "$status"
    fi
}

# The number of steps of the command that was run last.
steps_taken()
{
    wc -l <"$lab_steps"
}

# The name of the step before which a client was killed.
step_name()
{
    tail -n 1 "$lab_steps" | sed -e 's/^[0-9]* //' -e 's/ .*//' -e 's/.*ExecHook.*/ExecHook/'
}

# What must hold as soon as nothing runs for a killed client any more.
expect_safe_after_kill()
{
    wait_until 30 client_is_gone
    expect_lock_free
    expect_whole_files
    sweep_leftovers
}

# A client that is killed between writing a temporary file and giving it the target's name leaves
# the temporary file. Nobody reads it; it is taken away so that the host compares with what it was.
sweep_leftovers()
{
    local file
    while read -r file; do
        note "left behind: $file"
        rm -f "$file"
    done < <(find /etc/sysconfig /usr/vorn/etc -name '.vornovs-??????' -o -name 'ovs_*.conf.new*')
}

# No file is half written: each configuration file has its DEVICE, which is its own name.
expect_whole_files()
{
    local file
    for file in "$lab_ifcfg"*; do
        grep -q '^DEVICE=' "$file" || fail "$file has no DEVICE: $(cat "$file")"
    done
}

# Puts a gate before /etc/rc.network: it waits while /run/lab/gate-VERB is there, and leaves
# /run/lab/reached-VERB once it is reached.
build_gate()
{
    mv /etc/rc.network /etc/rc.network.behind
    cat >/etc/rc.network <<'GATE'
#!/bin/sh
: >"/run/lab/reached-$1"
while [ -e "/run/lab/gate-$1" ]; do
    sleep 0.02
done
exec /etc/rc.network.behind "$@"
GATE
    chmod 755 /etc/rc.network
}

remove_gate()
{
    mv /etc/rc.network.behind /etc/rc.network
    rm -f "$lab_out"/gate-* "$lab_out"/reached-*
}

# killed_during VERB COMMAND...: runs a client and kills it while rc.network works on the verb.
killed_during()
{
    local verb="$1" client
    shift
    build_gate
    : >"$lab_out/gate-$verb"
    "$@" >"$lab_out/client-output" 2>&1 &
    client=$!
    wait_until 60 test -e "$lab_out/reached-$verb"
    kill -KILL "$client"
    wait "$client" 2>/dev/null || true # its status is that it was killed
    if lock_is_free; then
        fail "the lock is free while rc.network still works for a killed client"
    fi
    rm "$lab_out/gate-$verb"
    wait_until 30 client_is_gone
    remove_gate
}

# killed_with_all_after SECONDS COMMAND...: runs a client and kills it so long after its beginning,
# and with it every program that works for it; not what waits in the background for its end.
killed_with_all_after()
{
    local seconds="$1" client pid
    shift
    "$@" >"$lab_out/client-output" 2>&1 &
    client=$!
    pause "$seconds"
    for pid in "$client" $(processes_named vornrun rc.network); do
        if ! works_in_background "$pid"; then
            kill -KILL "$pid" 2>/dev/null || true # it may have ended by now
        fi
    done
    { wait "$client" || true; } 2>/dev/null # its status is that it was killed, which the shell tells
}

# True for a process of the network program that goes on by itself.
works_in_background()
{
    network_program_does "$1" 'announce|holder|retry'
}

# network_program_does PID VERBS: true for one that was started with one of these verbs, "ONE|OTHER".
network_program_does()
{
    tr '\0' ' ' <"/proc/$1/cmdline" 2>/dev/null | grep -Eq "^[^ ]*rc\.network ($2) "
}
