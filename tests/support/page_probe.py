"""Reads the page that a window shows, from outside, over the port of the browser behind it. It only looks: whatever is
done to a page is done with mouse and keyboard.

The client speaks as much of the web-socket protocol as one connection to a browser needs: whole text messages.
"""
import base64
import contextlib
import json
import os
import socket
import struct

TIMEOUT = 20  # seconds for one answer
TEXT, CLOSE, PING, PONG = 1, 8, 9, 10


class ProbeError(Exception):
    """The browser is not there, or the page cannot say what it was asked."""


class _WebSocket:
    def __init__(self, port, path):
        self._line = socket.create_connection(("127.0.0.1", port), TIMEOUT)
        key = base64.b64encode(os.urandom(16)).decode()
        self._line.sendall((f"GET {path} HTTP/1.1\r\nHost: 127.0.0.1:{port}\r\nUpgrade: websocket\r\n"
                            f"Connection: Upgrade\r\nSec-WebSocket-Key: {key}\r\n"
                            "Sec-WebSocket-Version: 13\r\n\r\n").encode())
        self._received = b""
        while b"\r\n\r\n" not in self._received:
            self._receive()
        head, self._received = self._received.split(b"\r\n\r\n", 1)
        if b" 101 " not in head.splitlines()[0]:
            raise ProbeError(f"the browser answers {head.splitlines()[0]!r}")

    def close(self):
        self._line.close()

    def _receive(self):
        data = self._line.recv(1 << 16)
        if not data:
            raise ProbeError("the browser has hung up")
        self._received += data

    def _take(self, count):
        while len(self._received) < count:
            self._receive()
        data, self._received = self._received[:count], self._received[count:]
        return data

    def send(self, data, opcode=TEXT):
        mask = os.urandom(4)
        size = len(data)
        length = (struct.pack("!B", 0x80 | size) if size < 126 else
                  struct.pack("!BH", 0x80 | 126, size) if size < 1 << 16 else struct.pack("!BQ", 0x80 | 127, size))
        masked = bytes(byte ^ mask[i % 4] for i, byte in enumerate(data))
        self._line.sendall(bytes([0x80 | opcode]) + length + mask + masked)

    def message(self):
        while True:
            first, size = self._take(2)
            if size >= 126:
                size = int.from_bytes(self._take(2 if size == 126 else 8), "big")
            data = self._take(size)
            if first & 0xF == TEXT and first & 0x80:
                return data
            if first & 0xF == PING:
                self.send(data, PONG)
            elif first & 0xF == CLOSE:
                raise ProbeError("the browser has ended the connection")


class PageProbe:
    """The page of the browser that has this profile folder."""

    def __init__(self, profile):
        with open(profile / "DevToolsActivePort", encoding="ascii") as file:
            port, path = file.read().split()
        self._socket = _WebSocket(int(port), path)
        self._session = None
        self._number = 0
        self._session = self._command("Target.attachToTarget", targetId=self.pages()[0], flatten=True)["sessionId"]

    def __enter__(self):
        return self

    def __exit__(self, *_):
        with contextlib.suppress(OSError):
            self._socket.close()

    def _command(self, method, **params):
        self._number += 1
        message = {"id": self._number, "method": method, "params": params}
        if self._session:
            message["sessionId"] = self._session
        self._socket.send(json.dumps(message).encode())
        while True:
            answer = json.loads(self._socket.message())
            if answer.get("id") == self._number:
                break
        if "error" in answer:
            raise ProbeError(f"{method}: {answer['error']}")
        return answer["result"]

    def pages(self):
        """The browser's names of all pages that are open."""
        session, self._session = self._session, None
        targets = self._command("Target.getTargets")["targetInfos"]
        self._session = session
        return [target["targetId"] for target in targets if target["type"] == "page"]

    def read(self, expression):
        """The value of a script expression that changes nothing."""
        answer = self._command("Runtime.evaluate", expression=expression, returnByValue=True)
        if "exceptionDetails" in answer:
            raise ProbeError(f"{expression}: {answer['exceptionDetails']}")
        return answer["result"].get("value")
