#!/usr/bin/env python3
"""Checks that a PNG screenshot of the calibration report is not blank.

Usage: png_check.py FILE [--min-colours N] [--min-ink FRACTION]

Decodes 8-bit greyscale, RGB or RGBA non-interlaced PNG (as browsers write
screenshots) with the standard library, and fails when the page shows too few
colours (a blank or error page) or too little ink (pixels not near white).
"""

import argparse
import struct
import sys
import zlib


def unfilter(kind, line, previous, channels):
    for i in range(len(line)):
        left = line[i - channels] if i >= channels else 0
        up, corner = previous[i], previous[i - channels] if i >= channels else 0
        if kind == 1:
            line[i] = (line[i] + left) & 0xFF
        elif kind == 2:
            line[i] = (line[i] + up) & 0xFF
        elif kind == 3:
            line[i] = (line[i] + ((left + up) >> 1)) & 0xFF
        elif kind == 4:
            p = left + up - corner
            pa, pb, pc = abs(p - left), abs(p - up), abs(p - corner)
            line[i] = (line[i] + (left if pa <= pb and pa <= pc else up if pb <= pc else corner)) & 0xFF
        elif kind != 0:
            raise ValueError("bad filter type")
    return line


def decode(data):
    """Returns (width, height, channels, rows) with rows as bytearrays."""
    if data[:8] != b"\x89PNG\r\n\x1a\n":
        raise ValueError("not a PNG file")
    pos, idat, width, height, channels = 8, bytearray(), 0, 0, None
    while pos + 12 <= len(data):
        (length,), kind = struct.unpack(">I", data[pos:pos + 4]), data[pos + 4:pos + 8]
        body = data[pos + 8:pos + 8 + length]
        if kind == b"IHDR":
            width, height, depth, colour, _, _, interlace = struct.unpack(">IIBBBBB", body)
            channels = {0: 1, 2: 3, 4: 2, 6: 4}.get(colour)
            if depth != 8 or channels is None or interlace:
                raise ValueError("unsupported PNG layout")
        elif kind == b"IDAT":
            idat += body
        pos += 12 + length
    raw, stride, rows = zlib.decompress(bytes(idat)), width * (channels or 1), []
    if channels is None or len(raw) < height * (stride + 1):
        raise ValueError("short or headerless image data")
    previous = bytearray(stride)
    for y in range(height):
        start = y * (stride + 1)
        previous = unfilter(raw[start], bytearray(raw[start + 1:start + 1 + stride]), previous,
                            channels)
        rows.append(previous)
    return width, height, channels, rows


def main():
    parser = argparse.ArgumentParser()
    parser.add_argument("png")
    parser.add_argument("--min-colours", type=int, default=64)
    parser.add_argument("--min-ink", type=float, default=0.05)
    args = parser.parse_args()
    with open(args.png, "rb") as f:
        width, height, channels, rows = decode(f.read())
    pixels = [bytes(line[x:x + min(channels, 3)]) for line in rows
              for x in range(0, width * channels, channels)]
    colours, ink = len(set(pixels)), sum(1 for p in pixels if min(p) < 235)
    share = ink / float(len(pixels)) if pixels else 0.0
    print("%s: %d x %d, %d colours, %.1f %% ink" % (args.png, width, height, colours, 100 * share))
    if colours < args.min_colours or share < args.min_ink:
        print("the rendered report looks blank", file=sys.stderr)
        return 1
    return 0


if __name__ == "__main__":
    sys.exit(main())
