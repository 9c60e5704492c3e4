#!/usr/bin/env python3
"""A TCP proxy on loopback that breaks connections on purpose. It forwards raw bytes, so it serves under TLS as well.

    with FaultProxy(server_port) as proxy:
        proxy.upstream = Faults(cut_after=1_000_000)      # from now on; bytes are counted from here
        ... talk to 127.0.0.1:proxy.port

Run alone it prints "listening on PORT"; see --help. "Upstream" is from the client to the server.
"""
import argparse
import asyncio
import dataclasses

from loopback_service import HOST, READ_SIZE, LoopbackService, drip, reset, run_alone

SEND, STALL, CUT = "send", "stall", "cut"


@dataclasses.dataclass(frozen=True)
class Faults:
    """What befalls the bytes of one direction. Positions count from 1, through all connections since the faults were
    set, so that each strikes once; with per_connection they count from the start of each connection and strike in
    every one."""

    cut_after: int = None  # the connection breaks when this many bytes are through; these do arrive
    stall_after: int = None  # nothing more is forwarded when this many bytes are through …
    stall_seconds: float = None  # … for so long (None: for ever), while the connection stays open
    garble_at: int = None  # the bits of this byte are inverted
    delay: float = 0  # seconds before each chunk
    bytes_per_second: int = None
    per_connection: bool = False


def steps(faults, position, data):
    """What to do with `data`, the bytes behind the first `position` ones: a list of (SEND, bytes), (STALL, seconds),
    (CUT, None). Bytes behind a cut are dropped."""
    end = position + len(data)
    if faults.garble_at is not None and position < faults.garble_at <= end:
        data = bytearray(data)
        data[faults.garble_at - position - 1] ^= 0xFF
        data = bytes(data)
    stops = [(faults.stall_after, STALL, faults.stall_seconds), (faults.cut_after, CUT, None)]
    result = []
    for where, what, seconds in sorted((s for s in stops if s[0] is not None and position < s[0] <= end),
                                       key=lambda stop: stop[0]):
        if where > position:
            result.append((SEND, data[:where - position]))
            data, position = data[where - position:], where
        result.append((what, seconds))
        if what == CUT:
            return result
    return result + ([(SEND, data)] if data else [])


class _Direction:
    def __init__(self):
        self.faults = Faults()
        self.position = 0  # bytes that are through since the faults were set


class FaultProxy(LoopbackService):
    def __init__(self, server_port, port=0):
        super().__init__(port=port)
        self._server_port = server_port
        self._directions = {"upstream": _Direction(), "downstream": _Direction()}
        self.refuse_next = 0  # so many of the next connections are reset as soon as they are made

    # Setting faults starts a new count; connections that are open feel it too.
    def _set(self, name, faults):
        direction = _Direction()
        direction.faults = faults
        self._directions[name] = direction

    upstream = property(lambda self: self._directions["upstream"].faults,
                        lambda self, faults: self._set("upstream", faults))
    downstream = property(lambda self: self._directions["downstream"].faults,
                          lambda self, faults: self._set("downstream", faults))

    def forwarded(self, name):
        """Bytes that are through in a direction ("upstream", "downstream") since its faults were set."""
        return self._directions[name].position

    async def handle(self, number, reader, writer):
        if self.refuse_next > 0:
            self.refuse_next -= 1
            reset(writer)
            return
        server_reader, server_writer = await asyncio.open_connection(HOST, self._server_port, limit=READ_SIZE)
        try:
            await asyncio.gather(self._forward("upstream", reader, writer, server_writer),
                                 self._forward("downstream", server_reader, server_writer, writer))
        finally:
            server_writer.close()

    async def _forward(self, name, reader, sender, receiver):
        through = 0  # of this connection
        while data := await reader.read(READ_SIZE):
            direction = self._directions[name]
            faults = direction.faults
            await asyncio.sleep(faults.delay)
            for what, value in steps(faults, through if faults.per_connection else direction.position, data):
                if what == STALL:
                    await (asyncio.Event().wait() if value is None else asyncio.sleep(value))
                elif what == CUT:
                    reset(sender)
                    receiver.close()  # after what is through has arrived
                    return
                else:
                    through += len(value)
                    direction.position += len(value)
                    await self._send(receiver, value, faults.bytes_per_second)
        if receiver.can_write_eof() and not receiver.is_closing():
            receiver.write_eof()

    @staticmethod
    async def _send(receiver, data, bytes_per_second):
        if bytes_per_second:
            await drip(receiver, data, bytes_per_second)
        else:
            receiver.write(data)
            await receiver.drain()


def _faults_from(options, direction):
    return Faults(cut_after=options[f"cut_{direction}"], stall_after=options[f"stall_{direction}"],
                  garble_at=options[f"garble_{direction}"], stall_seconds=options["stall_seconds"],
                  delay=options["delay"], bytes_per_second=options["bytes_per_second"],
                  per_connection=options["per_connection"])


def main():
    parser = argparse.ArgumentParser(description=__doc__, formatter_class=argparse.RawDescriptionHelpFormatter)
    parser.add_argument("--to", type=int, required=True, metavar="PORT", help="the server's port on 127.0.0.1")
    parser.add_argument("--port", type=int, default=0)
    for fault in ("cut", "stall", "garble"):
        for direction in ("upstream", "downstream"):
            parser.add_argument(f"--{fault}-{direction}", type=int, metavar="BYTE")
    parser.add_argument("--stall-seconds", type=float, help="default: for ever")
    parser.add_argument("--delay", type=float, default=0, help="seconds before each chunk")
    parser.add_argument("--bytes-per-second", type=int)
    parser.add_argument("--per-connection", action="store_true", help="strike in every connection, not once")
    parser.add_argument("--refuse", type=int, default=0, metavar="COUNT", help="reset the first COUNT connections")
    parser.add_argument("--time-limit", type=float, default=120, help="seconds")
    options = vars(parser.parse_args())
    proxy = FaultProxy(options["to"], options["port"])
    proxy.upstream, proxy.downstream = (_faults_from(options, name) for name in ("upstream", "downstream"))
    proxy.refuse_next = options["refuse"]
    run_alone(proxy, options["time_limit"])


if __name__ == "__main__":
    main()
