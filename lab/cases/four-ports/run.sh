# shellcheck shell=bash disable=SC2154 # variables of the guest's other files

# A file that not everybody may read stays so.
chmod 640 "${lab_ifcfg}eth3"
remember_plain

step "Register"
probes_start
timed Register vornovsctl register alpha
expect_registered alpha
expect_on_switch
probes_finish Register 100
expect_lock_free

step "Unregister"
probes_start
timed UnRegister vornovsctl unregister alpha
expect_registered
probes_finish UnRegister 100
expect_plain
expect_lock_free
