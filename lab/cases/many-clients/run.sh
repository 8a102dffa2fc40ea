# shellcheck shell=bash disable=SC2154 # variables of the guest's other files

remember_plain
expect_success vornovsctl register alpha
for number in $(seq 50); do
    ip link add "vm$number" type dummy
done

# by_eight VERB: fifty calls, eight at a time.
by_eight()
{
    local client clients='' status=0
    for client in $(seq 8); do
        (
            set +eE
            failed=0
            for number in $(seq "$client" 8 50); do
                vornovsctl port "$1" ovs_eth0 "vm$number" >>"$lab_out/client-$client" 2>&1 || failed=1
            done
            exit "$failed"
        ) &
        clients="$clients $!"
    done
    for client in $clients; do
        wait "$client" || status=1
    done
    [ "$status" -eq 0 ] || fail "a client could not $1: $(cat "$lab_out"/client-*)"
}

attached()
{
    ovs-vsctl --timeout=10 list-ports ovs_eth0 | sed -n '/^vm/p' | sort
}

step "Attach"
timed "attaching 50 ports" by_eight attach
expect_equal "the ports" "$(seq 50 | sed 's/^/vm/' | sort)" "$(attached)"

step "Detach"
timed "detaching 50 ports" by_eight detach
expect_equal "the ports" "" "$(attached)"
expect_lock_free

step "Unregister"
for number in $(seq 50); do
    ip link delete "vm$number"
done
expect_success vornovsctl unregister alpha
expect_plain
