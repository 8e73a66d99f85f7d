// Track metadata <-> track format message.
//
// Plain values (both directions, copied when present):
//   kKeyMIMEType         'mime' cstring  "mime"
//   kKeyMediaLanguage    'lang' cstring  "language"
//   kKeyDuration         'dura' int64    "durationUs"
//   kKeyWidth            'widt' int32    "width"
//   kKeyHeight           'heig' int32    "height"
//   kKeyStride           'strd' int32    "stride"
//   kKeySliceHeight      'slht' int32    "slice-height"
//   kKeyDisplayWidth     'dWid' int32    "display-width"
//   kKeyDisplayHeight    'dHgt' int32    "display-height"
//   kKeySARWidth         'sarW' int32    "sar-width"
//   kKeySARHeight        'sarH' int32    "sar-height"
//   kKeyRotation         'rotA' int32    "rotation-degrees"
//   kKeyColorFormat      'colf' int32    "color-format"
//   kKeyFrameRate        'frmR' int32    "frame-rate"
//   kKeyChannelCount     '#chn' int32    "channel-count"
//   kKeyChannelMask      'chnm' int32    "channel-mask"
//   kKeySampleRate       'srte' int32    "sample-rate"
//   kKeyPcmEncoding      'PCMe' int32    "pcm-encoding"
//   kKeyBitsPerSample    'sbit' int32    "bits-per-sample"
//   device bits/sample   'bPsp' int32    "bit-per-sample"
//   kKeyBitRate          'brte' int32    "bitrate"
//   kKeyMaxBitRate       'mxBr' int32    "max-bitrate"
//   kKeyMaxInputSize     'inpS' int32    "max-input-size"
//   kKeyEncoderDelay     'encd' int32    "encoder-delay"
//   kKeyEncoderPadding   'encp' int32    "encoder-padding"
//   kKeyAACProfile       'aacp' int32    "aac-profile"
//   kKeyIsADTS           'adts' int32    "is-adts"
//   kKeyCropRect         'crop' rect     "crop"
//   kKeyHdrStaticInfo    'hdrS' data     "hdr-static-info" (buffer)
//
// Colour: the metadata holds the ISO/IEC 23001-8 code points of an MP4 'colr'
// nclx box (kKeyColorPrimaries, kKeyTransferFunction, kKeyColorMatrix) and
// its full-range flag (kKeyColorRange, 1 full, 0 limited); the message holds
// the platform codes "color-standard", "color-transfer" and "color-range".
// Values without a counterpart are left out.
//
// Codec data (metadata to message; every buffer gets "csd" = 1, "timeUs" = 0):
//   kKeyAVCC 'avcc'         -> "csd-0" sequence, "csd-1" picture parameter sets, Annex-B
//   kKeyHVCC 'hvcc'         -> "csd-0" every array of the record, Annex-B
//   kKeyESDS 'esds'         -> "csd-0" the DecoderSpecificInfo
//   kKeyVorbisInfo 'vinf'   -> "csd-0" identification header
//   kKeyVorbisBooks 'vboo'  -> "csd-1" setup header
//   kKeyFlacMetadata 'flMd' -> "csd-0" "fLaC" and the metadata blocks
// and back, chosen by "mime": AVC builds an avcC from the Annex-B units of
// "csd-0" and "csd-1"; HEVC an hvcC from "csd-0"; AAC and MPEG-4 video a
// minimal esds around "csd-0"; Vorbis and FLAC copy the buffers. An AVC or
// HEVC "csd-0" that is not Annex-B is taken to be the record itself.
//
// A malformed codec record is skipped with a warning and everything else is
// still converted: the answer stays OK, since the track remains listable and
// its consumer (a decoder or writer) is the one to refuse missing codec data.
#define LOG_TAG "Utils"
#include <media/stagefright/Utils.h>

#include <cstring>
#include <strings.h>

#include <log/log.h>
#include <media/stagefright/MediaDefs.h>
#include <media/stagefright/foundation/ABuffer.h>

#include "CodecSpecificData.h"

