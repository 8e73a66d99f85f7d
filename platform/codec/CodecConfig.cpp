#define LOG_TAG "CodecConfig"
#include "codec/CodecConfig.h"

#include <cstring>

#include <log/log.h>
#include <media/stagefright/MediaDefs.h>

#include "extractor/DeviceKeys.h"
#include "media/CodecSpecificData.h"

namespace android {

namespace {

bool FindBytes(const MetaData& format, uint32_t key, const uint8_t** data, size_t* size) {
    uint32_t type;
    const void* p;
    if (!format.findData(key, &type, &p, size) || *size == 0) return false;
    *data = static_cast<const uint8_t*>(p);
    return true;
}

void AppendLengthPrefixed(const uint8_t* data, size_t size, std::vector<uint8_t>* out) {
    out->push_back(static_cast<uint8_t>(size >> 8));
    out->push_back(static_cast<uint8_t>(size));
    out->insert(out->end(), data, data + size);
}

// The three Vorbis headers, each behind a 16-bit length. The stream's comment
// header is not kept with the track, and the decoder only checks its form
// (Vorbis I, 5.2.1): an empty one stands in.
bool VorbisConfig(const MetaData& format, std::vector<uint8_t>* out) {
    const uint8_t *info, *books;
    size_t infoSize, booksSize;
    if (!FindBytes(format, kKeyVorbisInfo, &info, &infoSize) || !FindBytes(format, kKeyVorbisBooks, &books, &booksSize) ||
        infoSize > 0xffff || booksSize > 0xffff) {
        return false;
    }
    static const uint8_t kComment[] = {3, 'v', 'o', 'r', 'b', 'i', 's', 0, 0, 0, 0, 0, 0, 0, 0, 1};
    AppendLengthPrefixed(info, infoSize, out);
    AppendLengthPrefixed(kComment, sizeof(kComment), out);
    AppendLengthPrefixed(books, booksSize, out);
    return true;
}

// STREAMINFO, either behind "fLaC" with the other blocks or as one block
// with its 4-byte header.
bool FlacConfig(const MetaData& format, std::vector<uint8_t>* out) {
    const uint8_t* data;
    size_t size;
    constexpr size_t kStreamInfo = 34, kBlockHeader = 4;
    if (FindBytes(format, kKeyFlacMetadata, &data, &size) && size >= 4 + kBlockHeader + kStreamInfo &&
        memcmp(data, "fLaC", 4) == 0) {
        out->assign(data + 4 + kBlockHeader, data + 4 + kBlockHeader + kStreamInfo);
        return true;
    }
    if (FindBytes(format, kKeyFlacStreamInfoRaw, &data, &size) && size == kBlockHeader + kStreamInfo) {
        out->assign(data + kBlockHeader, data + size);
        return true;
    }
    return false;
}

bool AacConfig(const MetaData& format, const char* mime, std::vector<uint8_t>* out) {
    int32_t adts = 0;
    if (strcmp(mime, MEDIA_MIMETYPE_AUDIO_AAC_ADTS) == 0 || (format.findInt32(kKeyIsADTS, &adts) && adts != 0)) {
        return true;  // every frame carries its own header
    }
    const uint8_t *esds, *dsi;
    size_t esdsSize, dsiSize;
    if (!FindBytes(format, kKeyESDS, &esds, &esdsSize) || !esdsDecoderSpecificInfo(esds, esdsSize, &dsi, &dsiSize) ||
        dsiSize == 0) {
        return false;
    }
    out->assign(dsi, dsi + dsiSize);
    return true;
}

}  // namespace

AudioCodec AudioCodecForMime(const char* mime) {
    if (mime == nullptr) return AudioCodec::kNone;
    static const struct {
        const char* const* mime;
        AudioCodec codec;
    } kTable[] = {
        {&MEDIA_MIMETYPE_AUDIO_AAC, AudioCodec::kAac},       {&MEDIA_MIMETYPE_AUDIO_AAC_ADTS, AudioCodec::kAac},
        {&MEDIA_MIMETYPE_AUDIO_AMR_NB, AudioCodec::kAmrNb},  {&MEDIA_MIMETYPE_AUDIO_AMR_WB, AudioCodec::kAmrWb},
        {&MEDIA_MIMETYPE_AUDIO_VORBIS, AudioCodec::kVorbis}, {&MEDIA_MIMETYPE_AUDIO_MPEG, AudioCodec::kMp3},
        {&MEDIA_MIMETYPE_AUDIO_FLAC, AudioCodec::kFlac},
    };
    for (const auto& entry : kTable) {
        if (strcasecmp(mime, *entry.mime) == 0) return entry.codec;
    }
    return AudioCodec::kNone;
}

bool ReadAudioCodecConfig(const MetaData& format, AudioCodecConfig* config) {
    const char* mime = nullptr;
    format.findCString(kKeyMIMEType, &mime);
    config->codec = AudioCodecForMime(mime);
    format.findInt32(kKeySampleRate, &config->sampleRate);
    format.findInt32(kKeyChannelCount, &config->channels);
    bool ok = true;
    switch (config->codec) {
        case AudioCodec::kNone:
            ALOGW("no decoder for %s", mime != nullptr ? mime : "a track without a MIME type");
            return false;
        case AudioCodec::kAac: ok = AacConfig(format, mime, &config->extradata); break;
        case AudioCodec::kVorbis: ok = VorbisConfig(format, &config->extradata); break;
        case AudioCodec::kFlac: ok = FlacConfig(format, &config->extradata); break;
        // AMR is mono at a fixed rate (3GPP TS 26.101 / 26.201).
        case AudioCodec::kAmrNb: config->sampleRate = 8000, config->channels = 1; break;
        case AudioCodec::kAmrWb: config->sampleRate = 16000, config->channels = 1; break;
        case AudioCodec::kMp3: break;
    }
    if (!ok) ALOGW("%s track without a usable codec configuration", mime);
    return ok;
}

VideoCodec VideoCodecForMime(const char* mime) {
    if (mime == nullptr) return VideoCodec::kNone;
    if (strcasecmp(mime, MEDIA_MIMETYPE_VIDEO_AVC) == 0) return VideoCodec::kAvc;
    if (strcasecmp(mime, MEDIA_MIMETYPE_VIDEO_HEVC) == 0) return VideoCodec::kHevc;
    return VideoCodec::kNone;
}

bool ReadVideoCodecConfig(const MetaData& format, VideoCodecConfig* config) {
    const char* mime = nullptr;
    format.findCString(kKeyMIMEType, &mime);
    config->codec = VideoCodecForMime(mime);
    if (config->codec == VideoCodec::kNone) {
        ALOGW("no decoder for %s", mime != nullptr ? mime : "a track without a MIME type");
        return false;
    }
    const uint8_t* record;
    size_t size;
    if (!FindBytes(format, config->codec == VideoCodec::kAvc ? kKeyAVCC : kKeyHVCC, &record, &size)) {
        ALOGW("%s track without its decoder configuration record", mime);
        return false;
    }
    // Track samples arrive with start codes, so the parameter sets go in
    // that form too (ISO/IEC 14496-10 Annex B).
    Bytes sps, pps;
    const bool ok = config->codec == VideoCodec::kAvc ? avccToAnnexB(record, size, &sps, &pps)
                                                      : hvccToAnnexB(record, size, &sps);
    if (!ok) {
        ALOGW("%s track with a malformed decoder configuration record", mime);
        return false;
    }
    config->extradata = std::move(sps);
    config->extradata.insert(config->extradata.end(), pps.begin(), pps.end());
    return true;
}

}  // namespace android
