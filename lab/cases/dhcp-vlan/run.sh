# shellcheck shell=bash disable=SC2154 # variables of the guest's other files

round_trip 300
expect_one_client
