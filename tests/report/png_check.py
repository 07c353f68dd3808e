#!/usr/bin/env python3
"""Checks that a PNG screenshot of the calibration report is not blank.

Usage: png_check.py FILE [--min-colours N] [--min-ink FRACTION]

Decodes the PNG with the standard library only (8-bit greyscale, RGB or RGBA,
non-interlaced, as browsers write screenshots), counts the distinct colours and
the share of pixels that are not near white, and fails when the page shows
too few colours (a blank or error page) or too little ink.
"""

import argparse
import struct
import sys
import zlib


def paeth(a, b, c):
    p = a + b - c
    pa, pb, pc = abs(p - a), abs(p - b), abs(p - c)
    if pa <= pb and pa <= pc:
        return a
    return b if pb <= pc else c


def decode(data):
    """Returns (width, height, channels, rows) with rows as bytearrays."""
    if data[:8] != b"\x89PNG\r\n\x1a\n":
        raise ValueError("not a PNG file")
    pos, width, height, channels, idat = 8, 0, 0, 0, bytearray()
    while pos + 8 <= len(data):
        (length,) = struct.unpack(">I", data[pos:pos + 4])
        kind = data[pos + 4:pos + 8]
        if pos + 12 + length > len(data):
            raise ValueError("truncated chunk")
        body = data[pos + 8:pos + 8 + length]
        if kind == b"IHDR":
            width, height, depth, colour, _, _, interlace = struct.unpack(">IIBBBBB", body)
            channels = {0: 1, 2: 3, 4: 2, 6: 4}.get(colour)
            if depth != 8 or channels is None or interlace:
                raise ValueError("unsupported PNG layout")
        elif kind == b"IDAT":
            idat += body
        elif kind == b"IEND":
            break
        pos += 12 + length
    raw = zlib.decompress(bytes(idat))
    stride = width * channels
    if len(raw) < height * (stride + 1):
        raise ValueError("short image data")
    rows, previous = [], bytearray(stride)
    for y in range(height):
        start = y * (stride + 1)
        kind, line = raw[start], bytearray(raw[start + 1:start + 1 + stride])
        for i in range(stride):
            left = line[i - channels] if i >= channels else 0
            up = previous[i]
            corner = previous[i - channels] if i >= channels else 0
            if kind == 1:
                line[i] = (line[i] + left) & 0xFF
            elif kind == 2:
                line[i] = (line[i] + up) & 0xFF
            elif kind == 3:
                line[i] = (line[i] + ((left + up) >> 1)) & 0xFF
            elif kind == 4:
                line[i] = (line[i] + paeth(left, up, corner)) & 0xFF
            elif kind != 0:
                raise ValueError("bad filter type")
        rows.append(line)
        previous = line
    return width, height, channels, rows


def main():
    parser = argparse.ArgumentParser()
    parser.add_argument("png")
    parser.add_argument("--min-colours", type=int, default=64)
    parser.add_argument("--min-ink", type=float, default=0.05)
    args = parser.parse_args()
    with open(args.png, "rb") as f:
        width, height, channels, rows = decode(f.read())
    colours, ink = set(), 0
    for line in rows:
        for x in range(0, width * channels, channels):
            pixel = bytes(line[x:x + min(channels, 3)])
            colours.add(pixel)
            if min(pixel) < 235:
                ink += 1
    share = ink / float(width * height) if width and height else 0.0
    print("%s: %d x %d, %d colours, %.1f %% ink" % (args.png, width, height, len(colours),
                                                   100.0 * share))
    if len(colours) < args.min_colours or share < args.min_ink:
        print("the rendered report looks blank", file=sys.stderr)
        return 1
    return 0


if __name__ == "__main__":
    sys.exit(main())
