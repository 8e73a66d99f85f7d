#!/usr/bin/env python3
"""Exact trims on MP4/MOV/3GP files from other muxers, checked with ffmpeg.

For every file listed in tests/media/trim/cuts.txt and every cut given there:
  - the video of the trimmed file, decoded, is exactly the source's frames
    presented in [start, end) (frame hashes and count);
  - each audio track starts, relative to the video, within one audio frame
    of where the source's audio at --start lies;
and a copy from 0 to the end gives back every packet of every audio/video
track byte for byte with the same presentation times, and the same decoded
audio.

usage: qnedit_trim_test.py QNEDIT MEDIA_DIR
"""
import json
import os
import subprocess
import sys
import tempfile

QNEDIT, MEDIA = sys.argv[1], sys.argv[2]
failures = []
passes = 0


def run(*cmd):
    return subprocess.run(cmd, check=True, stdout=subprocess.PIPE, stderr=subprocess.PIPE, text=True).stdout


def probe(path, *args):
    return json.loads(run("ffprobe", "-v", "error", "-of", "json", *args, path))


def media_streams(path):
    """(index, codec_type, sample_rate) of the audio and video streams."""
    out = []
    for s in probe(path, "-show_streams")["streams"]:
        if s["codec_type"] in ("audio", "video") and s.get("codec_name") in ("h264", "hevc", "aac", "amr_nb", "amr_wb"):
            out.append((s["index"], s["codec_type"], int(s.get("sample_rate", 0))))
    return out


_frames = {}


def decoded_frames(path, stream):
    """[(presentation time in seconds, md5)] of the decoded frames of a stream."""
    key = (path, stream, os.path.getmtime(path))
    if key not in _frames:
        tb, frames = None, []
        for line in run("ffmpeg", "-v", "error", "-copyts", "-i", path, "-map", "0:%d" % stream,
                        "-fps_mode", "passthrough", "-enc_time_base", "-1", "-f", "framemd5", "-").splitlines():
            if line.startswith("#tb"):
                num, den = line.split()[-1].split("/")
                tb = float(num) / float(den)
            elif line and not line.startswith("#"):
                fields = [f.strip() for f in line.split(",")]
                frames.append((int(fields[2]) * tb, fields[-1]))
        _frames[key] = frames
    return _frames[key]


def packets(path, stream, kind):
    """[(presentation time, md5)] of a stream's packets. Audio packets hidden
    by the edit list and not needed to decode the first one shown (all but
    the last one before time 0) are left out: a reader need not deliver them."""
    found = [(float(p["pts_time"]), p["data_hash"])
             for p in probe(path, "-select_streams", str(stream), "-show_data_hash", "md5",
                            "-show_entries", "packet=pts_time,data_hash", "-show_packets")["packets"]]
    if kind == "audio":
        before = sum(1 for t, _ in found if t < 0)
        found = found[max(0, before - 2):]
    return [(round(t, 4), h) for t, h in found]


def audio_md5(path, stream):
    return [line.split(",")[-1].strip()
            for line in run("ffmpeg", "-v", "error", "-i", path, "-map", "0:%d" % stream,
                            "-f", "framemd5", "-").splitlines()
            if line and not line.startswith("#")]


def check(name, fn):
    global passes
    try:
        fn()
        passes += 1
    except (AssertionError, subprocess.CalledProcessError) as e:
        detail = e.stderr if isinstance(e, subprocess.CalledProcessError) else str(e)
        failures.append(name)
        print("FAIL: %s\n  %s" % (name, detail))


def trim(src, out, start, end):
    cmd = [QNEDIT, "--quiet", "trim", src, out, "--start", str(start)]
    if end is not None:
        cmd += ["--end", str(end)]
    run(*cmd)


def check_cut(src, work, start, end):
    out = os.path.join(work, "cut.mp4")
    trim(src, out, start, end)
    src_streams, out_streams = media_streams(src), media_streams(out)
    assert [s[1] for s in src_streams] == [s[1] for s in out_streams], (src_streams, out_streams)
    eps = 1e-4
    video_src = video_out = None
    for (si, kind, rate), (oi, _, _) in zip(src_streams, out_streams):
        if kind != "video":
            continue
        want = [(t, h) for t, h in decoded_frames(src, si) if t >= start - eps and (end is None or t < end - eps)]
        got = decoded_frames(out, oi)
        assert [h for _, h in got] == [h for _, h in want], \
            "video: %d frames, wanted %d (first %s / %s)" % (len(got), len(want), got[:1], want[:1])
        video_src, video_out = want[0][0], got[0][0]
    for (si, kind, rate), (oi, _, _) in zip(src_streams, out_streams):
        if kind != "audio":
            continue
        # Counted in samples, so the edit's media time is too.
        tb = probe(out, "-select_streams", str(oi), "-show_entries", "stream=time_base", "-show_streams")
        assert tb["streams"][0]["time_base"] == "1/%d" % rate, tb["streams"][0]["time_base"]
        if video_src is None:
            continue
        src_first = decoded_frames(src, si)[0][0]
        want = max(start, src_first) - video_src
        got = decoded_frames(out, oi)[0][0] - video_out
        frame = (1024 if rate > 16000 else 160) / rate
        assert abs(got - want) <= frame + eps, "audio %d starts at %+.4f s from the video, wanted %+.4f" % (oi, got, want)


def check_copy(src, work, shifted):
    """`shifted`: the source was cut inside a GOP by a stream copy. Its video
    edit starts inside a frame, which ffmpeg drops, moving the rest earlier,
    while the copy starts with an empty edit up to the next frame: the video
    times differ by a constant under one frame. Its audio edit hides many
    packets of which the reader delivers only the one the first shown packet
    needs; the decoder's noise substitution then runs from another state, so
    decoded audio is not compared."""
    out = os.path.join(work, "copy.mp4")
    trim(src, out, 0, None)
    src_streams, out_streams = media_streams(src), media_streams(out)
    assert len(src_streams) == len(out_streams), (src_streams, out_streams)
    for (si, kind, _), (oi, _, _) in zip(src_streams, out_streams):
        a, b = packets(src, si, kind), packets(out, oi, kind)
        assert len(a) == len(b), "%s stream %d: %d packets, source has %d" % (kind, si, len(b), len(a))
        if shifted and kind == "video":
            offsets = {round(y[0] - x[0], 4) for x, y in zip(a, b)}
            assert len(offsets) == 1 and 0 < offsets.pop() < 0.04, offsets
            a, b = [h for _, h in a], [h for _, h in b]
        assert a == b, "%s stream %d: first difference at packet %d" % (
            kind, si, next(i for i in range(len(a)) if a[i] != b[i]))
        if kind == "audio" and not shifted:
            assert audio_md5(src, si) == audio_md5(out, oi), "decoded audio of stream %d differs" % si


def main():
    with open(os.path.join(MEDIA, "cuts.txt")) as f:
        lines = [l.split() for l in f if l.strip() and not l.startswith("#")]
    with tempfile.TemporaryDirectory() as work:
        for words in lines:
            name, cuts = words[0], [w for w in words[1:] if w != "shifted"]
            src = os.path.join(MEDIA, name)
            check("%s: copy from 0 to the end" % name, lambda: check_copy(src, work, "shifted" in words))
            for cut in cuts:
                start, _, end = cut.partition("-")
                end = float(end) if end else None
                check("%s: cut %s" % (name, cut), lambda: check_cut(src, work, float(start), end))
    print("%d passed, %d failed" % (passes, len(failures)))
    return 1 if failures else 0


if __name__ == "__main__":
    sys.exit(main())
