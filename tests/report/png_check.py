#!/usr/bin/env python3
"""Fails when a PNG screenshot of the report looks blank.

Usage: png_check.py FILE [--min-colours N] [--min-ink FRACTION]

Decodes 8-bit greyscale, RGB or RGBA non-interlaced PNG (as browsers write
screenshots) with the standard library; a blank or error page shows too few
colours or too little ink (pixels not near white).
"""

import argparse
import struct
import sys
import zlib


def rows(data):
    """The image's pixel rows, unfiltered, and the bytes per pixel."""
    pos, idat = 8, b""
    assert data[:8] == b"\x89PNG\r\n\x1a\n", "not a PNG file"
    while pos + 12 <= len(data):
        (length,), kind = struct.unpack(">I", data[pos:pos + 4]), data[pos + 4:pos + 8]
        if kind == b"IHDR":
            width, height, depth, colour, _, _, interlace = struct.unpack(">IIBBBBB", data[pos + 8:pos + 21])
            n = {0: 1, 2: 3, 4: 2, 6: 4}[colour]
            assert depth == 8 and not interlace, "unsupported PNG layout"
        idat += data[pos + 8:pos + 8 + length] if kind == b"IDAT" else b""
        pos += 12 + length
    raw, stride, line = zlib.decompress(idat), width * n, bytearray(width * n)
    for y in range(height):
        kind, up, line = raw[y * (stride + 1)], line, bytearray(raw[y * (stride + 1) + 1:(y + 1) * (stride + 1)])
        for i in range(stride):
            a, b, c = line[i - n] if i >= n else 0, up[i], up[i - n] if i >= n else 0
            p = a + b - c
            line[i] = (line[i] + [0, a, b, (a + b) >> 1,
                                  a if abs(p - a) <= min(abs(p - b), abs(p - c)) else b if abs(p - b) <= abs(p - c) else c][kind]) & 0xFF
        yield [bytes(line[x:x + min(n, 3)]) for x in range(0, stride, n)]


parser = argparse.ArgumentParser()
parser.add_argument("png")
parser.add_argument("--min-colours", type=int, default=64)
parser.add_argument("--min-ink", type=float, default=0.05)
args = parser.parse_args()
pixels = [p for row in rows(open(args.png, "rb").read()) for p in row]
colours, ink = len(set(pixels)), sum(1 for p in pixels if min(p) < 235) / max(len(pixels), 1)
print("%s: %d pixels, %d colours, %.1f %% ink" % (args.png, len(pixels), colours, 100 * ink))
if colours < args.min_colours or ink < args.min_ink:
    sys.exit("the rendered report looks blank")
