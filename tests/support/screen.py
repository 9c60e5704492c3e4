"""What a virtual screen shows: the frame buffer file of Xvfb (-fbdir), as pixels and as PNG files."""
import mmap
import struct
import zlib

HEADER_SIZE, VERSION = 100, 7  # of an XWD file; all numbers big-endian
COLOUR_SIZE = 12


class Screen:
    """Reads the screen of depth 24 in a frame buffer file. A rectangle is (x, y, width, height)."""

    def __init__(self, path):
        with open(path, "rb") as file:
            self._memory = mmap.mmap(file.fileno(), 0, access=mmap.ACCESS_READ)
        fields = struct.unpack_from("!25I", self._memory)
        header, version, _, _, self.width, self.height, _, byte_order = fields[:8]
        if version != VERSION or fields[11] != 32 or byte_order != 0:
            raise ValueError(f"{path} is no frame buffer of four bytes a pixel, lowest first")
        self._stride = fields[12]
        self._begin = header + fields[19] * COLOUR_SIZE

    def close(self):
        self._memory.close()

    def rows(self, rectangle):
        """Its pixels, four bytes each: blue, green, red, unused. What lies off the screen is left out."""
        x, y, width, height = rectangle
        left, right = max(0, x), min(x + width, self.width)
        for row in range(max(0, y), min(y + height, self.height)):
            start = self._begin + row * self._stride
            yield self._memory[start + 4 * left : start + 4 * right]

    def pixels(self, rectangle):
        return b"".join(self.rows(rectangle))

    def colour(self, x, y):
        blue, green, red, _ = self.pixels((x, y, 1, 1))
        return red, green, blue

    def save(self, rectangle, path):
        """Writes it as a PNG file."""
        lines = []
        for row in self.rows(rectangle):
            line = bytearray(len(row) // 4 * 3)
            line[0::3], line[1::3], line[2::3] = row[2::4], row[1::4], row[0::4]
            lines.append(b"\0" + line)
        width = (len(lines[0]) - 1) // 3
        path.parent.mkdir(parents=True, exist_ok=True)
        path.write_bytes(b"\x89PNG\r\n\x1a\n" +
                         _chunk(b"IHDR", struct.pack("!IIBBBBB", width, len(lines), 8, 2, 0, 0, 0)) +
                         _chunk(b"IDAT", zlib.compress(b"".join(lines))) + _chunk(b"IEND", b""))


def _chunk(kind, data):
    return struct.pack("!I", len(data)) + kind + data + struct.pack("!I", zlib.crc32(kind + data))
