# shellcheck shell=bash disable=SC2154 # variables of the guest's other files

wait_two_leases()
{
    step "Two leases later"
    pause 250
    expect_renewed 3
    expect_equal "what is left to do" "" "$(/etc/rc.network --dry-run start 2>&1)"
    in_outside fping -q -t 200 "$(servers_gave | awk '$1 == 4 { print $2 }')"
}

round_trip 100 wait_two_leases
expect_one_client
