# shellcheck shell=bash disable=SC2154 # variables of the guest's other files

hook=/usr/vorn/etc/hooks/net/ovs_change/50-witness
remember_plain
mkdir -p "${hook%/*}"
cat >"$hook" <<'HOOK'
#!/bin/sh
echo "$ACTION" >>/run/lab/hook
HOOK
chmod 755 "$hook"

step "Reset a host without a client"
expect_success vornovsctl reset --yes
expect_failure test -e /run/lab/hook

step "Reset a host on the switch"
expect_success vornovsctl register alpha
rm -f /run/lab/hook
probes_start
expect_success vornovsctl reset --yes
expect_equal "what the hook was told" delete "$(cat /run/lab/hook)"
for file in ovs_reg.conf ovs_interface.conf ovs_ignore.conf; do
    expect_failure test -e "$lab_state/$file"
done
expect_on_switch
lab_probe_after=2 probes_finish reset 5

step "Come home"
expect_success vornovsctl register home
expect_on_switch
expect_success vornovsctl unregister home
rm "$hook"
expect_plain
