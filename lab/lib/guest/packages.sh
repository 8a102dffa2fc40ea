# shellcheck shell=bash disable=SC2154 # variables of the guest's other files
# The repository's packages on the machine with systemd, installed as its users do.

lab_packages=/lab/packages/vornovs

# packages_install PACKAGE...: from the folder that scripts/package makes, with what they need of
# Debian's.
packages_install()
{
    echo "deb [trusted=yes] file:$lab_packages ./" >/etc/apt/sources.list.d/vornovs.list
    expect_success packages_apt update
    expect_success packages_apt install "$@"
}

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
