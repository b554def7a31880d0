#!/usr/bin/env python3
"""Appends what is sent to a syslog socket to a file, one line for each message.

usage: log_to_file.py SOCKET FILE
"""

import os
import socket
import sys

path, log = sys.argv[1:]
with socket.socket(socket.AF_UNIX, socket.SOCK_DGRAM) as receiver, open(log, "wb", 0) as out:
    receiver.bind(path)
    os.chmod(path, 0o666)
    while True:
        message = receiver.recv(65536)
        out.write(message.rstrip(b"\n\0").replace(b"\n", b" ") + b"\n")
