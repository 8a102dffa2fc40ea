# shellcheck shell=bash

takeover_phases
