# shellcheck shell=bash disable=SC2154 # variables of the guest's other files

lab_server=/usr/sbin/ovsdb-server

phase_start()
{
    boots_enable
    expect_success vornovsctl register alpha
    expect_answers

    systemctl stop vornovs-vswitch.service vornovs-db.service
    echo garbage >/etc/openvswitch/conf.db
    reboot_machine spoilt
}

phase_spoilt()
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
    expect_without_switch

    step "The server works again"
    mv "$lab_server.away" "$lab_server"
    expect_comes_to_switch 900
}
