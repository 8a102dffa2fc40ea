# shellcheck shell=bash disable=SC2154 # variables of the guest's other files

# What a program that resolves names reads.
resolver()
{
    grep -v '^#' /etc/resolv.conf
}

# The settings of the card, as many as the device tells.
card()
{
    ethtool -k eth0 | sed 's/\[.*//'
    ethtool eth0
    cat /sys/class/net/eth0/address /sys/class/net/eth0/mtu
}

# The card and what resolves names are as they were before.
expect_same_host()
{
    card >"$lab_out/card"
    expect_same_text "the settings of the card" "$lab_out/plain-card" "$lab_out/card"
    expect_equal "what resolves names" "$plain_resolver" "$(resolver)"
    expect_equal "what is left to do" "" "$(/etc/rc.network --dry-run start 2>&1)"
}

wait_two_leases()
{
    expect_same_host
    step "Two leases later"
    pause 250
    expect_renewed 3
    expect_same_host
    in_outside fping -q -t 200 "$(servers_gave | awk '$1 == 4 { print $2 }')"
}

card >"$lab_out/plain-card"
expect_line "$lab_out/plain-card" "tcp-segmentation-offload: off"
plain_resolver="$(resolver)"
expect_equal "what resolves names" "search home.example lab.example example
nameserver 10.10.0.9
nameserver 10.10.0.53" "$plain_resolver"
round_trip 100 wait_two_leases
expect_same_host
expect_one_client