namespace android {

namespace {

// The device's own bits-per-sample key, carried beside kKeyBitsPerSample.
const uint32_t kKeyDeviceBitsPerSample = 'bPsp';

struct KeyName {
    uint32_t key;
    const char* name;
};

const KeyName kInt32Keys[] = {
    {kKeyWidth, "width"},
    {kKeyHeight, "height"},
    {kKeyStride, "stride"},
    {kKeySliceHeight, "slice-height"},
    {kKeyDisplayWidth, "display-width"},
    {kKeyDisplayHeight, "display-height"},
    {kKeySARWidth, "sar-width"},
    {kKeySARHeight, "sar-height"},
    {kKeyRotation, "rotation-degrees"},
    {kKeyColorFormat, "color-format"},
    {kKeyFrameRate, "frame-rate"},
    {kKeyChannelCount, "channel-count"},
    {kKeyChannelMask, "channel-mask"},
    {kKeySampleRate, "sample-rate"},
    {kKeyPcmEncoding, "pcm-encoding"},
    {kKeyBitsPerSample, "bits-per-sample"},
    {kKeyDeviceBitsPerSample, "bit-per-sample"},
    {kKeyBitRate, "bitrate"},
    {kKeyMaxBitRate, "max-bitrate"},
    {kKeyMaxInputSize, "max-input-size"},
    {kKeyEncoderDelay, "encoder-delay"},
    {kKeyEncoderPadding, "encoder-padding"},
    {kKeyAACProfile, "aac-profile"},
    {kKeyIsADTS, "is-adts"},
};
const KeyName kInt64Keys[] = {{kKeyDuration, "durationUs"}};
const KeyName kStringKeys[] = {{kKeyMIMEType, "mime"}, {kKeyMediaLanguage, "language"}};

// Platform colour codes.
enum { kRangeFull = 1, kRangeLimited = 2 };
enum {
    kStandardBT709 = 1,
    kStandardBT601_625 = 2,
    kStandardBT601_525 = 4,
    kStandardBT2020 = 6,
    kStandardBT2020Constant = 7,
    kStandardBT470M = 8,
    kStandardFilm = 9,
};

struct CodePair {
    int32_t iso;       // ISO/IEC 23001-8 code point
    int32_t platform;  // platform code
};
// First match wins in each direction, so the preferred pairing comes first.
const CodePair kTransfers[] = {{6, 3}, {1, 3}, {14, 3}, {15, 3}, {8, 1}, {13, 2},
                               {4, 4}, {5, 5}, {16, 6}, {18, 7}};
struct Standard {
    int32_t primaries, matrix, platform;
};
const Standard kStandards[] = {{1, 1, kStandardBT709},     {5, 5, kStandardBT601_625},
                               {6, 6, kStandardBT601_525}, {7, 6, kStandardBT601_525},
                               {9, 9, kStandardBT2020},    {9, 10, kStandardBT2020Constant},
                               {4, 4, kStandardBT470M},    {8, 2, kStandardFilm}};

sp<ABuffer> csdBuffer(const uint8_t* data, size_t size) {
    sp<ABuffer> buffer = ABuffer::CreateAsCopy(data, size);
    if (buffer == nullptr) return nullptr;
    buffer->meta()->setInt32("csd", 1);
    buffer->meta()->setInt64("timeUs", 0);
    return buffer;
}

void setCsd(const sp<AMessage>& msg, const char* name, const uint8_t* data, size_t size) {
    sp<ABuffer> buffer = csdBuffer(data, size);
    if (buffer == nullptr) {
        ALOGW("no memory for %s of %zu bytes", name, size);
        return;
    }
    msg->setBuffer(name, buffer);
}

void setCsd(const sp<AMessage>& msg, const char* name, const Bytes& bytes) {
    setCsd(msg, name, bytes.data(), bytes.size());
}

void colourToMessage(const MetaDataBase& meta, const sp<AMessage>& msg) {
    int32_t range, transfer, primaries, matrix = 2;
    if (meta.findInt32(kKeyColorRange, &range)) msg->setInt32("color-range", range ? kRangeFull : kRangeLimited);
    if (meta.findInt32(kKeyTransferFunction, &transfer)) {
        for (const CodePair& p : kTransfers) {
            if (p.iso == transfer) {
                msg->setInt32("color-transfer", p.platform);
                break;
            }
        }
    }
    if (meta.findInt32(kKeyColorPrimaries, &primaries)) {
        meta.findInt32(kKeyColorMatrix, &matrix);
        const Standard* found = nullptr;
        for (const Standard& s : kStandards) {
            if (s.primaries != primaries) continue;
            if (s.matrix == matrix) {
                found = &s;
                break;
            }
            if (found == nullptr) found = &s;
        }
        if (found != nullptr) msg->setInt32("color-standard", found->platform);
    }
}

void colourToMetaData(const sp<AMessage>& msg, MetaDataBase* meta) {
    int32_t range, transfer, standard;
    if (msg->findInt32("color-range", &range) && (range == kRangeFull || range == kRangeLimited)) {
        meta->setInt32(kKeyColorRange, range == kRangeFull ? 1 : 0);
    }
    if (msg->findInt32("color-transfer", &transfer)) {
        for (const CodePair& p : kTransfers) {
            if (p.platform == transfer) {
                meta->setInt32(kKeyTransferFunction, p.iso);
                break;
            }
        }
    }
    if (msg->findInt32("color-standard", &standard)) {
        for (const Standard& s : kStandards) {
            if (s.platform == standard) {
                meta->setInt32(kKeyColorPrimaries, s.primaries);
                meta->setInt32(kKeyColorMatrix, s.matrix);
                break;
            }
        }
    }
}

bool findBlob(const MetaDataBase& meta, uint32_t key, const uint8_t** data, size_t* size) {
    uint32_t type;
    const void* p;
    if (!meta.findData(key, &type, &p, size)) return false;
    *data = static_cast<const uint8_t*>(p);
    return true;
}

void codecDataToMessage(const MetaDataBase& meta, const sp<AMessage>& msg) {
    const uint8_t* data;
    size_t size;
    if (findBlob(meta, kKeyAVCC, &data, &size)) {
        Bytes sps, pps;
        if (!avccToAnnexB(data, size, &sps, &pps)) {
            ALOGW("malformed avcC of %zu bytes skipped", size);
        } else {
            setCsd(msg, "csd-0", sps);
            setCsd(msg, "csd-1", pps);
        }
    } else if (findBlob(meta, kKeyHVCC, &data, &size)) {
        Bytes units;
        if (!hvccToAnnexB(data, size, &units)) {
            ALOGW("malformed hvcC of %zu bytes skipped", size);
        } else {
            setCsd(msg, "csd-0", units);
        }
    } else if (findBlob(meta, kKeyESDS, &data, &size)) {
        const uint8_t* info;
        size_t infoSize;
        if (!esdsDecoderSpecificInfo(data, size, &info, &infoSize)) {
            ALOGW("esds of %zu bytes has no decoder specific info", size);
        } else {
            setCsd(msg, "csd-0", info, infoSize);
        }
    } else if (findBlob(meta, kKeyVorbisInfo, &data, &size)) {
        setCsd(msg, "csd-0", data, size);
        if (findBlob(meta, kKeyVorbisBooks, &data, &size)) setCsd(msg, "csd-1", data, size);
    } else if (findBlob(meta, kKeyFlacMetadata, &data, &size)) {
        setCsd(msg, "csd-0", data, size);
    }
}

bool findBufferNonNull(const sp<AMessage>& msg, const char* name, sp<ABuffer>* buffer) {
    return msg->findBuffer(name, buffer) && *buffer != nullptr;
}

void codecDataToMetaData(const sp<AMessage>& msg, const char* mime, MetaDataBase* meta) {
    sp<ABuffer> csd0, csd1;
    if (!findBufferNonNull(msg, "csd-0", &csd0)) return;
    const bool hasCsd1 = findBufferNonNull(msg, "csd-1", &csd1);
    if (!strcasecmp(mime, MEDIA_MIMETYPE_VIDEO_AVC)) {
        if (!isAnnexB(csd0->data(), csd0->size())) {
            meta->setData(kKeyAVCC, kTypeAVCC, csd0->data(), csd0->size());
            return;
        }
        Bytes avcc;
        if (!annexBToAvcc(csd0->data(), csd0->size(), hasCsd1 ? csd1->data() : nullptr, hasCsd1 ? csd1->size() : 0,
                          &avcc)) {
            ALOGW("AVC codec data without usable parameter sets skipped");
            return;
        }
        meta->setData(kKeyAVCC, kTypeAVCC, avcc.data(), avcc.size());
    } else if (!strcasecmp(mime, MEDIA_MIMETYPE_VIDEO_HEVC)) {
        if (!isAnnexB(csd0->data(), csd0->size())) {
            meta->setData(kKeyHVCC, kTypeHVCC, csd0->data(), csd0->size());
            return;
        }
        Bytes hvcc;
        if (!annexBToHvcc(csd0->data(), csd0->size(), &hvcc)) {
            ALOGW("HEVC codec data without a sequence parameter set skipped");
            return;
        }
        meta->setData(kKeyHVCC, kTypeHVCC, hvcc.data(), hvcc.size());
    } else if (!strcasecmp(mime, MEDIA_MIMETYPE_AUDIO_AAC) || !strcasecmp(mime, MEDIA_MIMETYPE_VIDEO_MPEG4)) {
        const bool audio = !strcasecmp(mime, MEDIA_MIMETYPE_AUDIO_AAC);
        int32_t maxBitrate = 0, bitrate = 0;
        msg->findInt32("max-bitrate", &maxBitrate);
        msg->findInt32("bitrate", &bitrate);
        // objectTypeIndication 0x40 (audio ISO/IEC 14496-3) or 0x20 (visual
        // ISO/IEC 14496-2); streamType 5 (audio) or 4 (visual).
        const Bytes esds = makeEsds(audio ? 0x40 : 0x20, audio ? 5 : 4, static_cast<uint32_t>(maxBitrate),
                                    static_cast<uint32_t>(bitrate), csd0->data(), csd0->size());
        meta->setData(kKeyESDS, kTypeESDS, esds.data(), esds.size());
    } else if (!strcasecmp(mime, MEDIA_MIMETYPE_AUDIO_VORBIS)) {
        meta->setData(kKeyVorbisInfo, 0, csd0->data(), csd0->size());
        if (hasCsd1) meta->setData(kKeyVorbisBooks, 0, csd1->data(), csd1->size());
    } else if (!strcasecmp(mime, MEDIA_MIMETYPE_AUDIO_FLAC)) {
        meta->setData(kKeyFlacMetadata, 0, csd0->data(), csd0->size());
    }
}

}  // namespace

status_t convertMetaDataToMessage(const MetaDataBase* meta, sp<AMessage>* format) {
    if (format == nullptr) return BAD_VALUE;
    *format = nullptr;
    if (meta == nullptr) return BAD_VALUE;
    sp<AMessage> msg = new AMessage;
    for (const KeyName& k : kStringKeys) {
        const char* s;
        if (meta->findCString(k.key, &s)) msg->setString(k.name, s, -1);
    }
    for (const KeyName& k : kInt64Keys) {
        int64_t v;
        if (meta->findInt64(k.key, &v)) msg->setInt64(k.name, v);
    }
    for (const KeyName& k : kInt32Keys) {
        int32_t v;
        if (meta->findInt32(k.key, &v)) msg->setInt32(k.name, v);
    }
    int32_t left, top, right, bottom;
    if (meta->findRect(kKeyCropRect, &left, &top, &right, &bottom)) msg->setRect("crop", left, top, right, bottom);
    colourToMessage(*meta, msg);
    const uint8_t* data;
    size_t size;
    if (findBlob(*meta, kKeyHdrStaticInfo, &data, &size)) {
        sp<ABuffer> info = ABuffer::CreateAsCopy(data, size);
        if (info != nullptr) msg->setBuffer("hdr-static-info", info);
    }
    codecDataToMessage(*meta, msg);
    *format = msg;
    return OK;
}

status_t convertMetaDataToMessage(const sp<MetaData>& meta, sp<AMessage>* format) {
    return convertMetaDataToMessage(static_cast<const MetaDataBase*>(meta.get()), format);
}

void convertMessageToMetaData(const sp<AMessage>& format, sp<MetaData>& meta) {
    if (meta == nullptr) meta = new MetaData;
    if (format == nullptr) return;
    for (const KeyName& k : kStringKeys) {
        AString s;
        if (format->findString(k.name, &s)) meta->setCString(k.key, s.c_str());
    }
    for (const KeyName& k : kInt64Keys) {
        int64_t v;
        if (format->findInt64(k.name, &v)) meta->setInt64(k.key, v);
    }
    for (const KeyName& k : kInt32Keys) {
        int32_t v;
        if (format->findInt32(k.name, &v)) meta->setInt32(k.key, v);
    }
    int32_t left, top, right, bottom;
    if (format->findRect("crop", &left, &top, &right, &bottom)) meta->setRect(kKeyCropRect, left, top, right, bottom);
    colourToMetaData(format, meta.get());
    sp<ABuffer> info;
    if (findBufferNonNull(format, "hdr-static-info", &info)) meta->setData(kKeyHdrStaticInfo, 0, info->data(), info->size());
    AString mime;
    if (format->findString("mime", &mime)) codecDataToMetaData(format, mime.c_str(), meta.get());
}

}  // namespace android
