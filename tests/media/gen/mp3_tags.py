#!/usr/bin/env python3
"""Tags at the end of an MP3 file: `ape FILE` appends an APE tag (version
2000, header and footer) with one item, then an ID3v1 tag; `untagged FILE
OUT` writes the file without what `ape` appended."""
import struct
import sys


def tags():
    item = struct.pack("<II", 5, 0) + b"Title\x00" + b"chirp"
    def frame(is_header):
        flags = 0x80000000 | (0x20000000 if is_header else 0)
        return b"APETAGEX" + struct.pack("<IIII", 2000, len(item) + 32, 1, flags) + b"\x00" * 8
    id3v1 = b"TAG" + b"chirp".ljust(30, b"\x00") + b"\x00" * 30 * 2 + b"2026" + b"\x00" * 30 + b"\xff"
    return frame(True) + item + frame(False) + id3v1


def ape(path):
    with open(path, "ab") as f:
        f.write(tags())


def untagged(path, out):
    data = open(path, "rb").read()
    assert data.endswith(tags())
    open(out, "wb").write(data[: -len(tags())])


if __name__ == "__main__":
    {"ape": ape, "untagged": untagged}[sys.argv[1]](*sys.argv[2:])
