# shellcheck shell=bash disable=SC2154 # variables of the guest's other files

# The partner takes seconds to agree with a bond that is made anew.
round_trip 15000 pull_each_cable bond0 1500
