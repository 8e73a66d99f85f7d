#include "mp3/MP3FrameHeader.h"

#include <algorithm>
#include <vector>

namespace android {

namespace {

// kbit/s by bitrate index; MPEG-1, then MPEG-2 and 2.5 (Table 2.4.2.3).
const uint16_t kBitrates[2][16] = {
    {0, 32, 40, 48, 56, 64, 80, 96, 112, 128, 160, 192, 224, 256, 320, 0},
    {0, 8, 16, 24, 32, 40, 48, 56, 64, 80, 96, 112, 128, 144, 160, 0},
};
const uint32_t kRates[3] = {44100, 48000, 32000};

bool HeaderAt(const sp<DataSource>& source, off64_t offset, MP3FrameHeader* header) {
    uint8_t h[4];
    return source->readAt(offset, h, 4) == 4 && ParseMP3FrameHeader(h, header);
}

}  // namespace

uint32_t MP3FrameHeader::sideInfoBytes() const {
    const uint32_t side = version == 1 ? (channels == 1 ? 17 : 32) : (channels == 1 ? 9 : 17);
    return side + (crc ? 2 : 0);
}

bool ParseMP3FrameHeader(const uint8_t* h, MP3FrameHeader* out) {
    if (h[0] != 0xFF || (h[1] & 0xE0) != 0xE0) return false;
    const int versionBits = (h[1] >> 3) & 3, layerBits = (h[1] >> 1) & 3;
    const int bitrateIndex = h[2] >> 4, rateIndex = (h[2] >> 2) & 3;
    if (versionBits == 1 || layerBits != 1 || bitrateIndex == 0 || bitrateIndex == 15 || rateIndex == 3) return false;
    MP3FrameHeader f;
    f.version = versionBits == 3 ? 1 : versionBits == 2 ? 2 : 25;
    f.sampleRate = kRates[rateIndex] >> (f.version == 1 ? 0 : f.version == 2 ? 1 : 2);
    f.bitrate = kBitrates[f.version == 1 ? 0 : 1][bitrateIndex] * 1000u;
    f.channels = (h[3] >> 6) == 3 ? 1 : 2;
    f.samples = f.version == 1 ? 1152 : 576;
    f.crc = (h[1] & 1) == 0;
    const uint32_t padding = (h[2] >> 1) & 1;
    f.frameBytes = (f.samples / 8) * f.bitrate / f.sampleRate + padding;
    *out = f;
    return true;
}

bool SameMP3Stream(const MP3FrameHeader& a, const MP3FrameHeader& b) {
    return a.version == b.version && a.sampleRate == b.sampleRate && a.channels == b.channels;
}

off64_t FindMP3Frame(const sp<DataSource>& source, off64_t from, off64_t limit, off64_t end, MP3FrameHeader* header) {
    if (limit <= from) return -1;
    // A sniff looks at a few bytes only: the window is no larger than the search.
    std::vector<uint8_t> window(static_cast<size_t>(std::min<off64_t>(64 * 1024, limit - from + 3)));
    for (off64_t base = from; base < limit; base += static_cast<off64_t>(window.size()) - 3) {
        const ssize_t n = source->readAt(base, window.data(), window.size());
        if (n < 4) return -1;
        for (ssize_t i = 0; i + 4 <= n && base + i < limit; ++i) {
            MP3FrameHeader first;
            if (!ParseMP3FrameHeader(&window[i], &first) || base + i + first.frameBytes > end) continue;
            // Sync words turn up inside audio data: the frames that follow
            // must agree before this is taken for a frame.
            off64_t next = base + i + first.frameBytes;
            bool agreed = true;
            for (int k = 0; k < 2 && agreed && next + 4 <= end; ++k) {
                MP3FrameHeader h;
                agreed = HeaderAt(source, next, &h) && SameMP3Stream(first, h);
                next += h.frameBytes;
            }
            if (agreed) {
                *header = first;
                return base + i;
            }
        }
        if (n < static_cast<ssize_t>(window.size())) return -1;
    }
    return -1;
}

}  // namespace android
