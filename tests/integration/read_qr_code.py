#!/usr/bin/env python3
"""Reads a QR code as a camera would, and prints what it says.

usage: read_qr_code.py FILE     an SVG picture of squares, or lines of half-block characters
"""
import ctypes
import re
import sys

PIXELS = 6  # of each module's side


def rows_of_picture(text):
    side = int(re.search(r'viewBox="0 0 (\d+) \1"', text)[1])
    rows = [[False] * side for _ in range(side)]
    for x, y in re.findall(r'M(\d+) (\d+)h1v1h-1z', text):
        rows[int(y)][int(x)] = True
    return rows


def rows_of_characters(text):
    rows = []
    for line in text.splitlines():
        rows.append([character in '█▀' for character in line])
        rows.append([character in '█▄' for character in line])
    return rows


def read(rows):
    width, height = len(rows[0]) * PIXELS, len(rows) * PIXELS
    pixels = bytes(0 if rows[y // PIXELS][x // PIXELS] else 255
                   for y in range(height) for x in range(width))
    zbar = ctypes.CDLL('libzbar.so.0')
    pointer, number = ctypes.c_void_p, ctypes.c_ulong
    for name, result, arguments in (
            ('zbar_image_scanner_create', pointer, ()),
            ('zbar_image_create', pointer, ()),
            ('zbar_image_set_format', None, (pointer, number)),
            ('zbar_image_set_size', None, (pointer, ctypes.c_uint, ctypes.c_uint)),
            ('zbar_image_set_data', None, (pointer, ctypes.c_char_p, number, pointer)),
            ('zbar_scan_image', ctypes.c_int, (pointer, pointer)),
            ('zbar_image_first_symbol', pointer, (pointer,)),
            ('zbar_symbol_get_data', ctypes.c_char_p, (pointer,))):
        function = getattr(zbar, name)
        function.restype, function.argtypes = result, arguments
    image = zbar.zbar_image_create()
    zbar.zbar_image_set_format(image, int.from_bytes(b'Y800', 'little'))
    zbar.zbar_image_set_size(image, width, height)
    zbar.zbar_image_set_data(image, pixels, len(pixels), None)
    if zbar.zbar_scan_image(zbar.zbar_image_scanner_create(), image) != 1:
        sys.exit('there is not exactly one code')
    return zbar.zbar_symbol_get_data(zbar.zbar_image_first_symbol(image)).decode()


with open(sys.argv[1], encoding='utf-8') as file:
    content = file.read()
print(read((rows_of_picture if content.startswith('<svg') else rows_of_characters)(content)))
