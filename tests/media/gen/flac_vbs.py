#!/usr/bin/env python3
"""Writes a variable-blocksize FLAC file, built here frame by frame.

The reference encoder only writes fixed block sizes, so the frames are made
by hand after the FLAC format: sync code 0xFFF9 (blocking strategy 1), the
coded number is the first sample's number, and the block size changes from
frame to frame (every header block-size form: table codes, 8-bit and 16-bit
trailers). Subframes are CONSTANT, VERBATIM or FIXED (orders 0-4, Rice coded
residual), whichever is smallest; the stereo decorrelation mode changes too.
STREAMINFO carries the real frame sizes and the MD5 of the samples, so
`flac -t` checks every sample.

usage: flac_vbs.py OUT.flac
"""
import hashlib
import math
import random
import struct
import sys

RATE = 44100
CHANNELS = 2
BITS = 16
TOTAL = 22050  # half a second
# Block sizes in turn; the last block takes what is left.
BLOCKS = [1152, 4096, 576, 300, 4608, 17, 2000, 256, 192, 1024, 3333, 16, 2304, 200]
SILENT_BLOCK = 5  # this block is digital silence: CONSTANT subframes
# Channel assignments in turn: independent, left/side, right/side, mid/side.
ASSIGNMENTS = [1, 8, 9, 10]


class BitWriter:
    def __init__(self):
        self.out = bytearray()
        self.acc = 0
        self.n = 0

    def put(self, value, bits):
        self.acc = (self.acc << bits) | (value & ((1 << bits) - 1))
        self.n += bits
        while self.n >= 8:
            self.n -= 8
            self.out.append((self.acc >> self.n) & 0xFF)
        self.acc &= (1 << self.n) - 1

    def put_signed(self, value, bits):
        self.put(value & ((1 << bits) - 1), bits)

    def unary(self, q):
        while q >= 32:
            self.put(0, 32)
            q -= 32
        self.put(1, q + 1)

    def align(self):
        if self.n:
            self.put(0, 8 - self.n)


def crc8(data):
    crc = 0
    for b in data:
        crc ^= b
        for _ in range(8):
            crc = ((crc << 1) ^ 0x07) & 0xFF if crc & 0x80 else (crc << 1) & 0xFF
    return crc


def crc16(data):
    crc = 0
    for b in data:
        crc ^= b << 8
        for _ in range(8):
            crc = ((crc << 1) ^ 0x8005) & 0xFFFF if crc & 0x8000 else (crc << 1) & 0xFFFF
    return crc


def coded_number(v):
    """The UTF-8-like form of the frame header, up to 36 bits."""
    if v < 0x80:
        return bytes([v])
    for extra, lead, limit in ((1, 0xC0, 11), (2, 0xE0, 16), (3, 0xF0, 21), (4, 0xF8, 26), (5, 0xFC, 31), (6, 0xFE, 36)):
        if v < (1 << limit):
            tail = [0x80 | ((v >> (6 * i)) & 0x3F) for i in range(extra - 1, -1, -1)]
            return bytes([lead | (v >> (6 * extra))] + tail)
    raise ValueError(v)


def block_size_code(n):
    table = {192: 1, 576: 2, 1152: 3, 2304: 4, 4608: 5}
    table.update({256 << i: 8 + i for i in range(8)})
    if n in table:
        return table[n], b""
    if n <= 256:
        return 6, bytes([n - 1])
    return 7, struct.pack(">H", n - 1)


def fixed_residual(x, order):
    coeffs = [[], [1], [2, -1], [3, -3, 1], [4, -6, 4, -1]][order]
    return [x[i] - sum(c * x[i - 1 - j] for j, c in enumerate(coeffs)) for i in range(order, len(x))]


def zigzag(r):
    return 2 * r if r >= 0 else -2 * r - 1


def rice_cost(us, k):
    return sum((u >> k) + 1 + k for u in us)


def best_rice(residual):
    us = [zigzag(r) for r in residual]
    mean = sum(us) / max(len(us), 1)
    guess = int(math.log2(mean)) if mean >= 1 else 0
    candidates = [k for k in (guess - 1, guess, guess + 1) if 0 <= k <= 14] or [14]
    k = min(candidates, key=lambda k: rice_cost(us, k))
    return k, us, rice_cost(us, k)


