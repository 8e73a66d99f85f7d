#include "flac/FlacStreamHeader.h"

#include <cstring>

namespace android {

namespace {
const uint8_t kMarker[4] = {'f', 'L', 'a', 'C'};

uint32_t be24(const uint8_t* p) { return (uint32_t(p[0]) << 16) | (uint32_t(p[1]) << 8) | p[2]; }
}  // namespace

bool FlacStreamInfo::parse(const uint8_t* p, size_t size, FlacStreamInfo* out) {
    if (size < kBodyBytes) return false;
    FlacStreamInfo s;
    s.minBlockSize = (uint32_t(p[0]) << 8) | p[1];
    s.maxBlockSize = (uint32_t(p[2]) << 8) | p[3];
    s.minFrameSize = be24(p + 4);
    s.maxFrameSize = be24(p + 7);
    s.sampleRate = (uint32_t(p[10]) << 12) | (uint32_t(p[11]) << 4) | (p[12] >> 4);
    s.channels = ((p[12] >> 1) & 0x07) + 1;
    s.bitsPerSample = (((p[12] & 1) << 4) | (p[13] >> 4)) + 1;
    s.totalSamples = (uint64_t(p[13] & 0x0F) << 32) | (uint64_t(p[14]) << 24) | (uint64_t(p[15]) << 16) |
                     (uint64_t(p[16]) << 8) | p[17];
    memcpy(s.md5, p + 18, 16);
    if (s.sampleRate == 0) return false;
    *out = s;
    return true;
}

void FlacStreamInfo::serialize(uint8_t p[kBodyBytes]) const {
    const uint32_t channelBits = (channels - 1) & 0x07, sampleBits = (bitsPerSample - 1) & 0x1F;
    p[0] = uint8_t(minBlockSize >> 8);
    p[1] = uint8_t(minBlockSize);
    p[2] = uint8_t(maxBlockSize >> 8);
    p[3] = uint8_t(maxBlockSize);
    for (int i = 0; i < 3; ++i) {
        p[4 + i] = uint8_t(minFrameSize >> (16 - 8 * i));
        p[7 + i] = uint8_t(maxFrameSize >> (16 - 8 * i));
    }
    p[10] = uint8_t(sampleRate >> 12);
    p[11] = uint8_t(sampleRate >> 4);
    p[12] = uint8_t(((sampleRate & 0x0F) << 4) | (channelBits << 1) | (sampleBits >> 4));
    p[13] = uint8_t(((sampleBits & 0x0F) << 4) | ((totalSamples >> 32) & 0x0F));
    for (int i = 0; i < 4; ++i) p[14 + i] = uint8_t(totalSamples >> (24 - 8 * i));
    memcpy(p + 18, md5, 16);
}

bool FlacStreamHeader::parse(const uint8_t* data, size_t size, FlacStreamHeader* out) {
    FlacStreamHeader h;
    if (data == nullptr) return false;
    if (size == FlacStreamInfo::kBodyBytes) {
        if (!FlacStreamInfo::parse(data, size, &h.info)) return false;
        *out = h;
        return true;
    }
    size_t pos = 0;
    if (size >= 4 && memcmp(data, kMarker, 4) == 0) pos = 4;
    bool haveInfo = false, sawLast = false;
    while (pos + 4 <= size) {
        const uint8_t type = data[pos] & 0x7F;
        const bool last = (data[pos] & 0x80) != 0;
        const size_t length = be24(data + pos + 1);
        pos += 4;
        if (length > size - pos) return false;
        const uint8_t* body = data + pos;
        if (!haveInfo) {
            // STREAMINFO must come first.
            if (type != kFlacStreamInfo || !FlacStreamInfo::parse(body, length, &h.info)) return false;
            haveInfo = true;
        } else if (type == kFlacVorbisComment || type == kFlacPicture) {
            h.kept.push_back({type, std::vector<uint8_t>(body, body + length)});
        }
        pos += length;
        if ((sawLast = last)) break;
    }
    // Bytes left over that cannot hold a block header: cut short.
    if (!haveInfo || (!sawLast && pos != size)) return false;
    *out = h;
    return true;
}

bool FlacStreamHeader::appendBlock(std::vector<uint8_t>* out, uint8_t type, bool last, const void* body,
                                   size_t size) {
    if (size > kMaxBlockBody) return false;
    out->push_back(uint8_t((last ? 0x80 : 0) | (type & 0x7F)));
    out->push_back(uint8_t(size >> 16));
    out->push_back(uint8_t(size >> 8));
    out->push_back(uint8_t(size));
    const uint8_t* p = static_cast<const uint8_t*>(body);
    if (size > 0) out->insert(out->end(), p, p + size);
    return true;
}

bool FlacStreamHeader::appendApplicationBlock(std::vector<uint8_t>* out, const char* id, bool last,
                                              const void* data, size_t size) {
    if (size > kMaxBlockBody - 4) return false;
    std::vector<uint8_t> body(id, id + 4);
    const uint8_t* p = static_cast<const uint8_t*>(data);
    if (size > 0) body.insert(body.end(), p, p + size);
    return appendBlock(out, kFlacApplication, last, body.data(), body.size());
}

void FlacStreamHeader::appendPaddingBlock(std::vector<uint8_t>* out, bool last, size_t bodyBytes) {
    const std::vector<uint8_t> zeros(bodyBytes, 0);
    appendBlock(out, kFlacPadding, last, zeros.data(), zeros.size());
}

}  // namespace android
