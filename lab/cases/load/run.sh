# shellcheck shell=bash disable=SC2154,SC2034 # variables of the guest's other files

clients=16
hook=/usr/vorn/etc/hooks/net/ovs_change/50-witness

# Each client has a name of its own in the system log, which is the program's.
start_clients()
{
    local number
    for number in $(seq "$clients"); do
        ln -s load "/lab/clients/load-$number"
        ip link add "vm$number" type dummy
        "/lab/clients/load-$number" client "client-$number" "vm$number" "$1" "$number" \
            >"$lab_out/load-$number" 2>&1 &
        echo "$!"
    done
}

# A call that failed has its line: no client has fewer of them than failures.
expect_explained()
{
    local number failed lines
    for number in $(seq "$clients"); do
        failed="$(awk '{ print $(NF - 1) }' "$lab_out/load-$number")"
        # Counting no line is a failure to grep.
        lines="$(system_log | grep -c " load-$number: .*cpp:" || [ $? -eq 1 ])"
        [ "$lines" -ge "$failed" ] ||
            fail "client $number failed $failed times and the system log has $lines lines of it"
    done
}

# The witness saw each conversion end before another began.
expect_one_at_a_time()
{
    awk '
        $1 == 4 { if (inside) exit 1; inside = 1 }
        $1 == 5 { if (!inside) exit 1; inside = 0 }
        END { exit inside }' "$lab_out/witness" || fail "two conversions at a time"
}

remember_plain
mkdir -p "${hook%/*}"
cat >"$hook" <<END
#!/bin/sh
echo "\$HOOK_ACTION \$ACTION" >>$lab_out/witness
END
chmod 755 "$hook"

step "$clients clients"
status=0
for pid in $(start_clients "$(sampled 10 60)"); do
    while process_runs "$pid"; do
        pause 0.5
    done
done
cat "$lab_out"/load-* | show
expect_equal "the clients that came to their end" "$clients" \
    "$(grep -Ec '^client-[0-9]+ (registered|withdrawn) ' "$lab_out"/load-* | awk -F : '{ n += $2 } END { print n }')"
# shellcheck disable=SC2046 # names, one a word
expect_registered $(awk '$2 == "registered" { print $1 }' "$lab_out"/load-*)
expect_explained
expect_one_at_a_time
expect_lock_free
figure "clients" "$clients" "at once"
figure "their calls" "$(cat "$lab_out"/load-* | awk '{ n += $3 } END { print n }')" times
figure "conversions" "$(grep -c '^4 ' "$lab_out/witness")" "one at a time"

step "Come home"
rm "$hook"
# Whoever takes a device away takes it off the switch first: a bridge stays as long as others have
# ports on it.
for number in $(seq "$clients"); do
    printf ' -- --if-exists del-port vm%s' "$number"
done | xargs ovs-vsctl --timeout=30
for number in $(seq "$clients"); do
    echo "link del vm$number"
done | ip -batch -
while read -r name; do
    expect_success vornovsctl unregister "$name"
done < <(cat "$lab_state/ovs_reg.conf")
expect_plain
expect_success vornovsctl check
