#!/usr/bin/env python3
"""Replaces the edit list of each track of an MP4 whose movie box comes last
(so no sample moves), as an editor that cuts by edit list would:
  mp4_edit_list.py IN OUT "TRACK:DUR,MEDIA;DUR,MEDIA..." ...
TRACK is the 1-based track number, DUR the edit's duration in seconds, MEDIA
its start in the media in seconds (added to the track's own first media
time, the encoder delay) or "-" for an empty edit."""
import struct
import sys

CONTAINERS = {b"moov", b"trak", b"mdia", b"minf", b"stbl", b"edts"}


def parse(data):
    boxes, at = [], 0
    while at + 8 <= len(data):
        size, kind = struct.unpack(">I4s", data[at:at + 8])
        assert size >= 8, "64-bit and open-ended boxes are not expected here"
        body = data[at + 8:at + size]
        boxes.append([kind, parse(body) if kind in CONTAINERS else body])
        at += size
    return boxes


def build(boxes):
    out = b""
    for kind, body in boxes:
        payload = build(body) if isinstance(body, list) else body
        out += struct.pack(">I4s", 8 + len(payload), kind) + payload
    return out


def child(boxes, kind):
    return next((b for b in boxes if b[0] == kind), None)


def timescales(moov, trak):
    movie = struct.unpack(">I", child(moov, b"mvhd")[1][12:16])[0]
    mdhd = child(child(trak[1], b"mdia")[1], b"mdhd")[1]
    media = struct.unpack(">I", mdhd[12:16] if mdhd[0] == 0 else mdhd[20:24])[0]
    return movie, media


def first_media_time(trak):
    edts = child(trak[1], b"edts")
    if edts is None:
        return 0
    elst = child(edts[1], b"elst")[1]
    for i in range(struct.unpack(">I", elst[4:8])[0]):
        _, media = struct.unpack(">Ii", elst[8 + 12 * i:16 + 12 * i])
        if media >= 0:
            return media
    return 0


def main(src, dst, specs):
    data = open(src, "rb").read()
    top = parse(data)
    moov = child(top, b"moov")[1]
    assert top[-1][0] == b"moov", "the movie box must come last"
    traks = [b for b in moov if b[0] == b"trak"]
    for spec in specs:
        number, edits = spec.split(":")
        trak = traks[int(number) - 1]
        movie_scale, media_scale = timescales(moov, trak)
        base = first_media_time(trak)
        entries = b""
        for edit in edits.split(";"):
            dur, media = edit.split(",")
            ticks = round(float(dur) * movie_scale)
            start = -1 if media == "-" else base + round(float(media) * media_scale)
            entries += struct.pack(">Iii", ticks, start, 0x10000)
        count = len(edits.split(";"))
        elst = [b"elst", struct.pack(">II", 0, count) + entries]
        trak[1] = [b for b in trak[1] if b[0] != b"edts"]
        trak[1].insert(1, [b"edts", [elst]])
    open(dst, "wb").write(build(top))


if __name__ == "__main__":
    main(sys.argv[1], sys.argv[2], sys.argv[3:])
