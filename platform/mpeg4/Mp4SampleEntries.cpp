#define LOG_TAG "Mp4SampleEntries"
#include "mpeg4/Mp4SampleEntries.h"

#include "mpeg4/Mp4BoxWriter.h"

namespace android {

namespace {

void sampleEntryHeader(Mp4BoxWriter& w, const char type[4]) {
    w.beginBox(type);
    w.zeros(6);
    w.be16(1);  // data_reference_index
}

void audioFields(Mp4BoxWriter& w, uint16_t channels, uint32_t sampleRate) {
    w.zeros(8);
    w.be16(channels);
    w.be16(16);  // samplesize
    w.be32(0);   // pre_defined, reserved
    // 16.16 rate; rates that do not fit are read from the codec's own config.
    w.be32(sampleRate <= 0xFFFF ? sampleRate << 16 : 0);
}

// Descriptor with a one-byte-per-7-bits size (ISO/IEC 14496-1 8.3.3).
void descriptor(Mp4BoxWriter& w, uint8_t tag, size_t size) {
    w.u8(tag);
    uint8_t groups[4];
    int n = 0;
    do {
        groups[n++] = static_cast<uint8_t>(size & 0x7F);
        size >>= 7;
    } while (size > 0 && n < 4);
    while (n > 0) {
        --n;
        w.u8(static_cast<uint8_t>(groups[n] | (n > 0 ? 0x80 : 0)));
    }
}

size_t descriptorSize(size_t payload) {
    size_t lengthBytes = 1;
    while (lengthBytes < 4 && payload >= (size_t(1) << (7 * lengthBytes))) ++lengthBytes;
    return 1 + lengthBytes + payload;
}

}  // namespace

void Mp4WriteVisualEntry(Mp4BoxWriter& w, const char type[4], const char configType[4],
                         const std::vector<uint8_t>& config, uint16_t width, uint16_t height) {
    sampleEntryHeader(w, type);
    w.zeros(16);  // pre_defined, reserved
    w.be16(width);
    w.be16(height);
    w.be32(0x00480000);  // 72 dpi
    w.be32(0x00480000);
    w.be32(0);
    w.be16(1);    // frame_count
    w.zeros(32);  // compressorname
    w.be16(0x0018);
    w.be16(0xFFFF);
    w.leafBox(configType, config.data(), config.size());
    w.endBox();
}

void Mp4WriteAacEntry(Mp4BoxWriter& w, const Mp4AacEntry& e) {
    sampleEntryHeader(w, "mp4a");
    audioFields(w, e.channels, e.sampleRate);
    w.beginFullBox("esds", 0, 0);
    const size_t specific = descriptorSize(e.asc.size());
    const size_t decoderConfig = descriptorSize(13 + specific);
    const size_t slConfig = descriptorSize(1);
    descriptor(w, 0x03, 3 + decoderConfig + slConfig);
    w.be16(0);  // ES_ID
    w.u8(0);    // no dependence, URL or OCR stream
    descriptor(w, 0x04, 13 + specific);
    w.u8(0x40);  // Audio ISO/IEC 14496-3
    w.u8(0x15);  // audio stream
    w.be24(e.bufferSize > 0xFFFFFF ? 0xFFFFFF : e.bufferSize);
    w.be32(e.maxBitrate);
    w.be32(e.avgBitrate);
    descriptor(w, 0x05, e.asc.size());
    w.bytes(e.asc);
    descriptor(w, 0x06, 1);
    w.u8(0x02);  // predefined SL config for MP4 files
    w.endBox();
    w.endBox();
}

void Mp4WriteAmrEntry(Mp4BoxWriter& w, bool wideband, uint16_t modeSet) {
    sampleEntryHeader(w, wideband ? "sawb" : "samr");
    // TS 26.244 fixes channelcount at 2 and samplesize at 16 for AMR.
    audioFields(w, 2, wideband ? 16000 : 8000);
    w.beginBox("damr");
    w.fourcc("QNED");  // vendor
    w.u8(0);           // decoder_version
    w.be16(modeSet);
    w.u8(0);  // mode_change_period
    w.u8(1);  // frames_per_sample
    w.endBox();
    w.endBox();
}

}  // namespace android
