cat /proc/timer_list | grep -E 'Clock Event|mode|resolution' | show
t=$(cut -d' ' -f1 /proc/uptime); usleep 5000;usleep 5000;usleep 5000;usleep 5000;usleep 5000;usleep 5000;usleep 5000;usleep 5000;usleep 5000;usleep 5000; guest_time; echo $t
ip link set eth0 up
ip addr add 10.10.0.2/24 dev eth0
in_outside chrt -f 10 fping -4 -D -l -p 5 -i 0 10.10.0.2 > /run/lab/p 2>&1 &
wait_until 5 sh -c "[ \$(wc -l < /run/lab/p) -gt 400 ]"
kill $!
guest_time
