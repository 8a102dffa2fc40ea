# shellcheck shell=bash disable=SC2154 # variables of the guest's other files

ports=1000
group=7

expect_answering()
{
    local family address
    while read -r family address; do
        expect_success in_outside fping "-$family" -q -r 3 "$address"
    done <"$lab_out/addresses"
}

ports_on_bridge()
{
    ovs-vsctl --timeout=30 list-ports ovs_eth0 | sed -n '/^tap/p'
}

# Those that have a number of the switch's, as one has that it could open and use.
ports_in_use()
{
    ovs-vsctl --timeout=30 --bare --columns=name,ofport find Interface 'ofport>0' | sed -n '/^tap/p'
}

remember_plain

step "$ports ports come"
expect_success vornovsctl register home
for number in $(seq "$ports"); do
    echo "link add tap$number group $group type veth peer name card$number group $group"
done | ip -batch -
timed "attaching" /lab/clients/load attach ovs_eth0 tap "$ports"
expect_equal "the ports that are attached" "$ports" "$(ports_on_bridge | wc -l)"
expect_equal "the ports that the switch uses" "$ports" "$(ports_in_use | wc -l)"
expect_answering
expect_success vornovsctl check

step "They go"
timed "detaching" /lab/clients/load detach ovs_eth0 tap "$ports"
expect_equal "the ports that are left" "" "$(ports_on_bridge)"
expect_answering
figure "ports" "$ports" "attached and detached"

step "Come home"
expect_success ip link delete group "$group"
expect_success vornovsctl unregister home
expect_plain
expect_success vornovsctl check
