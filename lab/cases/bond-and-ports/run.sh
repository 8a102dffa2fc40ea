# shellcheck shell=bash disable=SC2154 # variables of the guest's other files

large_frames_and_restart()
{
    in_outside fping -q -r 2 -t 500 -b 8972 -M 10.10.0.2 || fail "frames of 9000 bytes do not pass"
    stop_and_start
}

round_trip 100 large_frames_and_restart
