# shellcheck shell=bash disable=SC2154 # variables of the guest's other files
# Who manages the network of a machine with systemd before this repository's programs do.

# The manager that the case is about; empty: nobody.
manager_name()
{
    if [ -e /lab/case/manager ]; then
        cat /lab/case/manager
    fi
}

# The units that make a manager one.
manager_units()
{
    case $1 in
        ifupdown) echo networking.service ;;
        networkd | netplan) echo systemd-networkd.service ;;
        networkmanager)
            echo NetworkManager.service NetworkManager-dispatcher.service \
                NetworkManager-wait-online.service
            ;;
    esac
}

# Sets the manager up as an administrator has: its files, of the topology and then of the case,
# and its units enabled. Where there is none, the host has the network's own files.
manager_prepare()
{
    local manager folder
    manager="$(manager_name)"
    if [ -z "$manager" ]; then
        set -- /lab/topology/host
    else
        set -- "/lab/topology/managers/$manager" "/lab/case/managers/$manager"
    fi
    for folder in "$@"; do
        if [ -d "$folder" ]; then
            cp -r --preserve=mode "$folder/." /
        fi
    done
    # Two of them do not read what others can.
    find /etc/NetworkManager/system-connections /etc/netplan -type f -exec chmod 600 {} + 2>/dev/null
    # shellcheck disable=SC2046 # words
    if [ -n "$manager" ]; then
        systemctl -q enable $(manager_units "$manager")
    fi
}
