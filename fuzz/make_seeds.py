#!/usr/bin/env python3
"""Writes a seed corpus for each fuzz target from the test media.

usage: make_seeds.py MEDIA_DIR OUT_DIR

Each target gets OUT_DIR/<target>/ laid out the way its harness reads bytes, so
that the fuzzer starts from well-formed input rather than from noise.
"""
import os
import struct
import sys

START = b"\x00\x00\x00\x01"


def boxes(data, start=0, end=None):
    """(type, body offset, body end) of the ISO BMFF boxes in data[start:end]."""
    end = len(data) if end is None else end
    pos = start
    while pos + 8 <= end:
        size, kind = struct.unpack(">I4s", data[pos:pos + 8])
        if size < 8 or pos + size > end:
            return
        yield kind, pos + 8, pos + size
        pos += size


def find_box(data, kind):
    """Body of the first box of this type anywhere in the file (a byte search
    is enough for the test media, whose sample entries hold one record each)."""
    at = data.find(kind)
    if at < 4:
        return None
    size = struct.unpack(">I", data[at - 4:at])[0]
    return data[at + 4:at - 4 + size]


def take_units(record, pos, count, units):
    """Appends count units behind 16-bit lengths from pos; the position after them."""
    for _ in range(count):
        n = struct.unpack(">H", record[pos:pos + 2])[0]
        units.append(record[pos + 2:pos + 2 + n])
        pos += 2 + n
    return pos


def avcc_units(record):
    """SPS and PPS of an avcC (ISO/IEC 14496-15, 5.3.3.1)."""
    units = []
    pos = take_units(record, 6, record[5] & 0x1F, units)
    take_units(record, pos + 1, record[pos], units)
    return units


def hvcc_units(record):
    """Parameter-set units of an hvcC (ISO/IEC 14496-15, 8.3.3.1)."""
    units, pos = [], 23
    for _ in range(record[22]):
        pos = take_units(record, pos + 3, struct.unpack(">H", record[pos + 1:pos + 3])[0], units)
    return units


def flac_frames(path):
    """STREAMINFO header (42 bytes) and the frames, cut by the sizes in the
    .packets file beside it (third column)."""
    data = open(path, "rb").read()
    start = 0
    if data[:3] == b"ID3":  # a tag in front: syncsafe size, footer flag
        start = 10 + ((data[6] << 21) | (data[7] << 14) | (data[8] << 7) | data[9]) + (10 if data[5] & 0x10 else 0)
    pos = start + 4
    while True:
        last, length = data[pos] & 0x80, int.from_bytes(data[pos + 1:pos + 4], "big")
        pos += 4 + length
        if last:
            break
    frames = []
    for line in open(path + ".packets").read().split():
        size = int(line.split(",")[2])
        frames.append(data[pos:pos + size])
        pos += size
    return data[start:start + 42], frames


def wav_pcm(path):
    """(channels, bits, rate, pcm bytes) of a plain PCM WAVE file."""
    data = open(path, "rb").read()
    fmt = pcm = None
    pos = 12
    while pos + 8 <= len(data):
        kind, size = data[pos:pos + 4], struct.unpack("<I", data[pos + 4:pos + 8])[0]
        body = data[pos + 8:pos + 8 + size]
        if kind == b"fmt ":
            fmt = struct.unpack("<HHI", body[:8])
            bits = struct.unpack("<H", body[14:16])[0]
        elif kind == b"data":
            pcm = body
        pos += 8 + size + (size & 1)
    if fmt is None or pcm is None:
        return None
    return fmt[1], bits, fmt[2], pcm


def write(out, target, name, data):
    path = os.path.join(out, target)
    os.makedirs(path, exist_ok=True)
    with open(os.path.join(path, name), "wb") as f:
        f.write(data)


