# shellcheck shell=bash disable=SC2154,SC2034 # variables of the guest's other files
# The demonstration: the main job, told as it goes. Runs in the guest.

client=demo-service
# The library clears a VLAN's tag on the live switch before it has the network held; until then the
# VLAN is dark.
limit=250

heading()
{
    printf '\n== %s\n' "$*"
}

# The host's network as somebody would look at it.
tell_host()
{
    echo "interfaces and addresses:"
    ip -brief address show | grep -v '^lo ' | sed -E 's/^([^ ]*)@[^ ]*/\1    /; s/^/    /' | sort
    echo "routes:"
    { ip -4 route show; ip -6 route show | grep -v '^fe80'; } | sed 's/^/    /'
    echo "bridges:"
    if process_named ovsdb-server && [ -n "$(ovs-vsctl --timeout=10 list-br)" ]; then
        ovs-vsctl --timeout=10 list-br | sed 's/^/    /'
    else
        echo "    none"
    fi
    echo "configuration files:"
    stat -c '    %A %U %s bytes  %n' /etc/sysconfig/network-scripts/*
}

since_begin()
{
    awk -v begin="$begin" -v now="$EPOCHREALTIME" 'BEGIN { printf "%7.3f s", now - begin }'
}

# every KINDS COMMAND...: the command holds for each interface of these kinds.
every()
{
    local kinds="$1" interface
    shift
    # shellcheck disable=SC2086 # words
    for interface in $(host_of_kind $kinds); do
        "$@" "$interface" || return 1
    done
}

link_there() { [ -e "/sys/class/net/$1" ]; }
link_gone() { [ ! -e "/sys/class/net/$1" ]; }
bridge_file_written() { [ -e "${lab_ifcfg}ovs_$1" ]; }
bridge_file_gone() { [ ! -e "${lab_ifcfg}ovs_$1" ]; }
bridge_made() { link_there "ovs_$1"; }
bridge_gone() { link_gone "ovs_$1"; }
tag_written() { grep -q "^OVS_VLAN_ID=${1##*.}\$" "${lab_ifcfg}ovs_${1%.*}" 2>/dev/null; }
tag_gone() { ! tag_written "$1"; }
tag_in_use() { tag_written "$1" && bridge_made "${1%.*}"; }
somebody_registered() { [ -s "$lab_state/ovs_reg.conf" ]; }
nobody_registered() { [ ! -s "$lab_state/ovs_reg.conf" ]; }
switch_runs() { [ -e /run/openvswitch/ovs-vswitchd.pid ]; }

# tell_stage TEXT CONDITION...: prints the text once, when the condition first holds; the probes
# count from there on as another phase.
tell_stage()
{
    local text="$1"
    shift
    if [[ $told != *"|$text|"* ]] && "$@"; then
        told="$told|$text|"
        probes_next_phase
        echo "$text" >>"$lab_out/stages"
        printf '    %s  %s\n' "$(since_begin)" "$text"
    fi
}

# run_and_tell COMMAND...: runs a client and prints the stages as they are reached.
run_and_tell()
{
    local pid status=0 stages="$1"
    shift
    told='|'
    echo "the client is started" >"$lab_out/stages"
    echo "\$ $*"
    probes_next_phase
    begin="$EPOCHREALTIME"
    "$@" >"$lab_out/client-output" 2>&1 &
    pid=$!
    while process_runs "$pid"; do
        "$stages"
        pause 0.01
    done
    wait "$pid" || status=$?
    "$stages"
    tell_stage "the client is done" true
    sed 's/^/    /' "$lab_out/client-output"
    [ "$status" -eq 0 ] || fail "'$*' ended with $status"
}

stages_of_registration()
{
    tell_stage "the client's name is recorded" somebody_registered
    tell_stage "the Linux VLAN is removed" every vlan link_gone
    tell_stage "the Linux bond is taken apart" every bond link_gone
    tell_stage "the switch's daemons run" switch_runs
    tell_stage "the VLAN is the tag of its bridge" every vlan tag_in_use
    tell_stage "each port has its bridge" every slave bridge_made
    tell_stage "the bond is one of the switch" every "port bond" bridge_made
}

stages_of_withdrawal()
{
    tell_stage "nobody is registered any more" nobody_registered
    tell_stage "the tag is taken off" every vlan tag_gone
    tell_stage "the switch's bond is taken apart" every bond bridge_gone
    tell_stage "every bridge's configuration file is folded back into its port's" \
        every "port bond" bridge_file_gone
    tell_stage "every bridge is gone" every "port bond" bridge_gone
    tell_stage "the Linux bond is back" every bond link_there
    tell_stage "the Linux VLAN is back" every vlan link_there
}

# What the probes saw before, during and after the client's run, and the longest gap of each stage.
tell_traffic()
{
    printf '    %-40s %13s %13s %13s  %s\n' "echo every 5 ms, answered" before during after \
        "longest without an answer"
    awk -F '\t' '{
        split($2, ends, "@")
        if ($1 == "out") {
            what = "host to " ends[1]
        } else if (2 in ends) {
            what = ends[2] " to " ends[1]
        } else {
            what = "second host to " ends[1]
        }
        answered = sent = 0
        for (i = 8; i < NF - 2; i += 3) {
            answered += $i
            sent += $(i + 1)
        }
        printf "    %-40s %13s %13s %13s  %s ms\n", what, $5 " of " $6, answered " of " sent,
            $(NF - 2) " of " $(NF - 1), $3
    }' "$lab_out/probes"
    echo "    the longest gap that began after each stage, of any address:"
    awk -F '\t' 'NR == FNR { stage[NR] = $0; stages = NR; next }
        { for (i = 1; i <= stages; i++) {
              gap = $(7 + 3 * i)
              if (gap > worst[i]) worst[i] = gap
          } }
        END { for (i = 1; i <= stages; i++) printf "    %10.1f ms  %s\n", worst[i], stage[i] }' \
        "$lab_out/stages" "$lab_out/probes"
}

# worst NAME: the longer of the outages of both directions.
worst()
{
    awk -F '\t' -v name="$1" '$1 == name " in" || $1 == name " out" {
        if ($2 > worst) worst = $2 } END { printf "%.1f", worst }' "$lab_out/figures"
}

# Says of each subject of the comparison whether it is the same.
tell_comparison()
{
    local subject lines
    for subject in links addresses routes groups sysctls bonds switch file-modes; do
        lines="$(wc -l <"$lab_out/snapshots/plain/$subject")"
        if diff -q "$lab_out/snapshots/plain/$subject" "$lab_out/snapshots/home/$subject" \
            >/dev/null; then
            printf '    %-12s %5d lines, the same\n' "$subject" "$lines"
        else
            printf '    %-12s DIFFERENT\n' "$subject"
        fi
    done
    (cd "$lab_out/snapshots/plain/files" && find . -type f | sed 's|^\.||' | sort) |
        while read -r file; do
            if cmp -s "$lab_out/snapshots/plain/files$file" "$lab_out/snapshots/home/files$file"; then
                printf '    %s: the same, byte for byte\n' "$file"
            else
                printf '    %s: DIFFERENT\n' "$file"
            fi
        done
}

heading "The host before"
tell_host
remember_plain

heading "A client registers"
probes_start
sleep 1
run_and_tell stages_of_registration vornovsctl register "$client"
expect_registered "$client"
probes_finish Register "$limit" >/dev/null

heading "Traffic on the way to the switch"
tell_traffic

heading "The host on the switch"
tell_host
echo "the switch:"
ovs-vsctl --timeout=10 show | sed 's/^/    /'
expect_on_switch
echo "Every bridge has the addresses, hardware address, MTU and gateway of what it stands for; the bond"
echo "is one of the switch in the mode that stands for its own, and the VLAN is its bridge's tag."

heading "The client unregisters"
probes_start
sleep 1
run_and_tell stages_of_withdrawal vornovsctl unregister "$client"
expect_registered
probes_finish UnRegister "$limit" >/dev/null

heading "Traffic on the way back"
tell_traffic

heading "Before and after"
snapshot home
tell_comparison
expect_unchanged plain home

printf '\nProved: a port, a bond and a VLAN went on to the switch and came back, the host answered throughout (longest gap %s ms there, %s ms back), and everything is what it was.\n' \
    "$(worst Register)" "$(worst UnRegister)"
