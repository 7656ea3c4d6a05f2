#!/usr/bin/python3
"""An slcan adapter without hardware: slcand attaches slcan0 to one end of a pseudo-terminal, and
what the kernel's driver writes to the adapter (S5 for 250 kbit/s, O for open, ...) is copied from
the other end to the file given as the argument until the program is ended."""
import os
import pty
import signal
import subprocess
import sys
import time

out = open(sys.argv[1], "wb", buffering=0)
master, slave = pty.openpty()
subprocess.run(["slcand", "-o", "-c", os.ttyname(slave), "slcan0"], check=True)
os.set_blocking(master, False)
signal.signal(signal.SIGINT, lambda *_: sys.exit(0))
while True:
    try:
        out.write(os.read(master, 256))
    except BlockingIOError:
        time.sleep(0.02)