def main(media, out):
    files = []
    for root, _, names in os.walk(media):
        files += [os.path.join(root, n) for n in sorted(names)]
    samples = [f for f in files if os.path.splitext(f)[1] in
               (".mp4", ".mov", ".m4a", ".3gp", ".wav", ".flac", ".ogg", ".oga", ".amr", ".awb", ".mp3")]

    for f in samples:
        write(out, "fuzz_extractor", os.path.basename(f), open(f, "rb").read())
    # Decoder: whole small files, whose samples the decoders then read.
    for f in samples:
        if os.path.getsize(f) <= 65536:
            write(out, "fuzz_decoder", os.path.basename(f), open(f, "rb").read())

    # Bitstream: a selector byte, then Annex-B parameter sets or a raw record.
    for f in samples:
        data = open(f, "rb").read()
        avcc, hvcc = find_box(data, b"avcC"), find_box(data, b"hvcC")
        name = os.path.basename(f)
        if avcc:
            units = avcc_units(avcc)
            write(out, "fuzz_bitstream", name + ".avc-annexb", b"\x07" + b"".join(START + u for u in units))
            write(out, "fuzz_bitstream", name + ".avc-sps", b"\x07" + units[0])
            write(out, "fuzz_bitstream", name + ".avcc", b"\x07" + avcc)
            prefixed = b"".join(struct.pack(">H", len(u)) + u for u in units)
            write(out, "fuzz_bitstream", name + ".avc-prefixed", b"\x07" + prefixed)
        if hvcc:
            units = hvcc_units(hvcc)
            write(out, "fuzz_bitstream", name + ".hevc-annexb", b"\x21" + b"".join(START + u for u in units))

    # FLAC converter: header length, STREAMINFO header, then 16-bit-length frames.
    for f in samples:
        if f.endswith(".flac") and os.path.exists(f + ".packets"):
            header, frames = flac_frames(f)
            body = b"".join(struct.pack("<H", len(fr)) + fr for fr in frames[:8] if len(fr) < 65536)
            write(out, "fuzz_flac_converter", os.path.basename(f), bytes([len(header)]) + header + body)

    # Waveform: channels, bits code, rate, interview flag, then chunks of PCM.
    for f in samples:
        if not f.endswith(".wav"):
            continue
        info = wav_pcm(f)
        if info is None:
            continue
        channels, bits, rate, pcm = info
        pcm = pcm[:16384]
        chunks = b""
        for i in range(0, len(pcm), 1021):
            piece = pcm[i:i + 1021]
            chunks += bytes([len(piece) // 7, len(piece) % 7]) + piece
        head = bytes([channels, bits // 8]) + struct.pack("<I", rate) + b"\x00"
        write(out, "fuzz_waveform", os.path.basename(f), head + chunks)

    # Metadata: mode byte 0 builds track metadata from entries (mime, count,
    # then key, kind, value); mode 1 builds a message (mime, two bit rates,
    # then csd-0, csd-1 and hdr-static-info with 16-bit lengths).
    write(out, "fuzz_metadata", "mixed", bytes(range(256)))
    for f in samples:
        data = open(f, "rb").read()
        name = os.path.basename(f)
        avcc, hvcc = find_box(data, b"avcC"), find_box(data, b"hvcC")
        if avcc and len(avcc) < 510:
            blob = avcc + b"\x00" * (len(avcc) & 1)
            write(out, "fuzz_metadata", name + ".avcc",
                  bytes([0, 0, 1, 3, 3, len(blob) // 2]) + blob + struct.pack("<I", 0x61766343))
            units = avcc_units(avcc)
            csd = [START + units[0], b"".join(START + u for u in units[1:])]
            write(out, "fuzz_metadata", name + ".avc-csd", bytes([1, 0]) + b"\x00" * 8 +
                  b"".join(struct.pack("<H", len(c)) + c for c in csd) + b"\x00\x00")
        if hvcc:
            csd = b"".join(START + u for u in hvcc_units(hvcc))
            write(out, "fuzz_metadata", name + ".hevc-csd",
                  bytes([1, 1]) + b"\x00" * 8 + struct.pack("<H", len(csd)) + csd + b"\x00" * 4)

if __name__ == "__main__":
    main(sys.argv[1], sys.argv[2])