def write_subframe(w, x, bits):
    """The smallest of CONSTANT, VERBATIM and FIXED for these samples."""
    if all(v == x[0] for v in x):
        w.put(0, 8)  # zero pad, type 000000, no wasted bits
        w.put_signed(x[0], bits)
        return
    best = ("verbatim", bits * len(x), None)
    for order in range(5):
        if order >= len(x):
            break
        k, us, cost = best_rice(fixed_residual(x, order))
        cost += order * bits + 2 + 4 + 4
        if cost < best[1]:
            best = (order, cost, (k, us))
    if best[0] == "verbatim":
        w.put(1 << 1, 8)
        for v in x:
            w.put_signed(v, bits)
        return
    order, _, (k, us) = best
    w.put((0x08 | order) << 1, 8)
    for v in x[:order]:
        w.put_signed(v, bits)
    w.put(0, 2)  # 4-bit Rice parameters
    w.put(0, 4)  # partition order 0
    w.put(k, 4)
    for u in us:
        w.unary(u >> k)
        if k:
            w.put(u & ((1 << k) - 1), k)


def frame(first_sample, left, right, assignment):
    code, trailer = block_size_code(len(left))
    header = bytearray([0xFF, 0xF9, (code << 4) | 9, (assignment << 4) | (4 << 1)])  # 44.1 kHz, 16 bits
    header += coded_number(first_sample) + trailer
    header.append(crc8(header))
    side = [l - r for l, r in zip(left, right)]
    if assignment == 1:
        channels = [(left, BITS), (right, BITS)]
    elif assignment == 8:
        channels = [(left, BITS), (side, BITS + 1)]
    elif assignment == 9:
        channels = [(side, BITS + 1), (right, BITS)]
    else:
        channels = [([(l + r) >> 1 for l, r in zip(left, right)], BITS), (side, BITS + 1)]
    w = BitWriter()
    for samples, bits in channels:
        write_subframe(w, samples, bits)
    w.align()
    body = bytes(header) + bytes(w.out)
    return body + struct.pack(">H", crc16(body))


def signal():
    rnd = random.Random(20240611)
    left, right = [], []
    for i in range(TOTAL):
        t = i / RATE
        noise = rnd.gauss(0, 0.15)
        left.append(max(-32768, min(32767, int(20000 * math.sin(2 * math.pi * 440 * t) + 9000 * noise))))
        right.append(max(-32768, min(32767, int(15000 * math.sin(2 * math.pi * 660 * t) + 7000 * rnd.gauss(0, 0.15)))))
    return left, right


def main(out_path, uniform=False):
    global BLOCKS
    if uniform:
        # Numbered by samples, yet one block size throughout: only the frame
        # headers tell it from a fixed-blocksize stream.
        BLOCKS = [1152]
    left, right = signal()
    sizes, pos = [], 0
    while pos < TOTAL:
        n = min(BLOCKS[len(sizes) % len(BLOCKS)], TOTAL - pos)
        sizes.append(n)
        pos += n
    starts = [sum(sizes[:i]) for i in range(len(sizes))]
    s = starts[SILENT_BLOCK]
    for i in range(s, s + sizes[SILENT_BLOCK]):
        left[i] = right[i] = 0

    frames = [frame(start, left[start:start + n], right[start:start + n], ASSIGNMENTS[i % len(ASSIGNMENTS)])
              for i, (start, n) in enumerate(zip(starts, sizes))]
    pcm = b"".join(struct.pack("<hh", l, r) for l, r in zip(left, right))
    info = bytearray()
    info += struct.pack(">HH", min(sizes[:-1]), max(sizes))
    info += max(1, min(len(f) for f in frames)).to_bytes(3, "big") + max(len(f) for f in frames).to_bytes(3, "big")
    packed = (RATE << 44) | ((CHANNELS - 1) << 41) | ((BITS - 1) << 36) | TOTAL
    info += packed.to_bytes(8, "big") + hashlib.md5(pcm).digest()
    assert len(info) == 34
    with open(out_path, "wb") as f:
        f.write(b"fLaC" + bytes([0x80]) + len(info).to_bytes(3, "big") + info + b"".join(frames))


if __name__ == "__main__":
    main(sys.argv[1], uniform="--uniform" in sys.argv[2:])
