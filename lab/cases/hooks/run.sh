# shellcheck shell=bash disable=SC2154 # variables of the guest's other files

folder=/usr/vorn/etc/hooks/net/ovs_change
remember_plain

step "Install hook programs"
mkdir -p "$folder"
cat >"$folder/50-witness" <<'HOOK'
#!/bin/sh
if [ -e /sys/class/net/ovs_eth0 ]; then bridge=bridge; else bridge=none; fi
echo "$ACTION $bridge" >>/run/lab/hook
env | sort >>/run/lab/hook-environment
HOOK
printf '#!/bin/sh\nexit 3\n' >"$folder/10-fails"
printf '#!/bin/sh\necho open >>/run/lab/unsafe\n' >"$folder/20-open"
printf '#!/bin/sh\necho foreign >>/run/lab/unsafe\n' >"$folder/30-foreign"
printf '#!/bin/sh\necho inert >>/run/lab/unsafe\n' >"$folder/40-inert"
chmod 755 "$folder"/*
chmod 777 "$folder/20-open"
chown 1000 "$folder/30-foreign"
chmod 644 "$folder/40-inert"

step "Register"
expect_success vornovsctl register alpha
printf 'create none\ncreate bridge\n' >"$lab_out/wanted"
expect_same_text "the runs of the witness" "$lab_out/wanted" /run/lab/hook
expect_failure test -e /run/lab/unsafe
expect_logged '10-fails'
expect_logged '20-open'
expect_logged '30-foreign'
note "environment of the hook programs:"
sort -u /run/lab/hook-environment | show
grep -q '=4$' /run/lab/hook-environment || fail "no run has the action value 4"
grep -q '=5$' /run/lab/hook-environment || fail "no run has the action value 5"

step "Unregister"
expect_success vornovsctl unregister alpha
printf 'create none\ncreate bridge\ndelete bridge\ndelete none\n' >"$lab_out/wanted"
expect_same_text "the runs of the witness" "$lab_out/wanted" /run/lab/hook
rm "$folder"/{10-fails,20-open,30-foreign,40-inert,50-witness}
expect_plain
