"""What the helper servers of the tests have in common: a listener on 127.0.0.1 that never outlives its test.

Imported, a service runs in a thread of the test and ends with its `with` block. Run alone, it prints one line
"listening on PORT" when it is ready, and ends when its parent ends, at its time limit, or on SIGTERM.
"""
import asyncio
import os
import signal
import socket
import struct
import threading
import time

HOST = "127.0.0.1"
PARENT_CHECK = 0.2  # seconds
READ_SIZE = 1 << 18


class LoopbackService:
    """Derived classes say in `handle` what happens on a connection; the connection is closed when it returns."""

    def __init__(self, ssl_context=None, port=0):
        self._ssl_context = ssl_context
        self.port = port
        self.connections = 0  # accepted so far
        self._ready = threading.Event()
        self._failure = None
        self._thread = threading.Thread(target=lambda: asyncio.run(self._serve()), daemon=True)

    async def handle(self, number, reader, writer):
        """Serves the connection with this number, counted from 1."""
        raise NotImplementedError

    def __enter__(self):
        self._thread.start()
        self._ready.wait()
        if self._failure:
            raise self._failure
        return self

    def __exit__(self, *_):
        self._loop.call_soon_threadsafe(self._stop.set)
        self._thread.join()

    async def _serve(self):
        self._loop = asyncio.get_running_loop()
        self._stop = asyncio.Event()
        try:
            server = await asyncio.start_server(self._connected, HOST, self.port, ssl=self._ssl_context,
                                                limit=READ_SIZE)
        except OSError as failure:
            self._failure = failure
            self._ready.set()
            return
        self.port = server.sockets[0].getsockname()[1]
        self._ready.set()
        await self._stop.wait()
        server.close()  # asyncio.run cancels the connections that are left

    async def _connected(self, reader, writer):
        self.connections += 1
        try:
            await self.handle(self.connections, reader, writer)
        except (OSError, asyncio.IncompleteReadError, asyncio.CancelledError):
            pass  # the peer went away, or the service ends
        finally:
            writer.close()


def reset(writer):
    """Ends a connection as a broken line does: the peer gets a reset, bytes not yet sent are lost."""
    writer.get_extra_info("socket").setsockopt(socket.SOL_SOCKET, socket.SO_LINGER, struct.pack("ii", 1, 0))
    writer.transport.abort()


async def drip(writer, data, bytes_per_second):
    """Sends at about this rate, in twentieths of a second (slow rates: byte by byte)."""
    piece = max(1, bytes_per_second // 20)
    for begin in range(0, len(data), piece):
        writer.write(data[begin:begin + piece])
        await writer.drain()
        await asyncio.sleep(piece / bytes_per_second)


def run_alone(service, time_limit):
    """Runs the service as a program of its own; time_limit in seconds."""
    parent = os.getppid()
    ended = threading.Event()
    signal.signal(signal.SIGTERM, lambda *_: ended.set())
    signal.signal(signal.SIGINT, lambda *_: ended.set())
    deadline = time.monotonic() + time_limit
    with service:
        print(f"listening on {service.port}", flush=True)
        while os.getppid() == parent and time.monotonic() < deadline and not ended.wait(PARENT_CHECK):
            pass
