# shellcheck shell=bash disable=SC2154 # variables of the guest's other files

expect_reachable()
{
    wait_until 30 in_outside fping -q -r 0 -t 200 10.10.0.2
    wait_until 30 in_outside fping -6 -q -r 0 -t 200 fd10:0:0:a0::2
    expect_success ip netns exec outside ip -brief address show | show
}

phase_start()
{
    expect_reachable
    echo kept >/root/note
    reboot_machine again
}

phase_again()
{
    expect_reachable
    expect_line /root/note kept
}
