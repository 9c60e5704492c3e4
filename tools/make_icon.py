#!/usr/bin/env python3
"""Draws the program's icon, a life ring, and writes it as a multi-size .ico.

usage: tools/make_icon.py app/support_tool.ico
"""

import math
import struct
import sys
import zlib

SIZES = (16, 20, 24, 32, 40, 48, 64, 256)
SAMPLES = 4  # in each direction, for smooth edges
RING = (0xE2, 0x3B, 0x2E)
BAND = (0xFF, 0xFF, 0xFF)
EDGE = (0x7A, 0x18, 0x12)


def sample(x, y):
    """The colour at a point of the unit square, or None where the icon is see-through."""
    x, y = x - 0.5, y - 0.5
    radius = math.hypot(x, y)
    if not 0.2 <= radius <= 0.49:
        return None
    if radius >= 0.46 or radius <= 0.225:
        return EDGE
    sixteenth = int((math.atan2(y, x) / (2 * math.pi) * 16) % 16)
    return BAND if sixteenth % 4 in (1, 2) else RING


def pixel(column, row, size):
    hits = []
    for i in range(SAMPLES * SAMPLES):
        dx, dy = (i % SAMPLES + 0.5) / SAMPLES, (i // SAMPLES + 0.5) / SAMPLES
        colour = sample((column + dx) / size, (row + dy) / size)
        if colour:
            hits.append(colour)
    if not hits:
        return (0, 0, 0, 0)
    mean = [sum(c[k] for c in hits) // len(hits) for k in range(3)]
    return (*mean, 255 * len(hits) // SAMPLES**2)


def draw(size):
    return [[pixel(column, row, size) for column in range(size)] for row in range(size)]


def as_png(rows):
    def chunk(kind, data):
        return struct.pack(">I", len(data)) + kind + data + struct.pack(">I", zlib.crc32(kind + data))

    size = len(rows)
    raw = b"".join(b"\0" + bytes(value for p in row for value in p) for row in rows)
    return (b"\x89PNG\r\n\x1a\n" + chunk(b"IHDR", struct.pack(">IIBBBBB", size, size, 8, 6, 0, 0, 0))
            + chunk(b"IDAT", zlib.compress(raw, 9)) + chunk(b"IEND", b""))


def as_bitmap(rows):
    """A 32-bit bottom-up bitmap as icons hold it: twice the height in the header, then an (unused) mask."""
    size = len(rows)
    header = struct.pack("<IiiHHIIiiII", 40, size, 2 * size, 1, 32, 0, 0, 0, 0, 0, 0)
    colours = b"".join(bytes((b, g, r, a)) for row in reversed(rows) for r, g, b, a in row)
    mask = bytes((size + 31) // 32 * 4 * size)
    return header + colours + mask


def main():
    images = [as_png(draw(size)) if size == 256 else as_bitmap(draw(size)) for size in SIZES]
    offset = 6 + 16 * len(images)
    directory = struct.pack("<HHH", 0, 1, len(images))
    for size, image in zip(SIZES, images):
        directory += struct.pack("<BBBBHHII", size % 256, size % 256, 0, 0, 1, 32, len(image), offset)
        offset += len(image)
    with open(sys.argv[1], "wb") as icon:
        icon.write(directory + b"".join(images))


if __name__ == "__main__":
    if len(sys.argv) != 2:
        sys.exit(__doc__)
    main()
