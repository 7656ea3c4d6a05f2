#!/bin/sh
# Runs a test program inside a user-mode Linux kernel that has CAN: boots linux.uml with the host's
# file system as its root, loads the CAN modules, makes vcan0 (CAN FD) and vcan1 (classic CAN), runs
# the program there and halts. One boot for the whole program.
#
#   run-in-uml.sh PROGRAM [ARGUMENTS...]
#
# Exit status: the program's; 77 (skipped) where user-mode Linux or can-utils is not installed.
set -u
here=$(cd "$(dirname "$0")" && pwd)
program=$(cd "$(dirname "$1")" && pwd)/$(basename "$1")
shift

for tool in linux.uml candump cangen cansend insmod ip; do
  if ! PATH="$PATH:/usr/sbin:/sbin" command -v "$tool" > /dev/null 2>&1; then
    echo "SKIPPED: $tool is missing; 'make deps' installs user-mode-linux, can-utils and kmod" \
         "(the SocketCAN tests need a kernel with CAN, which user-mode Linux brings)"
    exit 77
  fi
done

# Not below /tmp: the user-mode kernel mounts its own /tmp.
out=$(mktemp -d "$(dirname "$program")/uml-run.XXXXXX")
trap 'rm -rf "$out"' EXIT
printf '%s\n' "$@" > "$out/arguments"
echo "booting user-mode Linux for $(basename "$program")"
# Kernel arguments that are no kernel option reach init as environment variables.
timeout 280 linux.uml mem=768M root=/dev/root rootfstype=hostfs rootflags=/ rw \
  init="$here/uml-init.sh" con=null con0=fd:0,fd:1 \
  KV_UML_PROGRAM="$program" KV_UML_OUT="$out" KV_UML_PATH="$PATH" \
  < /dev/null > "$out/console" 2>&1
cat "$out/program.log" 2> /dev/null
if [ ! -f "$out/status" ]; then
  echo "user-mode Linux ended before the program did; its console:"
  tail -40 "$out/console"
  exit 1
fi
exit "$(cat "$out/status")"
