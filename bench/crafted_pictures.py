#!/usr/bin/env python3
"""Writes pictures of a few bytes that unpack to as many pixels as the library shows, in the slowest form of each
format, into the folder that is named."""

import struct
import sys
import zlib

SIDE = 8000  # 64,000,000 pixels
folder = sys.argv[1]


def write(name, *parts):
    with open(f"{folder}/crafted-{name}", "wb") as file:
        for part in parts:
            file.write(part)


# ---- PNG: lines of zeros after their filter byte, packed

ADAM7 = ((0, 0, 8, 8), (4, 0, 8, 8), (0, 4, 4, 8), (2, 0, 4, 4), (0, 2, 2, 4), (1, 0, 2, 2), (0, 1, 1, 2))


def packed(total):
    packer = zlib.compressobj(9)
    block = bytes(1 << 20)
    out = [packer.compress(block[: min(len(block), total - at)]) for at in range(0, total, len(block))]
    return b"".join(out) + packer.flush()


def write_png(name, side, color, pixel_bytes, interlaced):
    def chunk(kind, data):
        return struct.pack(">I", len(data)) + kind + data + struct.pack(">I", zlib.crc32(kind + data))

    total = 0
    for x, y, dx, dy in ADAM7 if interlaced else ((0, 0, 1, 1),):
        total += (1 + -(-(side - x) // dx) * pixel_bytes) * -(-(side - y) // dy)
    header = struct.pack(">IIBBBBB", side, side, 8, color, 0, 0, interlaced)
    write(name, b"\x89PNG\r\n\x1a\n", chunk(b"IHDR", header), chunk(b"IDAT", packed(total)), chunk(b"IEND", b""))


write_png("gray.png", SIDE, 0, 1, 0)
write_png("alpha.png", SIDE, 6, 4, 0)
write_png("interlaced.png", 5650, 6, 4, 1)

# ---- JPEG: all coefficients zero, in codes of one bit


def segment(marker, data):
    return struct.pack(">BBH", 0xFF, marker, len(data) + 2) + data


def huffman(kind, symbol):
    return segment(0xC4, bytes([kind, 1]) + bytes(15) + bytes([symbol]))


def scan(components, first, last):
    parts = b"".join(bytes([i, 0]) for i in components)
    return segment(0xDA, bytes([len(components)]) + parts + bytes([first, last, 0]))


def write_jpeg(name, side, marker, symbol, scans):
    parts = b"".join(bytes([i, 0x11, 0]) for i in (1, 2, 3))
    frame = segment(marker, struct.pack(">BHHB", 8, side, side, 3) + parts)
    tables = segment(0xDB, bytes([0]) + bytes([1] * 64)) + huffman(0x00, 0) + huffman(0x10, symbol)
    write(name, b"\xff\xd8", tables, frame, *scans, b"\xff\xd9")


def blocks(side):
    return (-(-side // 8)) ** 2


def write_progressive(name, side, count):
    # 0xE0 stands for 2^14 blocks without coefficients, and as many more as the next 14 bits say.
    nothing = bytes(-(-blocks(side) // (1 << 14)) * 15 // 8 + 1)
    bands = [(component, first) for first in range(1, 64) for component in (1, 2, 3)][: count - 1]
    scans = [scan((1, 2, 3), 0, 0), bytes(blocks(side) * 3 // 8 + 1)]
    for component, first in bands:
        scans += [scan((component,), first, first), nothing]
    write_jpeg(name, side, 0xC2, 0xE0, scans)


# A first symbol of 0 stands for no difference, and for no more coefficients.
write_jpeg("baseline.jpg", SIDE, 0xC0, 0, [scan((1, 2, 3), 0, 63), bytes(blocks(SIDE) * 6 // 8)])
write_progressive("10-scans.jpg", 6040, 10)
write_progressive("40-scans.jpg", 3880, 40)

# ---- GIF: runs of one colour


def gif_codes():
    """Each code is the run of the code before it and one pixel more, until the table is full and cleared."""
    bits, count, out = 0, 0, bytearray()

    def put(code, width):
        nonlocal bits, count
        bits |= code << count
        count += width
        while count >= 8:
            out.append(bits & 0xFF)
            bits >>= 8
            count -= 8

    left = SIDE * SIDE
    while left:
        put(4, 3)
        table, length = 6, 1
        put(0, 3)
        left -= 1
        while left and table < 4095:
            length = min(length + 1, left)
            # The last pixels come one by one: there may be no code for just so many.
            put(table if length == table - 4 else 0, table.bit_length())
            left -= length if length == table - 4 else 1
            table += 1
    put(5, table.bit_length())
    put(0, 8)
    return bytes(out)


def gif_blocks(data):
    for at in range(0, len(data), 255):
        piece = data[at : at + 255]
        yield bytes([len(piece)]) + piece
    yield b"\x00"


write("runs.gif", b"GIF89a", struct.pack("<HHBBB", SIDE, SIDE, 0x80, 0, 0), bytes(6), b",",
      struct.pack("<HHHHB", 0, 0, SIDE, SIDE, 0x40), b"\x02", *gif_blocks(gif_codes()), b";")

# ---- BMP: runs of 255

line = b"\xff\x00" * (SIDE // 255) + bytes([SIDE % 255, 0]) + b"\x00\x00"
offset = 14 + 40 + 1024
size = len(line) * SIDE + 2
write("runs.bmp", struct.pack("<2sIHHI", b"BM", offset + size, 0, 0, offset),
      struct.pack("<IiiHHIIiiII", 40, SIDE, SIDE, 1, 8, 1, size, 0, 0, 256, 0), bytes(1024), line * SIDE, b"\x00\x01")
