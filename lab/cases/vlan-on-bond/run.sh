# shellcheck shell=bash disable=SC2154 # variables of the guest's other files

round_trip 1000 pull_each_cable bond0 1000
