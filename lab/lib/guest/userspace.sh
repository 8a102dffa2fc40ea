# shellcheck shell=bash disable=SC2154 # variables of the guest's other files
# The switch where the kernel is another machine's: what a bridge gets is forwarded by the switch's
# daemon, which each has to be told once it is made.

userspace_bridges()
{
    local action name
    while true; do
        # Ends when the database does.
        while IFS=, read -r _ action name; do
            case $action in
                insert | initial)
                    ovs-vsctl --no-wait --timeout=30 set bridge "${name//\"/}" datapath_type=netdev
                    ;;
            esac
        done < <(ovsdb-client --format=csv --no-headings monitor \
            unix:/var/run/openvswitch/db.sock Open_vSwitch Bridge name 2>/dev/null)
        pause 0.1
    done
}
