# shellcheck shell=bash disable=SC2154 # variables of the guest's other files
# The switch on another machine's kernel. Where that has none, the switch's daemon forwards itself
# what a bridge gets, which each bridge has to be told once it is made.

userspace_bridges()
{
    local action name
    while true; do
        # Ends when the database does.
        while IFS=, read -r _ action name; do
            if [[ $action == insert || $action == initial ]] && [ ! -d /sys/module/openvswitch ]; then
                ovs-vsctl --no-wait --timeout=30 set bridge "${name//\"/}" datapath_type=netdev
            fi
        done < <(ovsdb-client --format=csv --no-headings monitor \
            unix:/var/run/openvswitch/db.sock Open_vSwitch Bridge name 2>/dev/null)
        pause 0.1
    done
}
