#define LOG_TAG "Mp4ConfigRecords"
#include "mpeg4/Mp4ConfigRecords.h"

#include <media/stagefright/foundation/avc_utils.h>

#include "media/CodecSpecificData.h"

namespace android {

namespace {

const uint32_t kAacRates[13] = {96000, 88200, 64000, 48000, 44100, 32000, 24000,
                                22050, 16000, 12000, 11025, 8000,  7350};

void appendAnnexB(const std::vector<NalSpan>& units, Bytes* out) {
    for (const NalSpan& u : units) {
        out->insert(out->end(), {0, 0, 0, 1});
        out->insert(out->end(), u.data, u.data + u.size);
    }
}

}  // namespace

std::vector<uint8_t> Mp4BuildAvcC(const std::vector<NalSpan>& sps, const std::vector<NalSpan>& pps) {
    Bytes stream, avcc;
    appendAnnexB(sps, &stream);
    appendAnnexB(pps, &stream);
    if (sps.empty() || pps.empty() || !annexBToAvcc(stream.data(), stream.size(), nullptr, 0, &avcc)) return {};
    const uint8_t profile = avcc[1];
    if (profile == 66 || profile == 77 || profile == 88) return avcc;
    // ISO/IEC 14496-15 5.3.3.1.2: chroma_format, bit depths, SPS extensions.
    NALBitReader r(sps[0].data + 4, sps[0].size - 4);
    parseUE(&r);  // seq_parameter_set_id
    const unsigned chroma = parseUEWithFallback(&r, 4);
    if (chroma == 3) r.skipBits(1);  // separate_colour_plane_flag
    const unsigned lumaDepth = parseUEWithFallback(&r, 8);
    const unsigned chromaDepth = parseUEWithFallback(&r, 8);
    if (chroma > 3 || lumaDepth > 7 || chromaDepth > 7 || r.overRead()) return avcc;
    avcc.insert(avcc.end(), {static_cast<uint8_t>(0xFC | chroma), static_cast<uint8_t>(0xF8 | lumaDepth),
                             static_cast<uint8_t>(0xF8 | chromaDepth), 0});
    return avcc;
}

std::vector<uint8_t> Mp4BuildHvcC(const std::vector<NalSpan>& vps, const std::vector<NalSpan>& sps,
                                  const std::vector<NalSpan>& pps) {
    Bytes stream, hvcc;
    appendAnnexB(vps, &stream);
    appendAnnexB(sps, &stream);
    appendAnnexB(pps, &stream);
    if (vps.empty() || sps.empty() || pps.empty() || !annexBToHvcc(stream.data(), stream.size(), &hvcc)) return {};
    return hvcc;
}

size_t Mp4AvcCLengthSize(const uint8_t* record, size_t size) {
    Bytes sps, pps;
    if (!avccToAnnexB(record, size, &sps, &pps)) return 0;
    const size_t lengthSize = (record[4] & 3) + 1;
    return lengthSize == 3 ? 0 : lengthSize;
}

size_t Mp4HvcCLengthSize(const uint8_t* record, size_t size) {
    Bytes units;
    if (size < 23 || record[0] != 1 || !hvccToAnnexB(record, size, &units)) return 0;
    const size_t lengthSize = (record[21] & 3) + 1;
    return lengthSize == 3 ? 0 : lengthSize;
}

bool Mp4ParseAsc(const uint8_t* asc, size_t size, uint32_t* sampleRate, uint32_t* channels) {
    ABitReader r(asc, size);
    uint32_t objectType = r.getBits(5);
    if (objectType == 31) objectType = 32 + r.getBits(6);
    const uint32_t index = r.getBits(4);
    const uint32_t rate = index == 15 ? r.getBits(24) : index < 13 ? kAacRates[index] : 0;
    const uint32_t config = r.getBits(4);
    if (r.overRead() || rate == 0) return false;
    *sampleRate = rate;
    *channels = config == 7 ? 8 : config;
    return true;
}

std::vector<uint8_t> Mp4MakeAacLcConfig(uint32_t sampleRate, uint32_t channels) {
    int index = -1;
    for (int i = 0; i < 13; ++i) {
        if (kAacRates[i] == sampleRate) index = i;
    }
    if (index < 0 || channels == 0 || channels > 7) return {};
    const uint32_t objectType = 2;
    return {static_cast<uint8_t>((objectType << 3) | (index >> 1)),
            static_cast<uint8_t>(((index & 1) << 7) | (channels << 3))};
}

}  // namespace android
