#!/usr/bin/env python3
"""Stands in for a Unix browser with a DevTools port, and behaves as the end of its own file name says: bad_browser_garbage."""
import base64
import hashlib
import pathlib
import socket
import struct
import sys
import time

LIFE = 60  # seconds, if nobody ends it
KEY = "258EAFA5-E914-47DA-95CA-C5AB0DC85B11"


def frame(data, opcode=1, last=True):
    size, first = len(data), opcode | (0x80 if last else 0)
    head = (struct.pack("!BB", first, size) if size < 126 else struct.pack("!BBH", first, 126, size) if size < 1 << 16 else
            struct.pack("!BBQ", first, 127, size))
    return head + data


def shake_hands(line):
    head = b""
    while b"\r\n\r\n" not in head:
        head += line.recv(4096)
    key = next(row.split(b":")[1].strip() for row in head.split(b"\r\n") if row.lower().startswith(b"sec-websocket-key"))
    accept = base64.b64encode(hashlib.sha1(key + KEY.encode()).digest()).decode()
    line.sendall(("HTTP/1.1 101 Switching Protocols\r\nUpgrade: websocket\r\nConnection: Upgrade\r\n"
                  f"Sec-WebSocket-Accept: {accept}\r\n\r\n").encode())


def behave(manner, line):
    if manner == "mute":  # takes the connection and never says a word
        return
    if manner == "html":
        line.sendall(b"HTTP/1.1 200 OK\r\nContent-Length: 9\r\n\r\n<html>\xff\xfe\x00")
        return
    shake_hands(line)
    if manner == "garbage":
        for number in range(1000):
            line.sendall(frame(b"\xff\xfe garbage {%d" % number))
    elif manner == "endless":  # one message of any length
        opcode = 1
        while True:
            line.sendall(frame(bytes(1 << 20), opcode, last=False))
            opcode = 0
    elif manner == "closing":
        line.sendall(frame(struct.pack("!H", 1000), opcode=8))
    # "hanging" answers nothing


def main():
    manner = sys.argv[0].rsplit("_", 1)[1]
    profile = pathlib.Path(next(word for word in sys.argv if word.startswith("--user-data-dir=")).split("=", 1)[1])
    with socket.create_server(("127.0.0.1", 0)) as server:
        text = "nothing\nlike a port\n" if manner == "portless" else f"{server.getsockname()[1]}\n/devtools/browser/x\n"
        (profile / "DevToolsActivePort").write_text(text)
        server.settimeout(LIFE)
        line, _ = server.accept()
        with line:
            behave(manner, line)
            time.sleep(LIFE)


main()
