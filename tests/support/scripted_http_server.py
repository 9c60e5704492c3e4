#!/usr/bin/env python3
"""An HTTP(S) server on loopback that answers from a script and records what it was asked: for replies that no sound
server gives.

    with ScriptedServer([{"status": 429, "headers": {"Retry-After": "1"}}, {"status": 201}]) as server:
        ... talk to server.origin; then look at server.requests

Run alone: scripted_http_server.py SCRIPT.json RECORD.json [--cert FILE --key FILE] [--time-limit SECONDS]. It prints
"listening on PORT" and keeps RECORD.json up to date. The n-th request, whichever connection it comes on, gets the n-th
reply; one too many gets a 500. Bodies of requests are understood with Content-Length only. A reply is an object with
any of these members:

    status, reason      200 and a word by default
    headers             object, or a list of pairs where a name comes twice; Content-Length is added when missing
    body                text; characters stand for bytes (Latin-1)
    raw                 text instead of status, headers and body: sent exactly as it is
    delay               seconds before the answer
    bytes_per_second    sends slowly
    after_body_bytes    answers when so many bytes of the request's body are there, and reads no more of it
    never               true: reads the request and stays silent
    then                "close" or "reset": ends the connection after the answer
    repeat              how many requests get this reply (1)

"$ORIGIN" in headers, body and raw becomes the server's own "http://localhost:PORT", "$IN2" the HTTP date two seconds from then. A recorded request has the members
method, target, headers (pairs), body (its first 64 KiB, Latin-1), body_bytes, body_sha256, whole (did all that
Content-Length promised arrive), connection (number), seconds (since the server started).
"""
import argparse
import asyncio
import email.utils
import hashlib
import http
import json
import os
import re
import ssl
import time

from loopback_service import READ_SIZE, LoopbackService, drip, reset, run_alone

MEMBERS = {"status", "reason", "headers", "body", "raw", "delay", "bytes_per_second", "after_body_bytes", "never",
           "then", "repeat"}
KEPT_BODY = 1 << 16
EXHAUSTED = {"status": 500, "body": "the script has no reply to this request\n", "then": "close"}


class ScriptError(ValueError):
    pass


def expand(script):
    """One reply a request; a misspelt member is an error and not a reply that means something else."""
    replies = []
    for number, reply in enumerate(script, 1):
        unknown = set(reply) - MEMBERS
        if unknown:
            raise ScriptError(f"reply {number}: unknown member {', '.join(sorted(unknown))}")
        if reply.get("then") not in (None, "close", "reset"):
            raise ScriptError(f'reply {number}: "then" must be "close" or "reset"')
        replies += [reply] * reply.get("repeat", 1)
    return replies


def fill_in(text, origin):
    text = re.sub(r"\$IN(\d+)", lambda match: email.utils.formatdate(time.time() + int(match.group(1)), usegmt=True), text)
    return text.replace("$ORIGIN", origin)


def render(reply, method, origin):
    """The bytes of a reply to a request with this method."""
    if "raw" in reply:
        return fill_in(reply["raw"], origin).encode("latin-1")
    status = reply.get("status", 200)
    body = fill_in(reply.get("body", ""), origin).encode("latin-1")
    headers = reply.get("headers", {})
    pairs = list(headers.items()) if isinstance(headers, dict) else list(headers)
    bodyless = status < 200 or status in (204, 304)
    if not bodyless and not any(name.lower() in ("content-length", "transfer-encoding") for name, _ in pairs):
        pairs.append(("Content-Length", str(len(body))))
    known = {code.value: code.phrase for code in http.HTTPStatus}
    reason = reply.get("reason", known.get(status, "Unknown"))
    lines = [f"HTTP/1.1 {status} {reason}", *(f"{name}: {value}" for name, value in pairs), "", ""]
    head = fill_in("\r\n".join(lines), origin).encode("latin-1")
    return head if bodyless or method == "HEAD" else head + body


