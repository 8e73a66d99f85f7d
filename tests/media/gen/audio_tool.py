#!/usr/bin/env python3
"""Helpers of audio.sh: hashes, the device items, an assembled AMR-WB file."""
import random
import struct
import sys

# The device items written into items.wav and items.flac.
WAVEFORM = bytes.fromhex("0001fffe7fff")
USER_MESSAGE = b"hello-device"
REC_MODE = b"vr180"
BOOKMARK = 4660


def fnv(path):
    h = 0xcbf29ce484222325
    with open(path, "rb") as f:
        for b in f.read():
            h = ((h ^ b) * 0x100000001b3) & 0xFFFFFFFFFFFFFFFF
    print("%016x" % h)


def wav_items(src, dst):
    data = bytearray(open(src, "rb").read())
    def chunk(cid, payload):
        pad = b"\0" if len(payload) % 2 else b""
        return cid + struct.pack("<I", len(payload)) + payload + pad
    data += chunk(b"wafm", WAVEFORM)
    data += chunk(b"umsg", USER_MESSAGE + b"\0")  # 13 bytes: padded
    data += chunk(b"rmod", REC_MODE)
    data += chunk(b"bksz", struct.pack("<q", BOOKMARK))
    struct.pack_into("<I", data, 4, len(data) - 8)
    open(dst, "wb").write(data)


def flac_blocks(data):
    """(offset, header byte, length) of each metadata block, and the frame offset."""
    assert data[:4] == b"fLaC"
    pos, blocks = 4, []
    while True:
        hdr = data[pos]
        length = int.from_bytes(data[pos + 1:pos + 4], "big")
        blocks.append((pos, hdr, length))
        pos += 4 + length
        if hdr & 0x80:
            return blocks, pos


def flac_items(src, dst):
    data = open(src, "rb").read()
    blocks, frames = flac_blocks(data)
    out = bytearray(b"fLaC")
    for pos, hdr, length in blocks:
        out += bytes([hdr & 0x7F]) + data[pos + 1:pos + 4 + length]
    apps = [(b"wafm", WAVEFORM), (b"umsg", USER_MESSAGE), (b"rmod", REC_MODE),
            (b"bksz", struct.pack(">q", BOOKMARK))]
    for i, (app, payload) in enumerate(apps):
        body = app + payload
        last = 0x80 if i == len(apps) - 1 else 0
        out += bytes([last | 2]) + len(body).to_bytes(3, "big") + body
    out += data[frames:]
    open(dst, "wb").write(out)


def flac_offset(path):
    print(flac_blocks(open(path, "rb").read())[1])


# AMR-WB storage frame sizes (header byte included) for frame types 0-9, 14, 15.
WB_SIZES = {0: 18, 1: 24, 2: 33, 3: 37, 4: 41, 5: 47, 6: 51, 7: 59, 8: 61, 9: 6, 14: 1, 15: 1}


def amr_wb(dst):
    rnd = random.Random(5)
    types = [8] * 10 + [2, 0, 7, 5, 1, 3, 4, 6] * 3 + [9, 15, 15, 14] + [8] * 10
    out = bytearray(b"#!AMR-WB\n")
    for ft in types:
        out.append((ft << 3) | 0x04)  # quality bit set
        out += bytes(rnd.randrange(256) for _ in range(WB_SIZES[ft] - 1))
    open(dst, "wb").write(out)


if __name__ == "__main__":
    cmd = sys.argv[1]
    if cmd == "fnv":
        fnv(sys.argv[2])
    elif cmd == "wavitems":
        wav_items(sys.argv[2], sys.argv[3])
    elif cmd == "flacitems":
        flac_items(sys.argv[2], sys.argv[3])
    elif cmd == "flacoffset":
        flac_offset(sys.argv[2])
    elif cmd == "amrwb":
        amr_wb(sys.argv[2])
    else:
        sys.exit("unknown command " + cmd)
