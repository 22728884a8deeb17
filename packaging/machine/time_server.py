#!/usr/bin/env python3
# SPDX-License-Identifier: Apache-2.0
# Copyright the morvend authors
"""The time for a machine without a network: answers NTP requests on the loopback interface, as if its own
start had been at the given time. time_server.py SECONDS_SINCE_1970
"""
import socket
import struct
import sys
import time

FROM_1900 = 2208988800
offset = int(sys.argv[1]) - time.time()


def now():
    return round((time.time() + offset + FROM_1900) * 2**32)


with socket.socket(socket.AF_INET, socket.SOCK_DGRAM) as server:
    server.bind(("127.0.0.1", 123))
    while True:
        request, client = server.recvfrom(512)
        if len(request) < 48:
            continue
        received = now()
        # Version 4, a server; of stratum 1, a second to the next question at the least.
        head = struct.pack(">BBbbII4sQ", 0o44, 1, 0, -20, 0, 0, b"TIME", received)
        server.sendto(head + request[40:48] + struct.pack(">QQ", received, now()), client)
