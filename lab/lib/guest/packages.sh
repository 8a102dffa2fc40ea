# shellcheck shell=bash disable=SC2154 # variables of the guest's other files
# The repository's packages on the machine with systemd, handled as its users do.

# packages_apt COMMAND...: apt-get, whose words go to a file that the results have.
packages_apt()
{
    local status=0
    echo "# apt-get $*" >>"$lab_out/apt.log"
    DEBIAN_FRONTEND=noninteractive apt-get -y -q "$@" >>"$lab_out/apt.log" 2>&1 </dev/null || status=$?
    if [ "$status" -ne 0 ]; then
        tail -n 20 "$lab_out/apt.log" | show
    fi
    return "$status"
}

# The repository's packages that are installed, or have left settings behind.
packages_present()
{
    dpkg-query -W -f '${db:Status-Abbrev} ${Package}\n' '*vornovs*' 2>/dev/null | grep -v '^un' ||
        true
}
