# shellcheck shell=bash disable=SC2154,SC2317 # variables of the guest's other files; called by name

has_temporary_address()
{
    [ -n "$(ip -6 -oneline address show dev "$1" temporary scope global)" ]
}

takeover_also()
{
    local device
    device="$(bearer eth0)"
    expect_equal "temporary addresses of $device" 2 "$(cat "/proc/sys/net/ipv6/conf/$device/use_tempaddr")"
    wait_until 30 has_temporary_address "$device"
}

takeover_phases
