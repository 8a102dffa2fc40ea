# shellcheck shell=bash
# All of the lab's side on this machine.

lab_library=$(dirname "${BASH_SOURCE[0]}")
# shellcheck source=lab/lib/host/paths.sh
. "$lab_library/paths.sh"
# shellcheck source=lab/lib/host/packages.sh
. "$lab_library/packages.sh"
# shellcheck source=lab/lib/host/image.sh
. "$lab_library/image.sh"
# shellcheck source=lab/lib/host/disk.sh
. "$lab_library/disk.sh"
# shellcheck source=lab/lib/host/guest.sh
. "$lab_library/guest.sh"
# shellcheck source=lab/lib/host/namespaces.sh
. "$lab_library/namespaces.sh"
# shellcheck source=lab/lib/host/cases.sh
. "$lab_library/cases.sh"
