# shellcheck shell=bash disable=SC2154,SC2034 # variables of the guest's other files

lab_probe_interval=5

fails_with()
{
    if ( "$@" ) >/dev/null 2>&1; then fail "'$*' did not fail"; fi
    rm -f "$lab_out/failure"
}

# darken add|del: the outside loses whatever it would send to the host; neighbours stay known.
darken()
{
    in_outside ip route "$1" blackhole 10.10.0.2/32
    in_outside ip -6 route "$1" blackhole fd10:0:0:a0::2/128
}

step "Bring the port up by hand"
ip link set eth0 up
ip address add 10.10.0.2/24 dev eth0
ip address add fd10:0:0:a0::2/64 dev eth0 nodad
ip route add default via 10.10.0.1 dev eth0
ip route add default via fd10:0:0:a0::1 dev eth0
topology_ready

step "Probe a host to which nothing happens"
probes_start
lab_probe_after=2 probes_finish quiet 1

step "Make the outside dark for 60 ms"
probes_start
darken add
pause 0.06
darken del
sleep 1
probes_stop
probes_tell
for direction in in out; do
    outage="$(probes_outage "$direction")"
    figure "60 ms dark $direction" "$outage" ms
    expect_at_most "60 ms, seen $direction" 60 "$outage"
    expect_at_most "60 ms, seen $direction" "$outage" 80
done

step "Make it dark for 200 ms while it is probed less often"
probes_start
probes_relax
pause 0.1
darken add
pause 0.2
darken del
sleep 1
probes_stop
for direction in in out; do
    outage="$(probes_outage "$direction")"
    expect_at_most "200 ms, seen $direction" 175 "$outage"
    expect_at_most "200 ms, seen $direction" "$outage" 250
done

step "Make it dark for good"
probes_start
darken add
sleep 2
probes_stop
expect_at_most "2 s, seen to the end" 1900 "$(probes_outage in)"
darken del
topology_ready

step "Compare"
snapshot before
snapshot same
expect_unchanged before same
ip link set eth0 mtu 1400
ip address add 10.10.0.77/24 dev eth0
ip route add 10.77.0.0/16 via 10.10.0.1 metric 7
sysctl -q -w net.ipv4.conf.eth0.forwarding=1
chmod 600 /etc/sysconfig/network-scripts/ifcfg-eth0
sed -i 's/upper shelf/Upper shelf/' /etc/sysconfig/network-scripts/ifcfg-eth0
snapshot changed
expect_changed before changed '^\+eth0: .* mtu 1400'
expect_changed before changed '^\+eth0 inet 10.10.0.77/24 .* secondary'
expect_changed before changed '^\+4 .*10.77.0.0/16 via 10.10.0.1 .*metric 7'
expect_changed before changed '^\+net/ipv4/conf/eth0/forwarding:1'
expect_changed before changed '^\+-rw------- root:root /etc/sysconfig/network-scripts/ifcfg-eth0'
expect_changed before changed '^\+SITE_LABEL="Rack 7, Upper shelf"'
fails_with expect_unchanged before changed

step "Start the switch by hand"
ip link set eth0 mtu 1500
mkdir -p /run/openvswitch
ovsdb-tool create /etc/openvswitch/conf.db /usr/share/openvswitch/vswitch.ovsschema
ovsdb-server --remote=punix:/run/openvswitch/db.sock --pidfile --detach --log-file \
    /etc/openvswitch/conf.db
ovs-vsctl --no-wait init
wait_until 15 uptime_reached 10
ovs-vswitchd --pidfile --detach --log-file

step "Move the port on to a bridge by hand"
probes_start
ovs-vsctl add-br ovs_eth0 -- set bridge ovs_eth0 other-config:hwaddr=02:00:0a:0a:00:02
ip link set ovs_eth0 up
ovs-vsctl add-port ovs_eth0 eth0
ip -batch - <<END
address del 10.10.0.2/24 dev eth0
address del fd10:0:0:a0::2/64 dev eth0
route del default via fd10:0:0:a0::1 dev eth0
address add 10.10.0.2/24 dev ovs_eth0
address add fd10:0:0:a0::2/64 dev ovs_eth0 nodad
route add default via 10.10.0.1 dev ovs_eth0
route add default via fd10:0:0:a0::1 dev ovs_eth0
END
ovs-vsctl show | show
lab_probe_after=3 probes_finish by-hand 100
