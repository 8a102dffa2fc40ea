# shellcheck shell=bash disable=SC2154 # variables of the guest's other files

lab_daemon=/usr/lib/openvswitch-switch/ovs-vswitchd
lab_server=/usr/sbin/ovsdb-server

is_on_switch()
{
    [ -n "$(addresses_of ovs_eth0)" ] && [ -z "$(addresses_of eth0)" ]
}

expect_on_plain_interface()
{
    expect_answers
    expect_equal "the addresses of eth0" "$(printf '10.10.0.2/24\nfd10:0:0:a0::2/64')" \
        "$(addresses_of eth0)"
    expect_success logged 'eth0 stay on the plain interface'
    expect_active network-online.target vornovs-network-retry.service
}

expect_comes_to_switch()
{
    wait_until "$1" is_on_switch
    expect_answers
    wait_until 30 unit_is vornovs-network-retry.service inactive
}

phase_start()
{
    boots_install
    expect_success vornovsctl register alpha
    expect_answers
    mv "$lab_daemon" "$lab_daemon.away"
    reboot_machine without_daemon
}

phase_without_daemon()
{
    expect_on_plain_interface

    step "The daemon works again"
    mv "$lab_daemon.away" "$lab_daemon"
    expect_success systemctl start vornovs-vswitch.service
    expect_comes_to_switch 20

    step "A database that cannot be read"
    systemctl stop vornovs-vswitch.service vornovs-db.service
    echo garbage >/etc/openvswitch/conf.db
    reboot_machine without_database
}

phase_without_database()
{
    expect_answers
    expect_success is_on_switch
    expect_line /etc/openvswitch/conf.db.unreadable garbage

    mv "$lab_server" "$lab_server.away"
    printf '#!/bin/sh\nexec sleep 100000\n' >"$lab_server"
    chmod 755 "$lab_server"
    reboot_machine hung
}

phase_hung()
{
    expect_on_plain_interface

    step "The server works again"
    mv "$lab_server.away" "$lab_server"
    expect_comes_to_switch 900
}
