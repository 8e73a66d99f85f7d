#include "mp3/MP3Tags.h"

#include <cstring>

namespace android {

namespace {

uint32_t BE32(const uint8_t* p) { return uint32_t(p[0]) << 24 | uint32_t(p[1]) << 16 | uint32_t(p[2]) << 8 | p[3]; }
uint32_t LE32(const uint8_t* p) { return uint32_t(p[3]) << 24 | uint32_t(p[2]) << 16 | uint32_t(p[1]) << 8 | p[0]; }

// Xing/Info: after the side information; flags say which fields follow.
bool ReadXing(const uint8_t* frame, size_t size, const MP3FrameHeader& header, MP3StreamInfo* info) {
    size_t at = 4 + header.sideInfoBytes();
    if (size < at + 8 || (memcmp(frame + at, "Xing", 4) != 0 && memcmp(frame + at, "Info", 4) != 0)) return false;
    const uint32_t flags = BE32(frame + at + 4);
    at += 8;
    if (flags & 1) {
        if (size < at + 4) return true;
        info->frames = BE32(frame + at);
        at += 4;
    }
    at += (flags & 2 ? 4 : 0) + (flags & 4 ? 100 : 0) + (flags & 8 ? 4 : 0);
    // LAME's extension (also written by libavformat's muxer under its own
    // name): 9 bytes of version, then at 21 the delay and padding in 12 bits
    // each.
    if (size >= at + 24 && (memcmp(frame + at, "LAME", 4) == 0 || memcmp(frame + at, "Lavf", 4) == 0 ||
                            memcmp(frame + at, "Lavc", 4) == 0)) {
        const uint8_t* d = frame + at + 21;
        info->delay = (d[0] << 4) | (d[1] >> 4);
        info->padding = ((d[1] & 0x0F) << 8) | d[2];
    }
    return true;
}

// VBRI: 32 bytes after the header, whatever the mode. Its delay field is
// not in samples, so only the frame count is taken.
bool ReadVbri(const uint8_t* frame, size_t size, MP3StreamInfo* info) {
    constexpr size_t at = 4 + 32;
    if (size < at + 18 || memcmp(frame + at, "VBRI", 4) != 0) return false;
    info->frames = BE32(frame + at + 14);
    return true;
}

}  // namespace

bool ReadMP3InfoFrame(const uint8_t* frame, size_t size, const MP3FrameHeader& header, MP3StreamInfo* info) {
    return ReadXing(frame, size, header, info) || ReadVbri(frame, size, info);
}

off64_t MP3AudioEnd(const sp<DataSource>& source, off64_t size) {
    off64_t end = size;
    uint8_t tag[32];
    if (end >= 128 && source->readAt(end - 128, tag, 3) == 3 && memcmp(tag, "TAG", 3) == 0) end -= 128;
    if (end >= 32 && source->readAt(end - 32, tag, 32) == 32 && memcmp(tag, "APETAGEX", 8) == 0) {
        // The size counts the items and the footer; a header adds 32.
        const uint64_t tagSize = uint64_t(LE32(tag + 12)) + ((LE32(tag + 20) & 0x80000000u) ? 32 : 0);
        if (tagSize <= uint64_t(end)) end -= static_cast<off64_t>(tagSize);
    }
    return end;
}

}  // namespace android
