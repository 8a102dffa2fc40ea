# shellcheck shell=bash disable=SC2034 # read by the files that come after
# Where the lab keeps what it makes. Everything is under the build folder; LAB_BUILD moves it.

lab_root=$(cd "$(dirname "${BASH_SOURCE[0]}")/../../.." && pwd)
lab_source=$lab_root/lab
lab_build=${LAB_BUILD:-$lab_root/build/lab}
lab_release=${LAB_RELEASE:-$lab_root/build/release}
lab_packages_folder=${VORNOVS_PACKAGES:-$lab_root/build/packages}
lab_results=$lab_build/results
lab_debian=$lab_build/debian
lab_layers=$lab_build/layers

# shellcheck source=scripts/lib/say.sh
. "$lab_root/scripts/lib/say.sh"
# shellcheck source=scripts/lib/hostpackages.sh
. "$lab_root/scripts/lib/hostpackages.sh"
# shellcheck source=scripts/lib/buildpackages.sh
. "$lab_root/scripts/lib/buildpackages.sh"

# Where a topology is: one of the lab's own by its name, any other by its path.
lab_topology_folder()
{
    case $1 in
        */*) printf '%s' "$1" ;;
        *) printf '%s' "$lab_source/topologies/$1" ;;
    esac
}

# The lab without the sources beside it is an installed one: its appliance gets what is installed.
lab_is_installed()
{
    [[ ! -f $lab_root/CMakeLists.txt ]]
}

# A name for the content of files: paths on standard input, one a line.
fingerprint()
{
    LC_ALL=C sort | tr '\n' '\0' | xargs -0 -r sha256sum | sha256sum | cut -c 1-16
}
