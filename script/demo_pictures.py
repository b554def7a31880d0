#!/usr/bin/env python3
"""Paints the pictures that script/demo shares: demo_pictures.py FOLDER"""

import math
import pathlib
import struct
import sys
import zlib

WIDTH, HEIGHT = 480, 320


def beach(x, y):
    """Sky, a sun, the sea and sand."""
    if math.hypot(x - 0.75, y - 0.2) < 0.09:
        return 255, 236, 150
    if y < 0.5:
        return 120 + int(120 * y), 180 + int(80 * y), 235
    wave = 0.75 + 0.02 * math.sin(x * 20)
    return (30, 110 + int(60 * y), 170) if y < wave else (232, 212, 160)


def hills(x, y):
    """Three ridges, the nearest one the darkest."""
    colour = (250 - int(60 * y), 220 - int(40 * y), 200)
    for height, ridge in ((0.45, (150, 170, 190)), (0.6, (100, 140, 120)), (0.75, (50, 100, 70))):
        if y > height + 0.08 * math.sin(x * 9 * height + height * 30):
            colour = ridge
    return colour


def picture(paint):
    """A PNG of what paint(x, y), from 0 to 1, gives in red, green and blue."""
    rows = b"".join(
        b"\0" + bytes(byte for x in range(WIDTH) for byte in paint(x / WIDTH, y / HEIGHT))
        for y in range(HEIGHT))

    def chunk(kind, data):
        return struct.pack(">I", len(data)) + kind + data + struct.pack(
            ">I", zlib.crc32(kind + data))

    head = struct.pack(">IIBBBBB", WIDTH, HEIGHT, 8, 2, 0, 0, 0)
    return (b"\x89PNG\r\n\x1a\n" + chunk(b"IHDR", head) + chunk(b"IDAT", zlib.compress(rows)) +
            chunk(b"IEND", b""))


folder = pathlib.Path(sys.argv[1])
folder.mkdir(parents=True)
for paint in (beach, hills):
    (folder / (paint.__name__ + ".png")).write_bytes(picture(paint))
