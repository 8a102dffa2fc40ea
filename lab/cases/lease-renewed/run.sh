# shellcheck shell=bash disable=SC2154,SC2317 # variables of the guest's other files; called by name

lab_lease=120

phase_start()
{
    local asked4 asked6
    takeover_begin
    takeover_adopt
    takeover_register

    step "Three lease times"
    asked4="$(servers_asked DHCPREQUEST)"
    asked6="$(servers_asked DHCPRENEW DHCPREBIND)"
    sleep $((3 * lab_lease))
    expect_same_host "after three lease times"
    expect_no_new_client "after three lease times"
    figure "IPv4 renewals" "$(($(servers_asked DHCPREQUEST) - asked4))" ""
    figure "IPv6 renewals" "$(($(servers_asked DHCPRENEW DHCPREBIND) - asked6))" ""
    [ "$(servers_asked DHCPREQUEST)" -ge $((asked4 + 3)) ] || fail "the lease was not renewed"
    [ "$(servers_asked DHCPRENEW DHCPREBIND)" -ge $((asked6 + 3)) ] ||
        fail "the lease of IPv6 was not renewed"

    step "Unregister, and two more"
    expect_success vornovsctl unregister alpha
    sleep $((2 * lab_lease))
    expect_same_host "plain again"
    expect_no_new_client "plain again"
}
