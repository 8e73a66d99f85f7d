#ifndef TESTS_MPEG4_TEST_FILE_H
#define TESTS_MPEG4_TEST_FILE_H

// Builds small MP4 files in memory, box by box, so tests can shape every
// table (and break it) without binary fixtures.

#include <algorithm>
#include <climits>
#include <cstdint>
#include <string>
#include <vector>

namespace mp4test {

inline std::string BE(uint64_t v, int bytes) {
    std::string s(bytes, '\0');
    for (int i = bytes - 1; i >= 0; --i, v >>= 8) s[i] = char(v & 0xFF);
    return s;
}
inline std::string BE16(uint32_t v) { return BE(v, 2); }
inline std::string BE32(uint32_t v) { return BE(v, 4); }
inline std::string BE64(uint64_t v) { return BE(v, 8); }

inline std::string Box(const std::string& type, const std::string& payload) {
    return BE32(uint32_t(8 + payload.size())) + type + payload;
}
inline std::string FullBox(const std::string& type, uint8_t version, uint32_t flags, const std::string& payload) {
    return Box(type, BE32((uint32_t(version) << 24) | flags) + payload);
}

// Offset of the first box of this type (of its size field), or npos.
inline size_t FindBox(const std::string& file, const std::string& type) {
    const size_t at = file.find(type);
    return at == std::string::npos ? at : at - 4;
}

struct Sample {
    std::string bytes;
    uint32_t duration = 10;
    int32_t ctsOffset = 0;
    bool sync = true;
};

struct Track {
    std::string handler = "vide";
    std::string sampleEntry;  // one complete sample entry box
    uint32_t timescale = 1000;
    std::vector<Sample> samples;
    uint32_t samplesPerChunk = 2;
    bool co64 = false;
    bool compactSizes = false;  // 'stz2' with 8-bit fields
    bool syncTable = true;
    uint8_t cttsVersion = 0;
    std::string edts;           // a complete 'edts' box, or none
    int32_t matrix[4] = {0x10000, 0, 0, 0x10000};  // a, b, c, d
};

struct File {
    std::vector<Track> tracks;
    std::string udta;       // payload of moov/udta, or none
    std::string trailing;   // top-level boxes after everything else
    bool moovFirst = true;
};

inline std::string VisualEntry(const std::string& format, uint16_t width, uint16_t height,
                               const std::string& children) {
    std::string fixed = std::string(6, '\0') + BE16(1) + std::string(16, '\0') + BE16(width) + BE16(height) +
                        BE32(0x480000) + BE32(0x480000) + BE32(0) + BE16(1) + std::string(32, '\0') +
                        BE16(0x18) + BE16(0xFFFF);
    return Box(format, fixed + children);
}

inline std::string AvcEntry(uint8_t nalLengthSize, uint16_t width = 64, uint16_t height = 48) {
    const std::string sps("\x67\x42\x00\x1e", 4), pps("\x68\xce\x3c\x80", 4);
    std::string avcc = std::string("\x01\x42\x00\x1e", 4) + char(0xFC | (nalLengthSize - 1)) + char(0xE1) +
                       BE16(uint32_t(sps.size())) + sps + char(1) + BE16(uint32_t(pps.size())) + pps;
    return VisualEntry("avc1", width, height, Box("avcC", avcc));
}

inline std::string AudioEntry(const std::string& format, uint16_t channels, uint32_t rate,
                              const std::string& children) {
    std::string fixed = std::string(6, '\0') + BE16(1) + std::string(8, '\0') + BE16(channels) + BE16(16) +
                        BE32(0) + BE32(rate << 16);
    return Box(format, fixed + children);
}

// AAC LC, 44.1 kHz stereo, with the bitrate the descriptor declares.
inline std::string AacEntry(uint32_t avgBitrate = 0) {
    const std::string asc("\x12\x10", 2);
    std::string dsi = std::string(1, '\x05') + char(asc.size()) + asc;
    std::string dcd = std::string(1, '\x40') + char(0x15) + BE(0, 3) + BE32(avgBitrate) + BE32(avgBitrate) + dsi;
    std::string es = BE16(1) + char(0) + char(0x04) + char(dcd.size()) + dcd;
    std::string esd = std::string(1, '\x03') + char(es.size()) + es;
    return AudioEntry("mp4a", 2, 44100, FullBox("esds", 0, 0, esd));
}

inline std::string EditList(const std::vector<std::pair<uint32_t, int32_t>>& edits) {
    std::string entries = BE32(uint32_t(edits.size()));
    for (const auto& e : edits) entries += BE32(e.first) + BE32(uint32_t(e.second)) + BE32(0x10000);
    return Box("edts", FullBox("elst", 0, 0, entries));
}

inline std::string SampleTables(const Track& t, uint64_t mdatBase) {
    std::string stts, ctts, stss, sizes, stsc, offsets;
    uint32_t sttsCount = 0, cttsCount = 0, stssCount = 0;
    for (size_t i = 0; i < t.samples.size(); ++i) {
        const Sample& s = t.samples[i];
        stts += BE32(1) + BE32(s.duration);
        ctts += BE32(1) + BE32(uint32_t(s.ctsOffset));
        ++sttsCount;
        ++cttsCount;
        if (s.sync) {
            stss += BE32(uint32_t(i + 1));
            ++stssCount;
        }
        sizes += t.compactSizes ? std::string(1, char(s.bytes.size())) : BE32(uint32_t(s.bytes.size()));
    }
    const uint32_t chunks = uint32_t((t.samples.size() + t.samplesPerChunk - 1) / t.samplesPerChunk);
    uint64_t at = mdatBase;
    for (uint32_t c = 0; c < chunks; ++c) {
        offsets += t.co64 ? BE64(at) : BE32(uint32_t(at));
        for (size_t i = c * t.samplesPerChunk; i < std::min(t.samples.size(), size_t(c + 1) * t.samplesPerChunk); ++i) {
            at += t.samples[i].bytes.size();
        }
    }
    stsc = BE32(1) + BE32(1) + BE32(t.samplesPerChunk) + BE32(1);
    std::string stbl = FullBox("stsd", 0, 0, BE32(1) + t.sampleEntry) +
                       FullBox("stts", 0, 0, BE32(sttsCount) + stts) +
                       FullBox("ctts", t.cttsVersion, 0, BE32(cttsCount) + ctts) + FullBox("stsc", 0, 0, stsc);
    if (t.syncTable) stbl += FullBox("stss", 0, 0, BE32(stssCount) + stss);
    stbl += t.compactSizes ? FullBox("stz2", 0, 0, BE(8, 4) + BE32(uint32_t(t.samples.size())) + sizes)
                           : FullBox("stsz", 0, 0, BE32(0) + BE32(uint32_t(t.samples.size())) + sizes);
    stbl += FullBox(t.co64 ? "co64" : "stco", 0, 0, BE32(chunks) + offsets);
    return Box("stbl", stbl);
}

inline std::string TrackBox(const Track& t, uint32_t id, uint64_t mdatBase) {
    uint64_t duration = 0;
    for (const Sample& s : t.samples) duration += s.duration;
    std::string matrix = BE32(t.matrix[0]) + BE32(t.matrix[1]) + BE32(0) + BE32(t.matrix[2]) + BE32(t.matrix[3]) +
                         BE32(0) + BE32(0) + BE32(0) + BE32(0x40000000);
    std::string tkhd = FullBox("tkhd", 0, 7, BE32(0) + BE32(0) + BE32(id) + BE32(0) + BE32(uint32_t(duration)) +
                                                 std::string(16, '\0') + matrix + BE32(0) + BE32(0));
    std::string mdhd = FullBox("mdhd", 0, 0, BE32(0) + BE32(0) + BE32(t.timescale) + BE32(uint32_t(duration)) +
                                                 BE16(0x15C7) /* "eng" */ + BE16(0));
    std::string hdlr = FullBox("hdlr", 0, 0, BE32(0) + t.handler + std::string(12, '\0') + std::string(1, '\0'));
    std::string minf = Box("minf", SampleTables(t, mdatBase));
    return Box("trak", tkhd + t.edts + Box("mdia", mdhd + hdlr + minf));
}

inline std::string Movie(const File& f, const std::vector<uint64_t>& bases) {
    std::string traks;
    for (size_t i = 0; i < f.tracks.size(); ++i) traks += TrackBox(f.tracks[i], uint32_t(i + 1), bases[i]);
    std::string mvhd = FullBox("mvhd", 0, 0, BE32(0) + BE32(0) + BE32(1000) + BE32(0) + std::string(76, '\0') +
                                                 BE32(uint32_t(f.tracks.size() + 1)));
    return Box("moov", mvhd + traks + (f.udta.empty() ? "" : Box("udta", f.udta)));
}

// ftyp, moov and mdat (or mdat first), then the trailing boxes.
inline std::string Build(const File& f) {
    const std::string ftyp = Box("ftyp", std::string("isom") + BE32(0x200) + "isomavc1");
    std::string media;
    std::vector<uint64_t> relative;
    for (const Track& t : f.tracks) {
        relative.push_back(media.size());
        for (const Sample& s : t.samples) media += s.bytes;
    }
    // Offsets do not change the movie box's size, so measure it first.
    const size_t moovSize = Movie(f, relative).size();
    const uint64_t mediaStart = ftyp.size() + (f.moovFirst ? moovSize : 0) + 8;
    std::vector<uint64_t> bases;
    for (uint64_t r : relative) bases.push_back(mediaStart + r);
    const std::string moov = Movie(f, bases);
    const std::string mdat = Box("mdat", media);
    return ftyp + (f.moovFirst ? moov + mdat : mdat + moov) + f.trailing;
}

// Fragmented layouts (ISO/IEC 14496-12, 8.8): an empty movie box with 'mvex',
// then a 'moof' and an 'mdat' per group of samples of every track.
struct Fragmenting {
    size_t samplesPerFragment = 2;
    // Where a track fragment's offsets count from.
    enum Base { kFirstAtMoof, kExplicit, kDefaultBaseIsMoof } base = kFirstAtMoof;
    uint8_t trunVersion = 0;
    // Durations and sizes from 'trex', flags from 'tfhd' with the first
    // sample's in the 'trun' (samples must then share their size and
    // duration, and only the first of each fragment be a sync sample).
    bool defaultsOnly = false;
    uint64_t tfdtGap = 0;      // ticks added to each later fragment's decode time
    std::string afterMoov;     // top-level boxes before the first fragment
};

constexpr uint32_t kSyncFlags = 0x02000000, kNonSyncFlags = 0x01010000;

inline std::string TrackFragment(const Track& t, uint32_t id, size_t first, size_t end, uint64_t dts,
                                 const Fragmenting& how, uint64_t base, int32_t dataOffset) {
    uint32_t tfhdFlags = how.base == Fragmenting::kExplicit ? 0x1 : how.base == Fragmenting::kDefaultBaseIsMoof ? 0x20000 : 0;
    std::string tfhd = BE32(id);
    if (tfhdFlags & 0x1) tfhd += BE64(base);
    uint32_t trunFlags = dataOffset != INT32_MIN ? 0x1 : 0;
    std::string samples;
    if (how.defaultsOnly) {
        tfhdFlags |= 0x20;
        tfhd += BE32(kNonSyncFlags);
        trunFlags |= 0x4;
    } else {
        trunFlags |= 0xF00;
        for (size_t i = first; i < end; ++i) {
            const Sample& s = t.samples[i];
            samples += BE32(s.duration) + BE32(uint32_t(s.bytes.size())) + BE32(s.sync ? kSyncFlags : kNonSyncFlags) +
                       BE32(uint32_t(s.ctsOffset));
        }
    }
    std::string trun = BE32(uint32_t(end - first));
    if (trunFlags & 0x1) trun += BE32(uint32_t(dataOffset));
    if (trunFlags & 0x4) trun += BE32(kSyncFlags);
    return Box("traf", FullBox("tfhd", 0, tfhdFlags, tfhd) + FullBox("tfdt", 1, 0, BE64(dts)) +
                           FullBox("trun", how.trunVersion, trunFlags, trun + samples));
}

inline std::string BuildFragmented(const File& f, const Fragmenting& how) {
    const std::string ftyp = Box("ftyp", std::string("iso6") + BE32(0) + "iso6mp41");
    File empty = f;
    std::string mvex;
    for (size_t i = 0; i < f.tracks.size(); ++i) {
        empty.tracks[i].samples.clear();
        const Sample& s = f.tracks[i].samples.front();
        const uint32_t duration = how.defaultsOnly ? s.duration : 0, size = how.defaultsOnly ? uint32_t(s.bytes.size()) : 0;
        mvex += FullBox("trex", 0, 0, BE32(uint32_t(i + 1)) + BE32(1) + BE32(duration) + BE32(size) + BE32(0));
    }
    std::string moov = Movie(empty, std::vector<uint64_t>(f.tracks.size(), 0));
    moov = Box("moov", moov.substr(8) + Box("mvex", mvex));
    std::string out = ftyp + moov + how.afterMoov;

    size_t fragments = 0;
    for (const Track& t : f.tracks) fragments = std::max(fragments, (t.samples.size() + how.samplesPerFragment - 1) / how.samplesPerFragment);
    std::vector<uint64_t> dts(f.tracks.size(), 0);
    for (size_t k = 0; k < fragments; ++k) {
        // Offsets do not change the sizes of the boxes, so lay out twice.
        std::string moof, media;
        for (int pass = 0; pass < 2; ++pass) {
            const uint64_t moofSize = moof.size(), mediaStart = out.size() + moofSize + 8;
            std::string trafs;
            media.clear();
            for (size_t i = 0; i < f.tracks.size(); ++i) {
                const Track& t = f.tracks[i];
                const size_t first = std::min(t.samples.size(), k * how.samplesPerFragment);
                const size_t end = std::min(t.samples.size(), first + how.samplesPerFragment);
                if (first == end) continue;
                const bool firstTraf = trafs.empty();
                int32_t dataOffset = INT32_MIN;  // none: the data follows the previous track fragment's
                if (how.base == Fragmenting::kDefaultBaseIsMoof) dataOffset = int32_t(moofSize + 8 + media.size());
                if (how.base == Fragmenting::kFirstAtMoof && firstTraf) dataOffset = int32_t(moofSize + 8);
                trafs += TrackFragment(t, uint32_t(i + 1), first, end, dts[i] + k * how.tfdtGap, how, mediaStart + media.size(),
                                       dataOffset);
                for (size_t j = first; j < end; ++j) media += t.samples[j].bytes;
                if (pass == 1) {
                    for (size_t j = first; j < end; ++j) dts[i] += t.samples[j].duration;
                }
            }
            moof = Box("moof", FullBox("mfhd", 0, 0, BE32(uint32_t(k + 1))) + trafs);
        }
        out += moof + Box("mdat", media);
    }
    return out;
}

// An AVC sample of NAL units with `lengthSize`-byte prefixes.
inline std::string NalSample(const std::vector<std::string>& nals, int lengthSize) {
    std::string s;
    for (const std::string& n : nals) s += BE(n.size(), lengthSize) + n;
    return s;
}

}  // namespace mp4test

#endif
