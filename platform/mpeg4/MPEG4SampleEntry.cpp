#define LOG_TAG "MPEG4SampleEntry"
#include "mpeg4/MPEG4SampleEntry.h"

#include <log/log.h>
#include <media/stagefright/MediaDefs.h>
#include <media/stagefright/MediaErrors.h>
#include <media/stagefright/foundation/ABitReader.h>

#include "media/CodecSpecificData.h"
#include "mpeg4/MPEG4Box.h"

namespace android {
namespace mpeg4 {

namespace {

// SampleEntry: 6 reserved bytes and the data reference index.
constexpr size_t kSampleEntryBytes = 8;
// VisualSampleEntry fields after SampleEntry, up to the first child box.
constexpr size_t kVisualEntryBytes = 70;
// AudioSampleEntry fields after SampleEntry; QuickTime sound descriptions of
// version 1 and 2 add 16 and 36 bytes.
constexpr size_t kAudioEntryBytes = 20;

status_t Malformed(const char* what) {
    ALOGW("malformed sample description: %s", what);
    return ERROR_MALFORMED;
}

bool ReadSampleRate(ABitReader* bits, int32_t* rate) {
    static const int32_t kRates[] = {96000, 88200, 64000, 48000, 44100, 32000, 24000,
                                     22050, 16000, 12000, 11025, 8000,  7350};
    uint32_t index, explicitRate;
    if (!bits->getBitsGraceful(4, &index)) return false;
    if (index == 0xF) {
        if (!bits->getBitsGraceful(24, &explicitRate)) return false;
        *rate = static_cast<int32_t>(explicitRate);
        return true;
    }
    if (index >= sizeof(kRates) / sizeof(kRates[0])) return false;
    *rate = kRates[index];
    return true;
}

// AudioSpecificConfig (ISO/IEC 14496-3, 1.6.2.1): object type, sample rate
// and channel configuration; channels is 0 when a program config element
// carries them instead.
bool ParseAudioSpecificConfig(const uint8_t* data, size_t size, int32_t* objectType, int32_t* sampleRate,
                              int32_t* channels) {
    ABitReader bits(data, size);
    uint32_t aot, channelConfig;
    if (!bits.getBitsGraceful(5, &aot)) return false;
    if (aot == 31) {
        uint32_t extension;
        if (!bits.getBitsGraceful(6, &extension)) return false;
        aot = 32 + extension;
    }
    if (!ReadSampleRate(&bits, sampleRate) || !bits.getBitsGraceful(4, &channelConfig)) return false;
    // Explicit SBR/PS signalling: the output runs at the extension rate.
    if (aot == 5 || aot == 29) {
        int32_t extensionRate;
        if (ReadSampleRate(&bits, &extensionRate)) *sampleRate = extensionRate;
    }
    static const int32_t kChannels[] = {0, 1, 2, 3, 4, 5, 6, 8};
    *objectType = static_cast<int32_t>(aot);
    *channels = channelConfig < 8 ? kChannels[channelConfig] : 0;
    return true;
}

// The ES_Descriptor of an 'esds' payload, after its version and flags.
bool ReadEsds(ByteReader esds, ByteReader* descriptor, EsdsConfig* config) {
    uint8_t version;
    uint32_t flags;
    if (!ReadFullBoxHeader(&esds, &version, &flags) ||
        !esdsDecoderConfig(esds.current(), esds.remaining(), config)) {
        return false;
    }
    *descriptor = esds;
    return true;
}

void ReadBitrateBox(const ByteReader& children, CodecInfo* info) {
    ByteReader btrt(nullptr, 0);
    uint32_t bufferSize, maxBitrate, avgBitrate;
    if (FindChild(children, FourCC('b', 't', 'r', 't'), &btrt) && btrt.be32(&bufferSize) &&
        btrt.be32(&maxBitrate) && btrt.be32(&avgBitrate)) {
        info->avgBitrate = avgBitrate;
    }
}

// ISO/IEC 14496-15: the AVC record keeps lengthSizeMinusOne in byte 4, the
// HEVC record in byte 21.
status_t ReadNalConfig(const ByteReader& children, uint32_t box, uint32_t key, uint32_t type,
                       size_t minSize, size_t lengthByte, MetaData* meta, CodecInfo* info) {
    ByteReader config(nullptr, 0);
    if (!FindChild(children, box, &config)) return Malformed("no decoder configuration record");
    const uint8_t* p = config.current();
    if (config.size() < minSize || p[0] != 1) return Malformed("bad decoder configuration record");
    info->nalLengthSize = (p[lengthByte] & 3) + 1u;
    meta->setData(key, type, p, config.size());
    return OK;
}

status_t ParseVisual(uint32_t format, ByteReader r, MetaData* meta, CodecInfo* info) {
    uint8_t fixed[kVisualEntryBytes];
    if (!r.read(fixed, sizeof(fixed))) return Malformed("short visual entry");
    meta->setInt32(kKeyWidth, (fixed[16] << 8) | fixed[17]);
    meta->setInt32(kKeyHeight, (fixed[18] << 8) | fixed[19]);
    info->isVideo = true;
    ReadBitrateBox(r, info);
    switch (format) {
        case FourCC('a', 'v', 'c', '1'):
        case FourCC('a', 'v', 'c', '3'):
            meta->setCString(kKeyMIMEType, MEDIA_MIMETYPE_VIDEO_AVC);
            return ReadNalConfig(r, FourCC('a', 'v', 'c', 'C'), kKeyAVCC, kTypeAVCC, 7, 4, meta, info);
        case FourCC('h', 'v', 'c', '1'):
        case FourCC('h', 'e', 'v', '1'):
            meta->setCString(kKeyMIMEType, MEDIA_MIMETYPE_VIDEO_HEVC);
            return ReadNalConfig(r, FourCC('h', 'v', 'c', 'C'), kKeyHVCC, kTypeHVCC, 23, 21, meta, info);
        case FourCC('m', 'p', '4', 'v'): {
            ByteReader esds(nullptr, 0), descriptor(nullptr, 0);
            EsdsConfig es;
            if (!FindChild(r, FourCC('e', 's', 'd', 's'), &esds) || !ReadEsds(esds, &descriptor, &es)) {
                return Malformed("mp4v without a usable esds");
            }
            meta->setCString(kKeyMIMEType, MEDIA_MIMETYPE_VIDEO_MPEG4);
            meta->setData(kKeyESDS, kTypeESDS, descriptor.current(), descriptor.remaining());
            if (es.avgBitrate > 0) info->avgBitrate = es.avgBitrate;
            return OK;
        }
        case FourCC('s', '2', '6', '3'):
        case FourCC('h', '2', '6', '3'):
            meta->setCString(kKeyMIMEType, MEDIA_MIMETYPE_VIDEO_H263);
            return OK;
        default:
            return ERROR_UNSUPPORTED;
    }
}

status_t ParseAac(const ByteReader& children, MetaData* meta, CodecInfo* info) {
    ByteReader esds(nullptr, 0), wave(nullptr, 0);
    if (!FindChild(children, FourCC('e', 's', 'd', 's'), &esds) &&
        !(FindChild(children, FourCC('w', 'a', 'v', 'e'), &wave) &&
          FindChild(wave, FourCC('e', 's', 'd', 's'), &esds))) {
        return Malformed("mp4a without esds");
    }
    ByteReader descriptor(nullptr, 0);
    EsdsConfig es;
    if (!ReadEsds(esds, &descriptor, &es)) return Malformed("bad esds");
    if (es.avgBitrate > 0) info->avgBitrate = es.avgBitrate;
    switch (es.objectTypeIndication) {
        case 0x40:  // MPEG-4 audio
        case 0x66:  // MPEG-2 AAC main, LC and SSR
        case 0x67:
        case 0x68: {
            int32_t aot, rate, channels;
            if (!ParseAudioSpecificConfig(es.dsi, es.dsiSize, &aot, &rate, &channels)) {
                return Malformed("bad AudioSpecificConfig");
            }
            meta->setCString(kKeyMIMEType, MEDIA_MIMETYPE_AUDIO_AAC);
            meta->setInt32(kKeyAACProfile, aot);
            meta->setInt32(kKeySampleRate, rate);
            if (channels > 0) meta->setInt32(kKeyChannelCount, channels);
            break;
        }
        case 0x69:  // MPEG-2 and MPEG-1 audio layers
        case 0x6B:
            meta->setCString(kKeyMIMEType, MEDIA_MIMETYPE_AUDIO_MPEG);
            break;
        default:
            ALOGW("audio object type 0x%02x not supported", es.objectTypeIndication);
            return ERROR_UNSUPPORTED;
    }
    meta->setData(kKeyESDS, kTypeESDS, descriptor.current(), descriptor.remaining());
    return OK;
}

status_t ParseAudio(uint32_t format, ByteReader r, MetaData* meta, CodecInfo* info) {
    uint16_t version, revision, channels, sampleSize, preDefined, reserved;
    uint32_t vendor, rate;
    if (!r.be16(&version) || !r.be16(&revision) || !r.be32(&vendor) || !r.be16(&channels) ||
        !r.be16(&sampleSize) || !r.be16(&preDefined) || !r.be16(&reserved) || !r.be32(&rate)) {
        return Malformed("short audio entry");
    }
    if ((version == 1 && !r.skip(16)) || (version == 2 && !r.skip(36))) return Malformed("short sound description");
    info->isAudio = true;
    meta->setInt32(kKeyChannelCount, channels);
    meta->setInt32(kKeySampleRate, static_cast<int32_t>(rate >> 16));
    ReadBitrateBox(r, info);
    switch (format) {
        case FourCC('m', 'p', '4', 'a'):
            return ParseAac(r, meta, info);
        case FourCC('s', 'a', 'm', 'r'):
            meta->setCString(kKeyMIMEType, MEDIA_MIMETYPE_AUDIO_AMR_NB);
            meta->setInt32(kKeyChannelCount, 1);
            meta->setInt32(kKeySampleRate, 8000);
            return OK;
        case FourCC('s', 'a', 'w', 'b'):
            meta->setCString(kKeyMIMEType, MEDIA_MIMETYPE_AUDIO_AMR_WB);
            meta->setInt32(kKeyChannelCount, 1);
            meta->setInt32(kKeySampleRate, 16000);
            return OK;
        default:
            return ERROR_UNSUPPORTED;
    }
}

}  // namespace

status_t ParseSampleDescription(ByteReader stsd, MetaData* meta, CodecInfo* info) {
    uint8_t version;
    uint32_t flags, count;
    if (!ReadFullBoxHeader(&stsd, &version, &flags) || !stsd.be32(&count) || count == 0) {
        return Malformed("empty sample description");
    }
    // Only the first description is used; samples that point at others are
    // read as if they shared it.
    BoxIterator it(stsd);
    if (!it.next()) return Malformed("no sample entry");
    const uint32_t format = it.header().type;
    ByteReader entry = it.payload();
    if (!entry.skip(kSampleEntryBytes)) return Malformed("short sample entry");
    status_t err = ERROR_UNSUPPORTED;
    switch (format) {
        case FourCC('m', 'p', '4', 'a'):
        case FourCC('s', 'a', 'm', 'r'):
        case FourCC('s', 'a', 'w', 'b'):
            err = ParseAudio(format, entry, meta, info);
            break;
        case FourCC('a', 'v', 'c', '1'):
        case FourCC('a', 'v', 'c', '3'):
        case FourCC('h', 'v', 'c', '1'):
        case FourCC('h', 'e', 'v', '1'):
        case FourCC('m', 'p', '4', 'v'):
        case FourCC('s', '2', '6', '3'):
        case FourCC('h', '2', '6', '3'):
            err = ParseVisual(format, entry, meta, info);
            break;
    }
    if (err == ERROR_UNSUPPORTED) {
        ALOGW("sample entry '%c%c%c%c' not supported", char(format >> 24), char(format >> 16),
              char(format >> 8), char(format));
    }
    return err;
}

}  // namespace mpeg4
}  // namespace android
