# What the scripts of the two switch services share. To be sourced; the script sets
#   service   its own name
#   daemon    the daemon's process name, which is also the name of its files
#
# Needs nothing but a POSIX shell and the usual small tools, of busybox too.
# shellcheck disable=SC2154 # service and daemon are the script's

PATH=/usr/sbin:/usr/bin:/sbin:/bin
LC_ALL=C
export PATH LC_ALL

run_folder=/var/run/openvswitch
log_folder=/var/log/openvswitch
database_socket=$run_folder/db.sock
pid_file=$run_folder/$daemon.pid

# How long a daemon may take to start, and to leave once asked to, in seconds.
start_limit=60
stop_limit=5

report()
{
    echo "$service: $*" >&2
    logger -t "$service" -p daemon.err -- "$*" 2>/dev/null || :
}

# make_folder MODE PATH: leaves a folder that exists as it is.
make_folder()
{
    if [ ! -d "$2" ]; then
        mkdir -p "$2"
        chmod "$1" "$2"
    fi
}

pause()
{
    sleep 0.1 2>/dev/null || sleep 1
}

read_uptime()
{
    read -r uptime rest </proc/uptime
    : "$rest"
    uptime=${uptime%%.*}
}

# wait_until SECONDS COMMAND...: waits until the command succeeds; fails when it has not by then.
wait_until()
{
    read_uptime
    limit=$((uptime + $1))
    shift
    until "$@"; do
        read_uptime
        [ "$uptime" -lt "$limit" ] || return 1
        pause
    done
}

# The number in the pid file is only the daemon's while the process of that number is the daemon.
is_running()
{
    pid=
    [ -r "$pid_file" ] || return 1
    read -r pid <"$pid_file" || [ -n "$pid" ] || return 1
    case $pid in
    '' | *[!0-9]*) return 1 ;;
    esac
    process_is_daemon "$pid"
}

# A process that has ended but is not yet collected by its parent has no program any more.
process_is_daemon()
{
    comm=
    [ -e "/proc/$1/exe" ] || return 1
    { read -r comm <"/proc/$1/comm"; } 2>/dev/null || return 1
    [ "$comm" = "$daemon" ]
}

has_stopped()
{
    ! process_is_daemon "$1"
}

database_answers()
{
    [ -S "$database_socket" ] && ovs-vsctl --no-wait --timeout=5 list-br >/dev/null 2>&1
}

# One script at a time works on a daemon's files; the other one finds what the first one has done.
take_turn()
{
    make_folder 0700 /run/vornovs
    exec 9>"/run/vornovs/$service.lock"
    if ! wait_until "$start_limit" flock -n 9; then
        report "another run of this script does not end"
        return 1
    fi
}

# A daemon that was killed leaves its pid file and its sockets.
remove_leavings()
{
    rm -f "$pid_file" "$run_folder/$daemon".*.ctl
}

# run_clean COMMAND...: runs it with the standard descriptors only. The daemons stay, and must not
# keep a lock or a pipe of the caller's open. Not every sh can name a descriptor above 9; bash can.
run_clean()
{
    shell=$(command -v bash || command -v sh)
    # shellcheck disable=SC2016 # expanded by the shell that it is written for
    "$shell" -c '
        for descriptor in /proc/self/fd/*; do
            descriptor=${descriptor##*/}
            if [ "$descriptor" -gt 2 ]; then
                eval "exec $descriptor>&-"
            fi
        done
        exec "$@"' run_clean "$@" </dev/null
}

# start_daemon COMMAND...: the daemon leaves our session by itself, is restarted when it crashes, by
# itself or by systemd, and its first process returns once it is ready.
start_daemon()
{
    make_folder 0755 "$run_folder"
    make_folder 0750 "$log_folder"
    monitor=--monitor
    if [ "${VORNOVS_SCRIPT-}" = unit ]; then
        monitor=
    fi
    # shellcheck disable=SC2086 # one word or none
    run_clean timeout "$start_limit" "$@" \
        -vconsole:emer -vsyslog:err -vfile:info \
        --log-file="$log_folder/$daemon.log" --pidfile="$pid_file" --detach $monitor
}

stop()
{
    if ! is_running; then
        remove_leavings
        return 0
    fi
    stopping=$pid

    ovs-appctl --timeout=2 -t "$run_folder/$daemon.$stopping.ctl" exit >/dev/null 2>&1 || :
    for signal in TERM KILL FAIL; do
        if wait_until "$stop_limit" has_stopped "$stopping"; then
            remove_leavings
            return 0
        fi
        report "$daemon (process $stopping) does not stop"
        [ "$signal" = FAIL ] || kill -s "$signal" "$stopping" 2>/dev/null || :
    done
    return 1
}

status()
{
    if is_running; then
        echo "$service: $daemon runs (process $pid)"
        return 0
    fi
    if [ -e "$pid_file" ]; then
        echo "$service: $daemon is dead and has left $pid_file"
        return 1
    fi
    echo "$service: $daemon does not run"
    return 3
}

# Where systemd runs, it is asked: the daemon shall be in its unit and not in the caller's session.
# VORNOVS_SCRIPT: "unit" when the unit calls, "alone" when systemd is not to be asked.
belongs_to_systemd()
{
    [ -z "${VORNOVS_SCRIPT-}" ] && [ -d /run/systemd/system ] &&
        [ -e "/usr/lib/systemd/system/$service.service" ]
}

# perform VERB: the script's start() and these functions under the usual verbs.
perform()
{
    case $1 in
    start | restart | force-reload)
        if belongs_to_systemd; then
            exec systemctl "$1" "$service.service"
        fi
        ;;
    stop)
        # Then by ourselves, too: the daemon may be another's.
        if belongs_to_systemd; then
            systemctl stop "$service.service"
        fi
        ;;
    esac

    case $1 in
    start)
        take_turn
        start
        ;;
    stop)
        take_turn
        stop
        ;;
    restart | force-reload)
        take_turn
        stop
        start
        ;;
    status)
        status
        ;;
    *)
        echo "Usage: /etc/init.d/$service start|stop|restart|force-reload|status" >&2
        return 2
        ;;
    esac
}
