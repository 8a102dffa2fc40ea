# shellcheck shell=bash disable=SC2154 # variables of the guest's other files

round_trip 100
expect_one_client