class ScriptedServer(LoopbackService):
    """`record` names a file that is kept up to date with `requests`."""

    def __init__(self, script, ssl_context=None, record=None, port=0):
        super().__init__(ssl_context, port)
        self._scheme = "https" if ssl_context else "http"
        self._replies = expand(script)
        self._record = record
        self._started = time.monotonic()
        self.requests = []

    @property
    def origin(self):
        return f"{self._scheme}://localhost:{self.port}"

    @property
    def unused_replies(self):
        return max(0, len(self._replies) - len(self.requests))

    async def handle(self, number, reader, writer):
        while await self._exchange(number, reader, writer):
            pass

    async def _exchange(self, connection, reader, writer):
        """One request and its reply; returns whether the connection goes on."""
        head = (await reader.readuntil(b"\r\n\r\n")).decode("latin-1").split("\r\n")
        method, target, _ = head[0].split(" ", 2)
        headers = [[part.strip() for part in line.split(":", 1)] for line in head[1:] if line]
        index = len(self.requests)
        reply = self._replies[index] if index < len(self._replies) else EXHAUSTED
        request = {"method": method, "target": target, "headers": headers, "body": "", "body_bytes": 0,
                   "body_sha256": "", "whole": False, "connection": connection,
                   "seconds": round(time.monotonic() - self._started, 3)}
        self.requests.append(request)
        try:
            await self._receive_body(request, reader, writer, reply.get("after_body_bytes"))
        finally:
            self._keep()
        return await self._answer(request, reply, writer)

    async def _receive_body(self, request, reader, writer, limit):
        named = {name.lower(): value for name, value in request["headers"]}
        length = int(named.get("content-length", 0))
        if named.get("expect", "").lower() == "100-continue":
            writer.write(b"HTTP/1.1 100 Continue\r\n\r\n")
        wanted = length if limit is None else min(limit, length)
        digest, kept, count = hashlib.sha256(), b"", 0
        while count < wanted and (data := await reader.read(min(READ_SIZE, wanted - count))):
            count += len(data)
            digest.update(data)
            kept += data[:KEPT_BODY - len(kept)]
        request.update(body=kept.decode("latin-1"), body_bytes=count, body_sha256=digest.hexdigest(),
                       whole=count == length)

    async def _answer(self, request, reply, writer):
        if reply.get("never"):
            await asyncio.Event().wait()
        await asyncio.sleep(reply.get("delay", 0))
        data = render(reply, request["method"], self.origin)
        if reply.get("bytes_per_second"):
            await drip(writer, data, reply["bytes_per_second"])
        else:
            writer.write(data)
            await writer.drain()
        if reply.get("then") == "reset":
            await asyncio.sleep(0.05)  # a reset overtakes bytes that the peer has not read yet
            reset(writer)
        return reply.get("then") is None and request["whole"]

    def _keep(self):
        if self._record:
            temporary = f"{self._record}.tmp"
            with open(temporary, "w", encoding="utf-8") as file:
                json.dump(self.requests, file, indent=1)
            os.replace(temporary, self._record)


def tls_context(certificate, key):
    context = ssl.SSLContext(ssl.PROTOCOL_TLS_SERVER)
    context.load_cert_chain(certificate, key)
    return context


def main():
    parser = argparse.ArgumentParser(description=__doc__, formatter_class=argparse.RawDescriptionHelpFormatter)
    parser.add_argument("script")
    parser.add_argument("record")
    parser.add_argument("--port", type=int, default=0)
    parser.add_argument("--cert")
    parser.add_argument("--key")
    parser.add_argument("--time-limit", type=float, default=120, help="seconds")
    options = parser.parse_args()
    with open(options.script, encoding="utf-8") as file:
        script = json.load(file)
    context = tls_context(options.cert, options.key) if options.cert else None
    run_alone(ScriptedServer(script, context, options.record, options.port), options.time_limit)


if __name__ == "__main__":
    main()
