#define LOG_TAG "Mp4SampleEntries"
#include "mpeg4/Mp4SampleEntries.h"

#include "media/CodecSpecificData.h"
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
    // Audio ISO/IEC 14496-3 (0x40) in an audio stream (5).
    w.bytes(makeEsds(0x40, 0x05, e.maxBitrate, e.avgBitrate, e.asc.data(), e.asc.size()));
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
