# shellcheck shell=bash disable=SC2154 # variables of the guest's other files

lab_packages=/lab/packages/vornovs
lab_unit_link=/etc/systemd/system/multi-user.target.wants/vornovs-network.service

# Everything on the disk, with mode, owner and size; without what logs, caches and clocks change.
host_files()
{
    find / -xdev \( -path /lab -o -path /var/log -o -path /var/cache -o -path /var/lib/dpkg \
        -o -path /var/lib/apt -o -path /var/lib/systemd -o -path /var/backups -o -path /root \
        -o -path /tmp -o -path /var/tmp -o -name __pycache__ \) -prune -o -printf '%M %u:%g %y %p %l\n' |
        grep -v -e ' /etc/ld.so.cache' -e ' /etc/apt/sources.list.d/vornovs.list' \
            -e ' /etc/openvswitch' -e ' /var/lib/openvswitch' -e ' /etc/\.resolv' | sort
}

# Units that run or start with the machine, of whatever package.
host_units()
{
    {
        systemctl list-units --no-legend --no-pager --plain --state=active --type=service |
            awk '{ print "active", $1 }'
        systemctl list-unit-files --no-legend --no-pager | awk '{ print "file", $1, $2 }'
    } | grep -v -e ' lab-' -e ' systemd-.*\.service$' -e ' ovs' -e ' openvswitch' | sort
}

# expect_same_units WHEN: none but ours have come, and none have gone.
expect_same_units()
{
    host_units | grep -v ' vornovs' >"$lab_out/got-units"
    expect_same_text "$1: the units" "$lab_out/units-before" "$lab_out/got-units"
}

expect_no_unit_of_ours()
{
    local units
    units="$(systemctl list-units --all --no-legend --no-pager --plain 'vornovs*')"
    expect_equal "units of ours that are loaded" "" "$units"
    units="$(find /etc/systemd /etc/rc?.d -name '*vornovs*' ! -name 'K*')"
    expect_equal "links that start something of ours" "" "$units"
}

# The same packages as a later version.
make_later_version()
{
    local package folder
    rm -rf /lab/packages/later
    mkdir -p /lab/packages/later
    for package in "$lab_packages"/*.deb; do
        folder=/lab/packages/later/unpacked
        dpkg-deb -R "$package" "$folder"
        sed -i -E -e 's/^Version: (.*)/Version: \1+later1/' \
            -e 's/(vornovs[a-z0-9-]*) \(= ([^)]*)\)/\1 (= \2+later1)/g' "$folder/DEBIAN/control"
        echo "# of the later version" >>"$folder/usr/share/doc/$(dpkg-deb -f "$package" Package)/copyright"
        dpkg-deb -Znone -b "$folder" "/lab/packages/later/$(basename "$package")" >/dev/null
        rm -r "$folder"
    done
}

# The commands of README's section about one's own machine, one a line.
readme_commands()
{
    sed -n '/^## Install it on your own machine/,/^## /p' /lab/README.md |
        awk '/^```/ { inside = !inside; next } inside && NF { sub(/ *#.*/, ""); print }'
}

# README's reader is not root, and apt asks for a consent.
sudo()
{
    case $1 in
        apt-get) packages_apt "${@:2}" ;;
        *) "$@" ;;
    esac
}

# readme_command PATTERN: runs the commands of README that match, as they stand there, in a folder
# where scripts/package has been run.
readme_command()
{
    local command commands
    commands="$(readme_commands | grep -E -- "$1")" || fail "README has no command '$1'"
    while read -r command; do
        step "README: $command"
        eval "expect_success $command" >"$lab_out/output"
        show <"$lab_out/output"
    done <<<"$commands"
}

# What must not end with an upgrade.
daemons()
{
    for name in ovsdb-server ovs-vswitchd; do
        echo "$name $(pidof "$name")"
    done
}

phase_start()
{
    wait_until 90 host_answers
    mkdir -p /lab/readme/build
    ln -s "$lab_packages" /lab/readme/build/packages
    cd /lab/readme || exit 1
    expect_success packages_apt update

    install_as_readme_says
    adopt_as_readme_says
    reboot_machine adopt_again
}

install_as_readme_says()
{
    host_files >"$lab_out/files-fresh"
    expect_equal "README's first command" scripts/package "$(readme_commands | head -n 1)"
    snapshot_network before
    resolver_settings >"$lab_out/resolver-before"
    readme_command apt-get
    snapshot_network installed
    expect_unchanged before installed
    resolver_settings >"$lab_out/resolver-installed"
    expect_same_text "the name servers" "$lab_out/resolver-before" "$lab_out/resolver-installed"
    expect_no_unit_of_ours
    expect_equal "interfaces' files" "" "$(ls -A /etc/sysconfig/network-scripts)"
    remember_files_of_others
    host_units | grep -v ' vornovs' >"$lab_out/units-before"
    remember_managed
}

# What the host is to be again when ours are purged: what was there, and what Debian's packages, which
# came along, have brought.
remember_files_of_others()
{
    dpkg-query -L libvornovs1 vornovs-host vornovs-tools >"$lab_out/files-ours"
    host_files | awk -v ours="$lab_out/files-ours" -v fresh="$lab_out/files-fresh" '
        BEGIN {
            while ((getline name < ours) > 0) is_ours[name] = 1
            while ((getline < fresh) > 0) was_there[$4] = 1
        }
        (!($4 in is_ours) || $4 in was_there) && $4 !~ "^/etc/rc.[.]d/.*vornovs"' \
        >"$lab_out/files-before"
}

