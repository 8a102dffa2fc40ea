# shellcheck shell=bash disable=SC2154 # variables of the guest's other files
# What a real host finds when it is switched on: cables, and at the first boot a manager that has
# been set up. Runs before systemd does, at each boot.
set -u
export PATH=/usr/sbin:/usr/bin LC_ALL=C

mkdir -p /run/lock /lab/out

# shellcheck source=../guest/main.sh
. /lab/main.sh
modprobe -a virtio_pci virtio_net veth bridge bonding 8021q
hostname debian
ip link set lo up
# The clock goes on where it was when the machine was shut down.
if [ /lab/state/clock -nt /proc/uptime ]; then
    date -s "@$(stat -c %Y /lab/state/clock)" >/dev/null
fi

(
    set -e
    topology_build
    if [ ! -e /lab/state ]; then
        mkdir /lab/state
        manager_prepare
    fi
)

# The lab's own units are in /run: nothing of them is on the host's disk.
mkdir -p /run/systemd/system/multi-user.target.wants /run/systemd/system/sysinit.target.wants
cp /lab/machine/*.service /run/systemd/system/
ln -s ../lab-clock.service /run/systemd/system/sysinit.target.wants/
if [ -e /lab/topology/dnsmasq.conf ]; then
    ln -s ../lab-servers.service /run/systemd/system/sysinit.target.wants/
fi
words=" $(cat /proc/cmdline) "
if [ "${words#* lab.here }" != "$words" ]; then
    ln -s ../lab-here.service /run/systemd/system/multi-user.target.wants/
else
    ln -s ../lab-case.service /run/systemd/system/multi-user.target.wants/
fi
