#define LOG_TAG "Mp4BoxWriter"
#include "mpeg4/Mp4BoxWriter.h"

#include <media/stagefright/foundation/ADebug.h>

namespace android {

Mp4BoxWriter::Mp4BoxWriter() : mSink(new MemorySink) {}

void Mp4BoxWriter::beginBox(const char type[4]) {
    mOpen.push_back(size());
    be32(0);
    fourcc(type);
}

void Mp4BoxWriter::beginFullBox(const char type[4], uint8_t version, uint32_t flags) {
    beginBox(type);
    be32((uint32_t(version) << 24) | (flags & 0xFFFFFF));
}

void Mp4BoxWriter::endBox() {
    CHECK(!mOpen.empty());
    const size_t start = mOpen.back();
    mOpen.pop_back();
    const uint64_t boxSize = size() - start;
    // Boxes built in memory hold tables and headers only, never media data.
    CHECK(boxSize <= UINT32_MAX);
    const uint8_t b[4] = {uint8_t(boxSize >> 24), uint8_t(boxSize >> 16), uint8_t(boxSize >> 8),
                          uint8_t(boxSize)};
    mSink->writeAt(static_cast<int64_t>(start), b, 4);
}

void Mp4BoxWriter::be24(uint32_t v) {
    u8(uint8_t(v >> 16));
    be16(uint16_t(v));
}

void Mp4BoxWriter::zeros(size_t count) {
    static const uint8_t kZeros[64] = {};
    while (count > 0) {
        const size_t n = count < sizeof(kZeros) ? count : sizeof(kZeros);
        bytes(kZeros, n);
        count -= n;
    }
}

void Mp4BoxWriter::leafBox(const char type[4], const void* payload, size_t size) {
    beginBox(type);
    bytes(payload, size);
    endBox();
}

status_t Mp4BoxWriter::writeTo(ByteSink* out) const {
    CHECK(mOpen.empty());
    return out->write(data().data(), data().size());
}

std::string Mp4MdatPlaceholder() {
    Mp4BoxWriter w;
    w.beginBox("free");
    w.endBox();
    w.be32(8);
    w.fourcc("mdat");
    return w.data();
}

std::string Mp4MdatHeader(uint64_t payloadBytes) {
    Mp4BoxWriter w;
    if (payloadBytes + 8 <= UINT32_MAX) {
        w.beginBox("free");
        w.endBox();
        w.be32(static_cast<uint32_t>(payloadBytes + 8));
        w.fourcc("mdat");
    } else {
        w.be32(1);
        w.fourcc("mdat");
        w.be64(payloadBytes + 16);
    }
    return w.data();
}

}  // namespace android
