# shellcheck shell=bash disable=SC2154 # variables of the guest's other files
# Waiting for conditions. Deadlines are of the guest's clock; an idle guest costs no real time.

# A descriptor on which nothing ever comes.
exec {lab_silence}<> <(:)

# pause SECONDS: sleeps without starting a process, by a read that always fails for want of input.
pause()
{
    read -r -t "$1" -u "$lab_silence" || true
}

# Sets $ticks to the hundredths of a second since boot. Starts no process: it is called in loops.
guest_ticks()
{
    local seconds hundredths
    IFS='. ' read -r seconds hundredths _ </proc/uptime
    ticks=$((seconds * 100 + ${hundredths#0}))
}

# wait_until SECONDS COMMAND...: tries a command every 20 ms until it succeeds, every 200 ms once a
# second has passed and once a second after five; fails the case when it has not within the given
# seconds. Waiting costs nothing here, looking does.
wait_until()
{
    local seconds="$1" ticks began deadline
    shift
    guest_ticks
    began="$ticks"
    deadline=$((ticks + seconds * 100))
    while ! "$@" >/dev/null 2>&1; do
        guest_ticks
        if [ "$ticks" -ge "$deadline" ]; then
            fail "after $seconds s still not so: $*"
        fi
        if [ "$((ticks - began))" -lt 100 ]; then
            pause 0.02
        elif [ "$((ticks - began))" -lt 500 ]; then
            pause 0.2
        else
            pause 1
        fi
    done
}

# True once the guest has been up for so many seconds.
uptime_reached()
{
    local ticks
    guest_ticks
    [ "$ticks" -ge "$(($1 * 100))" ]
}

# True when a process of that pid is there and not a zombie.
process_runs()
{
    local state
    [ -r "/proc/$1/stat" ] || return 1
    read -r state <"/proc/$1/stat" || return 1
    state="${state##*) }"
    [ "${state%% *}" != Z ]
}

process_ended()
{
    ! process_runs "$1"
}

# Pids of the processes with one of these program names, one a line: the kernel's name for it, which
# is cut to 15 bytes, or the one that it was called by.
processes_named()
{
    local folder name called wanted=" $* "
    for folder in /proc/[0-9]*; do
        { read -r name <"$folder/comm"; } 2>/dev/null || continue
        called=''
        # Fails for a process that has ended by now and for a kernel thread, which has no such line.
        { read -r -d '' called <"$folder/cmdline"; } 2>/dev/null || true
        if [[ $wanted == *" $name "* || $wanted == *" ${called##*/} "* ]]; then
            echo "${folder#/proc/}"
        fi
    done
}

process_named()
{
    [ -n "$(processes_named "$@")" ]
}

no_process_named()
{
    [ -z "$(processes_named "$@")" ]
}

file_has()
{
    grep -Eq -- "$2" "$1"
}
