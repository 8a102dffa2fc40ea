# shellcheck shell=bash disable=SC2154 # variables of the guest's other files

remember_plain

step "Register"
probes_start
timed Register vornovsctl register alpha
probes_finish Register 1000
ip -d link; ip a; ovs-vsctl show; head /etc/sysconfig/network-scripts/*

step "Unregister"
probes_start
timed UnRegister vornovsctl unregister alpha
head /etc/sysconfig/network-scripts/*
probes_finish UnRegister 1000
expect_plain
