#include "extractor/UnsupportedFormats.h"

#include <cstring>

#include "extractor/ID3v2Tag.h"

namespace android {

namespace {

struct Signature {
    size_t offset;
    const char* magic;
    size_t length;
    const char* name;
};

const Signature kSignatures[] = {
    {0, "\x1A\x45\xDF\xA3", 4, "Matroska/WebM"},
    {8, "AVI ", 4, "AVI"},
    {8, "AIFF", 4, "AIFF"},
    {8, "AIFC", 4, "AIFF-C"},
    {0, "caff", 4, "CAF"},
    {0, ".snd", 4, "Sun audio (.au)"},
    {0, "ADIF", 4, "AAC in ADIF"},
    {0, "\x00\x00\x01\xBA", 4, "MPEG program stream"},
    {0, "MThd", 4, "MIDI"},
    {0, "wvpk", 4, "WavPack"},
    {0, "MAC ", 4, "Monkey's Audio"},
    {0, "FLV", 3, "FLV"},
    {0, "\x30\x26\xB2\x75", 4, "ASF/WMA"},
};

// An MPEG audio frame header (ISO/IEC 11172-3, 2.4.1.3; ISO/IEC 13818-7
// for ADTS, whose layer bits are 0).
const char* MpegAudioName(const uint8_t* h) {
    if (h[0] != 0xFF || (h[1] & 0xE0) != 0xE0) return nullptr;
    if ((h[1] & 0xF6) == 0xF0) return "AAC in ADTS";
    switch ((h[1] >> 1) & 3) {
        case 1: return "MP3 without whole frames (free format or damaged)";
        case 2: return "MPEG audio layer II";
        case 3: return "MPEG audio layer I";
        default: return nullptr;
    }
}

}  // namespace

const char* NameUnsupportedFormat(const sp<DataSource>& source) {
    const off64_t start = SkipID3v2Tags(source, 0);
    uint8_t h[192] = {};
    const ssize_t n = source->readAt(start, h, sizeof(h));
    if (n < 4) return start > 0 ? "ID3-tagged data of an unknown kind" : nullptr;
    if (const char* mpeg = MpegAudioName(h)) return mpeg;
    if (start > 0) return "ID3-tagged data of an unknown kind";
    for (const Signature& s : kSignatures) {
        if (static_cast<size_t>(n) >= s.offset + s.length && memcmp(h + s.offset, s.magic, s.length) == 0) {
            return s.name;
        }
    }
    if (n > 188 && h[0] == 0x47 && h[188] == 0x47) return "MPEG transport stream";
    return nullptr;
}

}  // namespace android
