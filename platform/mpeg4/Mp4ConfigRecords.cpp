#define LOG_TAG "Mp4ConfigRecords"
#include "mpeg4/Mp4ConfigRecords.h"

#include <media/stagefright/foundation/ByteReader.h>

namespace android {

namespace {

constexpr size_t kMaxParameterSet = 0xFFFF;

void appendU16(std::vector<uint8_t>* out, size_t v) {
    out->push_back(static_cast<uint8_t>(v >> 8));
    out->push_back(static_cast<uint8_t>(v));
}

void appendUnits(std::vector<uint8_t>* out, const std::vector<NalSpan>& units) {
    for (const NalSpan& u : units) {
        appendU16(out, u.size);
        out->insert(out->end(), u.data, u.data + u.size);
    }
}

bool allFit(const std::vector<NalSpan>& units, size_t minSize) {
    for (const NalSpan& u : units) {
        if (u.size < minSize || u.size > kMaxParameterSet) return false;
    }
    return true;
}

}  // namespace

std::vector<uint8_t> Mp4BuildAvcC(const std::vector<NalSpan>& sps, const std::vector<NalSpan>& pps) {
    std::vector<uint8_t> out;
    if (sps.empty() || pps.empty() || sps.size() > 31 || pps.size() > 255) return out;
    if (!allFit(sps, 4) || !allFit(pps, 1)) return out;
    const uint8_t* first = sps[0].data;
    out = {1, first[1], first[2], first[3], 0xFF /* 4-byte lengths */,
           static_cast<uint8_t>(0xE0 | sps.size())};
    appendUnits(&out, sps);
    out.push_back(static_cast<uint8_t>(pps.size()));
    appendUnits(&out, pps);

    // Profiles beyond Baseline, Main and Extended carry chroma format and
    // bit depths after the PPS list.
    const uint8_t profile = first[1];
    if (profile != 66 && profile != 77 && profile != 88) {
        RbspBitReader r(first, sps[0].size, 4);
        uint32_t id = 0, chroma = 0, lumaDepth = 0, chromaDepth = 0;
        bool ok = r.ue(&id) && r.ue(&chroma) && chroma <= 3;
        if (ok && chroma == 3) ok = r.skipBits(1);
        ok = ok && r.ue(&lumaDepth) && r.ue(&chromaDepth) && lumaDepth <= 7 && chromaDepth <= 7;
        if (ok) {
            out.push_back(static_cast<uint8_t>(0xFC | chroma));
            out.push_back(static_cast<uint8_t>(0xF8 | lumaDepth));
            out.push_back(static_cast<uint8_t>(0xF8 | chromaDepth));
            out.push_back(0);  // no SPS extensions
        }
    }
    return out;
}

std::vector<uint8_t> Mp4BuildHvcC(const std::vector<NalSpan>& vps, const std::vector<NalSpan>& sps,
                                  const std::vector<NalSpan>& pps) {
    std::vector<uint8_t> out;
    if (vps.empty() || sps.empty() || pps.empty()) return out;
    if (!allFit(vps, 2) || !allFit(sps, 15) || !allFit(pps, 2)) return out;
    if (vps.size() > 0xFFFF || sps.size() > 0xFFFF || pps.size() > 0xFFFF) return out;

    // SPS (ISO/IEC 23008-2 7.3.2.2): after the 2-byte header, 4 bits VPS id,
    // 3 bits max_sub_layers_minus1, 1 bit temporal_id_nesting, then the
    // 12-byte general profile_tier_level.
    RbspBitReader r(sps[0].data, sps[0].size, 2);
    uint32_t v = 0, subLayers = 0, nesting = 0;
    uint8_t general[12];
    bool ok = r.bits(4, &v) && r.bits(3, &subLayers) && r.bits(1, &nesting);
    for (int i = 0; ok && i < 12; ++i) {
        ok = r.bits(8, &v);
        general[i] = static_cast<uint8_t>(v);
    }
    uint32_t profilePresent[8] = {}, levelPresent[8] = {};
    for (uint32_t i = 0; ok && i < subLayers; ++i) ok = r.bits(1, &profilePresent[i]) && r.bits(1, &levelPresent[i]);
    if (ok && subLayers > 0) ok = r.skipBits(2 * (8 - int(subLayers)));
    for (uint32_t i = 0; ok && i < subLayers; ++i) {
        if (profilePresent[i]) ok = r.skipBits(88);
        if (ok && levelPresent[i]) ok = r.skipBits(8);
    }
    uint32_t id = 0, chroma = 0, width = 0, height = 0, window = 0, lumaDepth = 0, chromaDepth = 0;
    ok = ok && r.ue(&id) && r.ue(&chroma) && chroma <= 3;
    if (ok && chroma == 3) ok = r.skipBits(1);
    ok = ok && r.ue(&width) && r.ue(&height) && r.bits(1, &window);
    for (int i = 0; ok && window && i < 4; ++i) ok = r.ue(&v);
    ok = ok && r.ue(&lumaDepth) && r.ue(&chromaDepth) && lumaDepth <= 7 && chromaDepth <= 7;
    if (!ok) return out;

    out.push_back(1);
    out.insert(out.end(), general, general + 12);
    out.push_back(0xF0);  // min_spatial_segmentation_idc 0
    out.push_back(0x00);
    out.push_back(0xFC);  // parallelismType unknown
    out.push_back(static_cast<uint8_t>(0xFC | chroma));
    out.push_back(static_cast<uint8_t>(0xF8 | lumaDepth));
    out.push_back(static_cast<uint8_t>(0xF8 | chromaDepth));
    appendU16(&out, 0);  // avgFrameRate unknown
    // constantFrameRate 0, numTemporalLayers, temporalIdNested, 4-byte lengths
    out.push_back(static_cast<uint8_t>(((subLayers + 1) << 3) | (nesting << 2) | 3));
    out.push_back(3);
    const std::pair<uint8_t, const std::vector<NalSpan>*> arrays[] = {{32, &vps}, {33, &sps}, {34, &pps}};
    for (const auto& a : arrays) {
        out.push_back(static_cast<uint8_t>(0x80 | a.first));  // array_completeness 1
        appendU16(&out, a.second->size());
        appendUnits(&out, *a.second);
    }
    return out;
}

size_t Mp4AvcCLengthSize(const uint8_t* record, size_t size) {
    ByteReader r(record, size);
    uint8_t version = 0, lengthByte = 0, count = 0;
    uint16_t length = 0;
    if (!r.u8(&version) || version != 1 || !r.skip(3) || !r.u8(&lengthByte) || !r.u8(&count)) return 0;
    for (int list = 0; list < 2; ++list) {
        if (list == 1 && !r.u8(&count)) return 0;
        for (int i = 0; i < (list == 0 ? (count & 0x1F) : count); ++i) {
            if (!r.be16(&length) || !r.skip(length)) return 0;
        }
    }
    const size_t lengthSize = (lengthByte & 3) + 1;
    return lengthSize == 3 ? 0 : lengthSize;
}

size_t Mp4HvcCLengthSize(const uint8_t* record, size_t size) {
    ByteReader r(record, size);
    uint8_t version = 0, lengthByte = 0, arrays = 0, type = 0;
    uint16_t count = 0, length = 0;
    if (!r.u8(&version) || version != 1 || !r.skip(20) || !r.u8(&lengthByte) || !r.u8(&arrays)) return 0;
    for (int a = 0; a < arrays; ++a) {
        if (!r.u8(&type) || !r.be16(&count)) return 0;
        for (int i = 0; i < count; ++i) {
            if (!r.be16(&length) || !r.skip(length)) return 0;
        }
    }
    const size_t lengthSize = (lengthByte & 3) + 1;
    return lengthSize == 3 ? 0 : lengthSize;
}

namespace {

// Tag and expandable size of a descriptor (ISO/IEC 14496-1 8.3.3).
bool readDescriptor(ByteReader* r, uint8_t* tag, ByteReader* body) {
    uint32_t size = 0;
    uint8_t b = 0;
    if (!r->u8(tag)) return false;
    for (int i = 0; i < 4; ++i) {
        if (!r->u8(&b)) return false;
        size = (size << 7) | (b & 0x7F);
        if ((b & 0x80) == 0) return r->sub(size, body);
    }
    return false;
}

}  // namespace

bool Mp4AscFromEsds(const uint8_t* data, size_t size, std::vector<uint8_t>* asc) {
    ByteReader r(data, size);
    if (size >= 5 && data[0] == 0 && data[1] == 0 && data[2] == 0 && data[3] == 0) r.skip(4);
    uint8_t tag = 0, flags = 0, urlLength = 0;
    ByteReader es(nullptr, 0), config(nullptr, 0), inner(nullptr, 0);
    if (!readDescriptor(&r, &tag, &es) || tag != 0x03) return false;
    if (!es.skip(2) || !es.u8(&flags)) return false;
    if ((flags & 0x80) && !es.skip(2)) return false;
    if ((flags & 0x40) && !(es.u8(&urlLength) && es.skip(urlLength))) return false;
    if ((flags & 0x20) && !es.skip(2)) return false;
    while (readDescriptor(&es, &tag, &config)) {
        if (tag != 0x04) continue;
        if (!config.skip(13)) return false;
        while (readDescriptor(&config, &tag, &inner)) {
            if (tag == 0x05 && inner.remaining() > 0) {
                asc->assign(inner.current(), inner.current() + inner.remaining());
                return true;
            }
        }
        return false;
    }
    return false;
}

bool Mp4ParseAsc(const uint8_t* asc, size_t size, uint32_t* sampleRate, uint32_t* channels) {
    static const uint32_t kRates[] = {96000, 88200, 64000, 48000, 44100, 32000, 24000,
                                      22050, 16000, 12000, 11025, 8000,  7350};
    uint64_t bits = 0;
    size_t have = 0;
    for (size_t i = 0; i < size && i < 8; ++i, have += 8) bits = (bits << 8) | asc[i];
    size_t pos = 0;
    auto take = [&](size_t n, uint32_t* v) {
        if (pos + n > have) return false;
        *v = static_cast<uint32_t>((bits >> (have - pos - n)) & ((uint64_t(1) << n) - 1));
        pos += n;
        return true;
    };
    uint32_t objectType = 0, index = 0, rate = 0, config = 0;
    if (!take(5, &objectType)) return false;
    if (objectType == 31 && !take(6, &objectType)) return false;
    if (!take(4, &index)) return false;
    if (index == 15) {
        if (!take(24, &rate)) return false;
    } else if (index < sizeof(kRates) / sizeof(kRates[0])) {
        rate = kRates[index];
    } else {
        return false;
    }
    if (!take(4, &config) || rate == 0) return false;
    *sampleRate = rate;
    *channels = config == 7 ? 8 : config;
    return true;
}

}  // namespace android
