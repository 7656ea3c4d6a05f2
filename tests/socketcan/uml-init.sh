#!/bin/sh
# init of the user-mode kernel that run-in-uml.sh boots: CAN modules (slcan too: a CAN controller
# with bit timing on a pseudo-terminal), vcan0 (CAN FD), vcan1 (classic CAN), loopback, a private
# /tmp, then the program with its arguments; its exit status goes to $KV_UML_OUT/status and the
# kernel halts.
export PATH="$KV_UML_PATH:/usr/sbin:/sbin"
mount -t proc proc /proc
mount -t sysfs sysfs /sys
mount -t tmpfs tmpfs /tmp
mkdir -p /dev/pts && mount -t devpts devpts /dev/pts
modules=/usr/lib/uml/modules/$(uname -r)/kernel
for m in net/can/can net/can/can-raw net/can/can-bcm net/can/j1939/can-j1939 \
         drivers/net/can/dev/can-dev drivers/net/can/vcan drivers/net/can/slcan/slcan; do
  insmod "$modules/$m.ko"
done
ip link set lo up
ip link add dev vcan0 type vcan && ip link set vcan0 mtu 72 up
ip link add dev vcan1 type vcan && ip link set vcan1 mtu 16 up
# Receive queues as large as the programs ask for (candump -r, the driver's sockets), and a
# backlog that takes a burst of cangen at its highest rate.
echo 67108864 > /proc/sys/net/core/rmem_max
echo 1000000 > /proc/sys/net/core/netdev_max_backlog
export HOME=/tmp TMPDIR=/tmp
status=1
if [ -d /sys/class/net/vcan0 ]; then
  # shellcheck disable=SC2046
  (IFS='
'; exec "$KV_UML_PROGRAM" $(cat "$KV_UML_OUT/arguments")) > "$KV_UML_OUT/program.log" 2>&1
  status=$?
else
  echo "no vcan0 in user-mode Linux: the CAN modules did not load" > "$KV_UML_OUT/program.log"
fi
echo "$status" > "$KV_UML_OUT/status"
sync
halt -f
