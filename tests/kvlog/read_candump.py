#!/usr/bin/python3
"""Prints every frame python-can reads from a candump -l file, one line per frame."""
import sys

import can

for msg in can.CanutilsLogReader(sys.argv[1]):
    data = bytes(msg.data).hex() if msg.data is not None else "-"
    print(f"{msg.timestamp:.6f} {msg.arbitration_id:X} ext={int(msg.is_extended_id)} "
          f"rtr={int(msg.is_remote_frame)} fd={int(msg.is_fd)} brs={int(msg.bitrate_switch)} "
          f"err={int(msg.is_error_frame)} dlc={msg.dlc} rx={int(msg.is_rx)} {data}")
