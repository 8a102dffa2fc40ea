# shellcheck shell=bash
# Packages that this machine itself needs; the only thing here that asks for root.

as_root()
{
    if [[ $(id -u) -eq 0 ]]; then
        "$@"
    elif command -v sudo >/dev/null; then
        sudo "$@"
    else
        die "'$*' needs root, and sudo is not installed"
    fi
}

package_installed()
{
    [[ $(dpkg-query -W -f '${db:Status-Abbrev}' "$1" 2>/dev/null) == ii* ]]
}

# Makes sure that apt knows where to find a package, without asking for root when it does.
ensure_package_lists()
{
    if ! apt-cache show "$1" >/dev/null 2>&1; then
        say_note "reading the package lists"
        as_root apt-get update -q >&2
    fi
}

# Installs those of the named packages that are missing. Commands that run side by side wait for each
# other: apt would fail.
ensure_host_packages()
{
    local package missing=() turn
    exec {turn}<"${BASH_SOURCE[0]}"
    flock "$turn"
    for package in "$@"; do
        package_installed "$package" || missing+=("$package")
    done
    if [[ ${#missing[@]} -gt 0 ]]; then
        install_host_packages "${missing[@]}"
    fi
    exec {turn}<&-
}

install_host_packages()
{
    say_note "installing $*"
    as_root apt-get update -q >&2
    as_root env DEBIAN_FRONTEND=noninteractive \
        apt-get install -y -q --no-install-recommends "$@" >&2
}
