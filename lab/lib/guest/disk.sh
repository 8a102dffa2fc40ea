# shellcheck shell=dash
# The appliance's disk, in a case that has one: what an appliance keeps when its power is cut.

# What is on the disk; all else is made anew at each boot.
disk_folders='etc usr/vorn var lab/out lab/state'

disk_mount()
{
    while read -r module; do
        insmod "/lab/disk-modules/$module"
    done </lab/disk-modules/order
    while [ ! -b /dev/pmem0 ]; do
        usleep 10000
    done
    mkdir /disk
    mount -t ext4 -o noatime /dev/pmem0 /disk
    # The clock goes on where the last boot's ended.
    if [ -e /disk/lab/state/clock ]; then
        date -s "@$(stat -c %Y /disk/lab/state/clock)" >/dev/null
    fi
    for folder in $disk_folders; do
        disk_lay_over "$folder"
    done
}

# The disk's folder takes the place of the file system's, of which it is a copy at first.
disk_lay_over()
{
    if [ ! -e "/disk/$1" ]; then
        mkdir -p "$(dirname "/disk/$1")"
        if [ -e "/$1" ]; then
            cp -a "/$1" "/disk/$1"
        else
            mkdir -p "/disk/$1"
        fi
    fi
    mkdir -p "/$1"
    mount -o bind "/disk/$1" "/$1"
}
