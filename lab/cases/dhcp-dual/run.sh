# shellcheck shell=bash disable=SC2154 # variables of the guest's other files

# What a program that resolves names reads.
resolver()
{
    grep -v '^#' /etc/resolv.conf
}

wait_two_leases()
{
    step "Two leases later"
    pause 250
    expect_renewed 3
    expect_equal "what resolves names" "$plain_resolver" "$(resolver)"
    expect_equal "what is left to do" "" "$(/etc/rc.network --dry-run start 2>&1)"
    topology_ready
}

expect_equal "what resolves names" "search lab.example
nameserver 10.10.0.53
nameserver fd10:0:0:a0::53" "$(resolver)"
plain_resolver="$(resolver)"
round_trip 100 wait_two_leases
expect_equal "what resolves names" "$plain_resolver" "$(resolver)"
expect_one_client
