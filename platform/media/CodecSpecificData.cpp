#include "CodecSpecificData.h"

#include <media/stagefright/foundation/ByteReader.h>
#include <media/stagefright/foundation/avc_utils.h>

namespace android {

namespace {

const uint8_t kStartCode[4] = {0, 0, 0, 1};

void appendUnit(Bytes* out, const uint8_t* unit, size_t size) {
    out->insert(out->end(), kStartCode, kStartCode + 4);
    out->insert(out->end(), unit, unit + size);
}

void appendBE16(Bytes* out, size_t v) {
    out->push_back(static_cast<uint8_t>(v >> 8));
    out->push_back(static_cast<uint8_t>(v));
}

// count units of 16-bit length each, appended to *out behind start codes.
bool copyLengthPrefixedUnits(ByteReader* r, size_t count, Bytes* out) {
    for (size_t i = 0; i < count; ++i) {
        uint16_t length;
        if (!r->be16(&length) || !r->has(length)) return false;
        if (length > 0) appendUnit(out, r->current(), length);
        r->skip(length);
    }
    return true;
}

struct Unit {
    const uint8_t* data;
    size_t size;
};

void collectUnits(const uint8_t* data, size_t size, std::vector<Unit>* units) {
    const uint8_t* unit;
    size_t unitSize;
    while (data != nullptr && nextAnnexBUnit(&data, &size, &unit, &unitSize)) units->push_back({unit, unitSize});
}

void appendLengthPrefixedUnits(Bytes* out, const std::vector<Unit>& units) {
    for (const Unit& u : units) {
        appendBE16(out, u.size);
        out->insert(out->end(), u.data, u.data + u.size);
    }
}

// Expandable size field of ISO/IEC 14496-1 8.3.3, shortest form.
void appendDescriptorHeader(Bytes* out, uint8_t tag, size_t size) {
    out->push_back(tag);
    int groups = 1;
    while (groups < 4 && (size >> (7 * groups)) != 0) ++groups;
    for (int i = groups - 1; i >= 0; --i) {
        out->push_back(static_cast<uint8_t>(((size >> (7 * i)) & 0x7F) | (i > 0 ? 0x80 : 0)));
    }
}

// Reads a descriptor header; *body then covers exactly its payload.
bool readDescriptor(ByteReader* r, uint8_t* tag, ByteReader* body) {
    if (!r->u8(tag)) return false;
    uint32_t size = 0;
    for (int i = 0; i < 4; ++i) {
        uint8_t b;
        if (!r->u8(&b)) return false;
        size = (size << 7) | (b & 0x7F);
        if ((b & 0x80) == 0) return r->sub(size, body);
    }
    return false;
}

// Finds the first sub-descriptor with this tag among the rest of *r.
bool findDescriptor(ByteReader* r, uint8_t wanted, ByteReader* body) {
    uint8_t tag;
    while (readDescriptor(r, &tag, body)) {
        if (tag == wanted) return true;
    }
    return false;
}

}  // namespace

bool isAnnexB(const uint8_t* data, size_t size) {
    if (data == nullptr || size < 3) return false;
    if (data[0] == 0 && data[1] == 0 && data[2] == 1) return true;
    return size >= 4 && data[0] == 0 && data[1] == 0 && data[2] == 0 && data[3] == 1;
}

bool avccToAnnexB(const uint8_t* data, size_t size, Bytes* sps, Bytes* pps) {
    ByteReader r(data, size);
    uint8_t version, spsCount, ppsCount;
    if (!r.u8(&version) || version != 1 || !r.skip(4) || !r.u8(&spsCount)) return false;
    sps->clear();
    pps->clear();
    if (!copyLengthPrefixedUnits(&r, spsCount & 0x1F, sps)) return false;
    if (!r.u8(&ppsCount)) return false;
    return copyLengthPrefixedUnits(&r, ppsCount, pps);
}

bool annexBToAvcc(const uint8_t* csd0, size_t size0, const uint8_t* csd1, size_t size1, Bytes* avcc) {
    std::vector<Unit> units, sps, pps;
    collectUnits(csd0, size0, &units);
    collectUnits(csd1, size1, &units);
    for (const Unit& u : units) {
        const unsigned type = u.data[0] & 0x1F;
        if (type == 7) sps.push_back(u);
        if (type == 8) pps.push_back(u);
    }
    if (sps.empty() || pps.empty() || sps.size() > 31 || pps.size() > 255) return false;
    if (sps[0].size < 4) return false;
    for (const std::vector<Unit>* list : {&sps, &pps}) {
        for (const Unit& u : *list) {
            if (u.size > 0xFFFF) return false;
        }
    }
    avcc->assign({1, sps[0].data[1], sps[0].data[2], sps[0].data[3], 0xFF});
    avcc->push_back(static_cast<uint8_t>(0xE0 | sps.size()));
    appendLengthPrefixedUnits(avcc, sps);
    avcc->push_back(static_cast<uint8_t>(pps.size()));
    appendLengthPrefixedUnits(avcc, pps);
    return true;
}

bool hvccToAnnexB(const uint8_t* data, size_t size, Bytes* out) {
    ByteReader r(data, size);
    uint8_t arrays;
    if (!r.skip(22) || !r.u8(&arrays)) return false;
    out->clear();
    for (unsigned i = 0; i < arrays; ++i) {
        uint16_t count;
        if (!r.skip(1) || !r.be16(&count)) return false;
        if (!copyLengthPrefixedUnits(&r, count, out)) return false;
    }
    return !out->empty();
}

bool annexBToHvcc(const uint8_t* data, size_t size, Bytes* hvcc) {
    std::vector<Unit> units;
    collectUnits(data, size, &units);
    const Unit* sps = nullptr;
    std::vector<unsigned> types;  // NAL unit types in order of first appearance
    for (const Unit& u : units) {
        if (u.size < 2 || u.size > 0xFFFF) return false;
        const unsigned type = (u.data[0] >> 1) & 0x3F;
        if (type == 33 && sps == nullptr) sps = &u;
        bool seen = false;
        for (unsigned t : types) seen = seen || t == type;
        if (!seen) types.push_back(type);
    }
    if (sps == nullptr || types.size() > 255) return false;
    HEVCSPSInfo f;
    parseHEVCSPS(sps->data + 2, sps->size - 2, &f);
    hvcc->assign({1});
    hvcc->insert(hvcc->end(), f.profileTierLevel, f.profileTierLevel + 11);  // profile to constraint flags
    hvcc->push_back(f.profileTierLevel[11]);                                 // general_level_idc
    hvcc->insert(hvcc->end(), {0xF0, 0x00, 0xFC});  // no spatial segmentation, unknown parallelism
    hvcc->push_back(static_cast<uint8_t>(0xFC | (f.chromaFormatIdc & 3)));
    hvcc->push_back(static_cast<uint8_t>(0xF8 | (f.bitDepthLumaMinus8 & 7)));
    hvcc->push_back(static_cast<uint8_t>(0xF8 | (f.bitDepthChromaMinus8 & 7)));
    hvcc->insert(hvcc->end(), {0x00, 0x00});  // avgFrameRate unknown
    // constantFrameRate 0, numTemporalLayers, temporalIdNested, 4-byte lengths.
    hvcc->push_back(static_cast<uint8_t>(((f.maxSubLayersMinus1 + 1) << 3) | (f.temporalIdNesting << 2) | 3));
    hvcc->push_back(static_cast<uint8_t>(types.size()));
    for (unsigned type : types) {
        std::vector<Unit> ofType;
        for (const Unit& u : units) {
            if (((u.data[0] >> 1) & 0x3F) == type) ofType.push_back(u);
        }
        if (ofType.size() > 0xFFFF) return false;
        hvcc->push_back(static_cast<uint8_t>(0x80 | type));  // array_completeness
        appendBE16(hvcc, ofType.size());
        appendLengthPrefixedUnits(hvcc, ofType);
    }
    return true;
}

bool esdsDecoderConfig(const uint8_t* data, size_t size, EsdsConfig* out) {
    ByteReader r(data, size);
    // The esds box payload begins with version and flags; the descriptor
    // itself begins with its tag.
    if (size >= 5 && data[0] != 0x03 && data[4] == 0x03) r.skip(4);
    uint8_t tag;
    ByteReader es(nullptr, 0);
    if (!readDescriptor(&r, &tag, &es) || tag != 0x03) return false;
    uint8_t flags;
    if (!es.skip(2) || !es.u8(&flags)) return false;  // ES_ID, then the flags
    if ((flags & 0x80) && !es.skip(2)) return false;   // dependsOn_ES_ID
    if (flags & 0x40) {
        uint8_t urlLength;
        if (!es.u8(&urlLength) || !es.skip(urlLength)) return false;
    }
    if ((flags & 0x20) && !es.skip(2)) return false;  // OCR_ES_Id
    ByteReader config(nullptr, 0), info(nullptr, 0);
    uint8_t streamType;
    uint32_t bufferSize;
    EsdsConfig c;
    if (!findDescriptor(&es, 0x04, &config) || !config.u8(&c.objectTypeIndication) || !config.u8(&streamType) ||
        !config.be24(&bufferSize) || !config.be32(&c.maxBitrate) || !config.be32(&c.avgBitrate)) {
        return false;
    }
    if (findDescriptor(&config, 0x05, &info)) {
        c.dsi = info.current();
        c.dsiSize = info.size();
    }
    *out = c;
    return true;
}

bool esdsDecoderSpecificInfo(const uint8_t* data, size_t size, const uint8_t** dsi, size_t* dsiSize) {
    EsdsConfig config;
    if (!esdsDecoderConfig(data, size, &config) || config.dsi == nullptr) return false;
    *dsi = config.dsi;
    *dsiSize = config.dsiSize;
    return true;
}

Bytes makeEsds(uint8_t objectTypeIndication, uint8_t streamType, uint32_t maxBitrate, uint32_t avgBitrate,
               const uint8_t* dsi, size_t dsiSize) {
    Bytes info;
    appendDescriptorHeader(&info, 0x05, dsiSize);
    info.insert(info.end(), dsi, dsi + dsiSize);

    Bytes config;
    appendDescriptorHeader(&config, 0x04, 13 + info.size());
    config.push_back(objectTypeIndication);
    config.push_back(static_cast<uint8_t>((streamType << 2) | 1));  // upStream 0, reserved 1
    config.insert(config.end(), {0, 0, 0});                         // bufferSizeDB
    for (uint32_t v : {maxBitrate, avgBitrate}) {
        for (int shift = 24; shift >= 0; shift -= 8) config.push_back(static_cast<uint8_t>(v >> shift));
    }
    config.insert(config.end(), info.begin(), info.end());

    const uint8_t slConfig[3] = {0x06, 0x01, 0x02};  // predefined: MP4 file
    Bytes esds;
    appendDescriptorHeader(&esds, 0x03, 3 + config.size() + sizeof(slConfig));
    esds.insert(esds.end(), {0, 0, 0});  // ES_ID 0, no optional fields
    esds.insert(esds.end(), config.begin(), config.end());
    esds.insert(esds.end(), slConfig, slConfig + sizeof(slConfig));
    return esds;
}

}  // namespace android
