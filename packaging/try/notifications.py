#!/usr/bin/env python3
# SPDX-License-Identifier: Apache-2.0
"""Writes what a service tells its manager by FOLDER/notify into FOLDER/notified: notifications.py FOLDER"""
import os
import socket
import sys

os.chdir(sys.argv[1])  # the path of a socket has to be short
with socket.socket(socket.AF_UNIX, socket.SOCK_DGRAM) as incoming, open("notified", "w", encoding="utf-8") as out:
    incoming.bind("notify")
    os.chmod("notify", 0o666)
    while True:
        print(incoming.recv(65536).decode(), file=out, flush=True)
