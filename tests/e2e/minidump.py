"""Reads as much of a minidump as tells whether it is one of the right process."""
import struct

SIGNATURE = b"MDMP"
STREAM_THREADS, STREAM_MODULES, STREAM_SYSTEM, STREAM_MISC = 3, 4, 7, 15
MODULE_SIZE = 108
DUMP_TYPE = 0x1B25  # what the program asks for


class BadDump(Exception):
    pass


class MiniDump:
    def __init__(self, data):
        self._data = data
        if data[:4] != SIGNATURE:
            raise BadDump("no minidump")
        count, directory = struct.unpack_from("<II", data, 8)
        self.flags = struct.unpack_from("<Q", data, 24)[0]
        self._streams = {}
        for i in range(count):
            kind, size, offset = struct.unpack_from("<III", data, directory + 12 * i)
            if offset + size > len(data):
                raise BadDump(f"stream {kind} ends behind the file")
            self._streams[kind] = (offset, size)
        for kind in (STREAM_THREADS, STREAM_MODULES, STREAM_SYSTEM, STREAM_MISC):
            if kind not in self._streams:
                raise BadDump(f"stream {kind} is missing")

    def _count(self, kind):
        return struct.unpack_from("<I", self._data, self._streams[kind][0])[0]

    @property
    def threads(self):
        return self._count(STREAM_THREADS)

    @property
    def process_id(self):
        return struct.unpack_from("<I", self._data, self._streams[STREAM_MISC][0] + 8)[0]

    @property
    def modules(self):
        """Paths; the program itself comes first."""
        begin = self._streams[STREAM_MODULES][0] + 4
        return [self._text(struct.unpack_from("<I", self._data, begin + MODULE_SIZE * i + 20)[0])
                for i in range(self._count(STREAM_MODULES))]

    def _text(self, offset):
        length = struct.unpack_from("<I", self._data, offset)[0]
        return self._data[offset + 4:offset + 4 + length].decode("utf-16-le")