adopt_as_readme_says()
{
    readme_command 'adopt --dry-run'
    expect_nothing_done
    readme_command 'vornovsctl adopt$'
    expect_same_host "adopted as README says"
    readme_command 'vornovsctl register'
    expect_ports_on_switch
    expect_same_host "on the switch as README says"
    readme_command 'vornovsctl unregister'
    expect_no_switch_devices
    expect_same_host "plain as README says"
    readme_command 'vornovsctl release'
    expect_same_host "released as README says"
    expect_given_back released
    expect_equal "commands of README" 7 "$(readme_commands | wc -l)"
}

phase_adopt_again()
{
    step "Adopt and register"
    expect_success vornovsctl adopt
    expect_success vornovsctl register alpha
    expect_ports_on_switch
    expect_same_host "on the switch"

    upgrade_on_the_switch
    remove_is_refused
    remove_and_purge
    install_by_hand
    reboot_machine home
}

upgrade_on_the_switch()
{
    step "Upgrade on the switch"
    make_later_version
    snapshot switched
    daemons >"$lab_out/daemons"
    probes_start
    expect_success packages_apt install \
        /lab/packages/later/{libvornovs1,vornovs-host,vornovs-tools}_*.deb
    lab_probe_after=3 probes_finish upgrade 100
    expect_equal "the version" 1.0.0+later1 "$(dpkg-query -W -f '${Version}' vornovs-host)"
    snapshot upgraded
    expect_unchanged switched upgraded
    daemons >"$lab_out/got-daemons"
    expect_same_text "the daemons" "$lab_out/daemons" "$lab_out/got-daemons"
    expect_registered alpha
    expect_same_host "after the upgrade"
    [ -L "$lab_unit_link" ] || fail "the network is not started with the machine any more"
}

# Nobody can leave the switch while the lock is held.
remove_is_refused()
{
    local file holders=()
    step "Remove, refused"
    for file in $lab_lock_files; do
        if [ -e "$file" ]; then
            flock -o "$file" sleep 60 &
            holders+=("$!")
        fi
    done
    expect_failure packages_apt remove vornovs-host
    kill "${holders[@]}"
    wait "${holders[@]}" || true # their status is that they were ended
    wait_until 10 lock_is_free
    grep -q "vornovs: not removed: the client 'alpha' could not be withdrawn" "$lab_out/apt.log" ||
        fail "the reason is not told"
    expect_equal "the library's package" "install ok installed" \
        "$(dpkg-query -W -f '${Status}' libvornovs1)"
    expect_equal "the host's package" "install ok installed" \
        "$(dpkg-query -W -f '${Status}' vornovs-host)"
    expect_registered alpha
    expect_ports_on_switch
    expect_same_host "after the refusal"
}

remove_and_purge()
{
    step "Remove on the switch"
    probes_start
    expect_success packages_apt remove vornovs-host
    lab_probe_after=3 probes_finish remove 500
    expect_no_switch_devices
    expect_same_host "after the removal"
    packages_units >"$lab_out/got-units"
    expect_same_text "what starts with the machine" "$lab_out/managed-units" "$lab_out/got-units"

    step "Purge"
    snapshot_network removed
    # The third has left nothing to purge, and nobody offers it to this apt.
    expect_success packages_apt purge libvornovs1 vornovs-host
    snapshot_network purged
    expect_unchanged removed purged
    expect_same_host "after the purge"
    expect_equal "packages of ours" "" "$(packages_present)"
    host_files >"$lab_out/files-purged"
    expect_same_text "the host's files" "$lab_out/files-before" "$lab_out/files-purged"
    expect_same_units "after the purge"
    [ ! -e /run/vornovs ] || fail "/run/vornovs is left"
}

# A host whose network comes from files that somebody wrote here.
install_by_hand()
{
    step "Install again, and write a file by hand"
    snapshot_network again
    expect_success packages_apt install \
        "$lab_packages"/{libvornovs1,vornovs-host,vornovs-tools}_*.deb
    snapshot_network reinstalled
    expect_unchanged again reinstalled
    expect_no_unit_of_ours
    printf 'DEVICE=eth0\nIPADDR=10.10.0.2\nPREFIX=24\nGATEWAY=10.10.0.1\n' >"${lab_ifcfg}eth0"
    expect_success systemctl -q enable vornovs-network.service

    step "Remove, refused"
    expect_failure packages_apt remove vornovs-host
    grep -q "vornovs: not removed: this host has its network from the files" "$lab_out/apt.log" ||
        fail "the reason is not told"
    expect_same_host "after the second refusal"

    step "Remove once somebody else rules"
    expect_success systemctl -q disable vornovs-network.service vornovs-network-wait-online.service
    expect_success packages_apt purge libvornovs1 vornovs-host
    expect_same_host "after the second purge"
    host_files >"$lab_out/files-purged"
    expect_same_text "the host's files" "$lab_out/files-before" "$lab_out/files-purged"
}

phase_home()
{
    expect_same_host "at home"
    expect_no_switch_devices
    host_files >"$lab_out/files-home"
    expect_same_text "the host's files" "$lab_out/files-before" "$lab_out/files-home"
}
