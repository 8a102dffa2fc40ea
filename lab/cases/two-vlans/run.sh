# shellcheck shell=bash disable=SC2154 # variables of the guest's other files

remember_plain

step "Register"
probes_start
timed Register vornovsctl register alpha
for vlan in eth0.10 eth0.20 eth1.30; do
    expect_logged "$vlan.*one tag"
done
probes_finish Register 100

step "Unregister"
probes_start
timed UnRegister vornovsctl unregister alpha
probes_finish UnRegister 100
expect_plain
