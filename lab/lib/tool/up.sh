# shellcheck shell=bash
# A shell's host: what was brought along lies in its /root.

cp -r /lab/case/files/. /root/
if [ -n "$(ls -A /root/lib)" ]; then
    echo /root/lib >>/etc/ld.so.conf
    ldconfig
else
    rmdir /root/lib
fi
