#define LOG_TAG "MPEG4Writer"
#include "mpeg4/Mp4TrackWriter.h"

#include <cstring>

#include <log/log.h>
#include <media/stagefright/MediaDefs.h>
#include <media/stagefright/MediaErrors.h>

#include <media/stagefright/ByteSink.h>

#include "media/CodecSpecificData.h"
#include "mpeg4/Mp4BoxWriter.h"
#include "mpeg4/Mp4ConfigRecords.h"
#include "mpeg4/Mp4SampleEntries.h"

namespace android {

namespace {

constexpr size_t kMaxParameterSets = 32;
enum { kVps = 0, kSps = 1, kPps = 2 };

// Which parameter-set list a NAL unit belongs to, or -1.
int parameterSetKind(Mp4TrackWriter::Codec codec, const NalSpan& nal) {
    if (codec == Mp4TrackWriter::Codec::kAvc) {
        const int type = nal.data[0] & 0x1F;
        return type == 7 ? kSps : type == 8 ? kPps : -1;
    }
    const int type = (nal.data[0] >> 1) & 0x3F;
    return type == 32 ? kVps : type == 33 ? kSps : type == 34 ? kPps : -1;
}

std::vector<NalSpan> spans(const std::vector<std::vector<uint8_t>>& units) {
    std::vector<NalSpan> out;
    for (const auto& u : units) out.push_back({u.data(), u.size()});
    return out;
}

size_t recordLengthSize(Mp4TrackWriter::Codec codec, const uint8_t* data, size_t size) {
    return codec == Mp4TrackWriter::Codec::kAvc ? Mp4AvcCLengthSize(data, size) : Mp4HvcCLengthSize(data, size);
}

}  // namespace

std::unique_ptr<Mp4TrackWriter> Mp4TrackWriter::Create(const sp<MetaData>& format) {
    const char* mime = nullptr;
    if (format == nullptr || !format->findCString(kKeyMIMEType, &mime) || mime == nullptr) {
        ALOGE("track format without a MIME type");
        return nullptr;
    }
    Codec codec;
    if (!strcasecmp(mime, MEDIA_MIMETYPE_VIDEO_AVC)) {
        codec = Codec::kAvc;
    } else if (!strcasecmp(mime, MEDIA_MIMETYPE_VIDEO_HEVC)) {
        codec = Codec::kHevc;
    } else if (!strcasecmp(mime, MEDIA_MIMETYPE_AUDIO_AAC)) {
        codec = Codec::kAac;
    } else if (!strcasecmp(mime, MEDIA_MIMETYPE_AUDIO_AMR_NB)) {
        codec = Codec::kAmrNb;
    } else if (!strcasecmp(mime, MEDIA_MIMETYPE_AUDIO_AMR_WB)) {
        codec = Codec::kAmrWb;
    } else {
        ALOGE("cannot store %s in an MP4 file", mime);
        return nullptr;
    }
    return std::unique_ptr<Mp4TrackWriter>(new Mp4TrackWriter(codec, format));
}

Mp4TrackWriter::Mp4TrackWriter(Codec codec, const sp<MetaData>& format) : mCodec(codec) {
    format->findInt32(kKeyWidth, &mWidth);
    format->findInt32(kKeyHeight, &mHeight);
    format->findInt32(kKeyFrameRate, &mFrameRate);
    // The track's duration bounds its presentation: a trim keeps the frames
    // after its end that earlier frames refer to, and they stay hidden.
    int64_t durationUs = 0;
    if (format->findInt64(kKeyDuration, &durationUs) && durationUs > 0) mEndUs = durationUs;
    int32_t v = 0;
    if (format->findInt32(kKeySampleRate, &v) && v > 0) mSampleRate = static_cast<uint32_t>(v);
    if (format->findInt32(kKeyChannelCount, &v) && v > 0) mChannels = static_cast<uint32_t>(v);

    uint32_t type = 0;
    const void* data = nullptr;
    size_t size = 0;
    if (codec == Codec::kAvc || codec == Codec::kHevc) {
        const uint32_t key = codec == Codec::kAvc ? kKeyAVCC : kKeyHVCC;
        if (format->findData(key, &type, &data, &size)) {
            const uint8_t* bytes = static_cast<const uint8_t*>(data);
            const size_t lengthSize = recordLengthSize(codec, bytes, size);
            if (lengthSize != 0) {
                mRecord.assign(bytes, bytes + size);
                mLengthSize = lengthSize;
            } else {
                ALOGW("ignoring a malformed configuration record in the track format");
            }
        }
    } else if (codec == Codec::kAac && format->findData(kKeyESDS, &type, &data, &size)) {
        const uint8_t* asc = nullptr;
        size_t ascSize = 0;
        if (esdsDecoderSpecificInfo(static_cast<const uint8_t*>(data), size, &asc, &ascSize)) {
            mRecord.assign(asc, asc + ascSize);
        } else {
            ALOGW("ignoring an ES descriptor without AudioSpecificConfig");
        }
    }
    if (codec == Codec::kAmrNb) mSampleRate = 8000;
    if (codec == Codec::kAmrWb) mSampleRate = 16000;
    if (codec == Codec::kAac && !mRecord.empty() && (mSampleRate == 0 || mChannels == 0)) {
        uint32_t rate = 0, channels = 0;
        if (Mp4ParseAsc(mRecord.data(), mRecord.size(), &rate, &channels)) {
            if (mSampleRate == 0) mSampleRate = rate;
            if (mChannels == 0) mChannels = channels;
        }
    }
}

void Mp4TrackWriter::collectParameterSets(const std::vector<NalSpan>& nals) {
    for (const NalSpan& nal : nals) {
        const int kind = parameterSetKind(mCodec, nal);
        if (kind < 0) continue;
        auto& list = mParameterSets[kind];
        bool known = false;
        for (const auto& u : list) known = known || (u.size() == nal.size && !memcmp(u.data(), nal.data, nal.size));
        if (!known && list.size() < kMaxParameterSets) list.emplace_back(nal.data, nal.data + nal.size);
    }
}

void Mp4TrackWriter::takeConfigBuffer(const uint8_t* data, size_t size) {
    if (mCodec == Codec::kAac) {
        if (!mRecord.empty()) return;
        const uint8_t* asc = nullptr;
        size_t ascSize = 0;
        if (esdsDecoderSpecificInfo(data, size, &asc, &ascSize)) {
            mRecord.assign(asc, asc + ascSize);
        } else if (size >= 2) {
            mRecord.assign(data, data + size);
        }
        uint32_t rate = 0, channels = 0;
        if (Mp4ParseAsc(mRecord.data(), mRecord.size(), &rate, &channels)) {
            if (mSampleRate == 0) mSampleRate = rate;
            if (mChannels == 0) mChannels = channels;
        }
        return;
    }
    if (mCodec != Codec::kAvc && mCodec != Codec::kHevc) return;
    if (Mp4SplitAnnexB(data, size, &mNals)) {
        if (!mConfigFromBuffers) {
            // In-band sets picked up before the first config buffer are
            // replaced by what the config buffers say.
            for (auto& list : mParameterSets) list.clear();
            mConfigFromBuffers = true;
        }
        collectParameterSets(mNals);
        return;
    }
    const size_t lengthSize = recordLengthSize(mCodec, data, size);
    if (lengthSize != 0 && mRecord.empty()) {
        mRecord.assign(data, data + size);
        mLengthSize = lengthSize;
    } else if (lengthSize == 0) {
        ALOGW("codec config buffer of %zu bytes is neither Annex-B nor a record, ignored", size);
    }
}

void Mp4TrackWriter::toLengthPrefixed(const uint8_t* data, size_t size, Sample* out) {
    out->data = data;
    out->size = size;
    if (Mp4IsLengthPrefixed(data, size, mLengthSize)) return;
    if (!Mp4SplitAnnexB(data, size, &mNals)) {
        if (!mWarnedFraming) ALOGW("sample is neither Annex-B nor length-prefixed; stored as given");
        mWarnedFraming = true;
        return;
    }
    if (mRecord.empty() && !mConfigFromBuffers) collectParameterSets(mNals);
    size_t stored = 0;
    for (const NalSpan& nal : mNals) {
        if (!Mp4FitsLength(nal.size, mLengthSize)) {
            ALOGE("NAL unit too long for %zu-byte lengths; sample stored as given", mLengthSize);
            return;
        }
        stored += mLengthSize + nal.size;
    }
    out->nals = &mNals;
    out->size = stored;
}

status_t Mp4TrackWriter::store(ByteSink& sink, const Sample& s) const {
    if (s.nals == nullptr) return sink.write(s.data, s.size);
    for (const NalSpan& nal : *s.nals) {
        uint8_t length[4];
        for (size_t k = 0; k < mLengthSize; ++k) length[k] = static_cast<uint8_t>(nal.size >> (8 * (mLengthSize - 1 - k)));
        status_t err = sink.write(length, mLengthSize);
        if (err == OK) err = sink.write(nal.data, nal.size);
        if (err != OK) return err;
    }
    return OK;
}

bool Mp4TrackWriter::prepare(MediaBufferBase* buffer, Sample* out) {
    const uint8_t* data = static_cast<const uint8_t*>(buffer->data()) + buffer->range_offset();
    const size_t size = buffer->range_length();
    MetaDataBase& meta = buffer->meta_data();
    int32_t flag = 0;
    if (meta.findInt32(kKeyIsCodecConfig, &flag) && flag) {
        if (buffer->data() != nullptr) takeConfigBuffer(data, size);
        return false;
    }
    if (size == 0 || buffer->data() == nullptr) {
        ALOGD("empty sample skipped");
        return false;
    }
    if (!meta.findInt64(kKeyTime, &out->ptsUs)) {
        ALOGW("sample without a time skipped");
        return false;
    }
    if (!meta.findInt64(kKeyDecodingTime, &out->dtsUs)) out->dtsUs = out->ptsUs;
    out->sync = meta.findInt32(kKeyIsSyncFrame, &flag) && flag;
    if (isVideo()) {
        toLengthPrefixed(data, size, out);
    } else {
        out->data = data;
        out->size = size;
        if (mCodec == Codec::kAmrNb || mCodec == Codec::kAmrWb) {
            const unsigned frameType = (data[0] >> 3) & 0x0F;
            if (frameType <= (mCodec == Codec::kAmrNb ? 7u : 8u)) mAmrModes |= uint16_t(1u << frameType);
        }
        out->sync = true;  // every audio frame decodes on its own
    }
    if (out->size > UINT32_MAX) {
        ALOGE("sample of %zu bytes cannot be stored", out->size);
        return false;
    }
    return true;
}

void Mp4TrackWriter::record(const Sample& s, uint64_t offset, bool continuesChunk) {
    mTables.addSample(offset, static_cast<uint32_t>(s.size), s.dtsUs, s.ptsUs, s.sync, continuesChunk);
}

std::vector<uint8_t> Mp4TrackWriter::buildConfig() const {
    if (!mRecord.empty()) return mRecord;
    switch (mCodec) {
        case Codec::kAvc:
            return Mp4BuildAvcC(spans(mParameterSets[kSps]), spans(mParameterSets[kPps]));
        case Codec::kHevc:
            return Mp4BuildHvcC(spans(mParameterSets[kVps]), spans(mParameterSets[kSps]),
                                spans(mParameterSets[kPps]));
        case Codec::kAac:
            // No config given: AAC-LC at the format's rate.
            return Mp4MakeAacLcConfig(mSampleRate, mChannels);
        default:
            return {};
    }
}

int64_t Mp4TrackWriter::defaultDurationUs() const {
    switch (mCodec) {
        case Codec::kAac:
            return mSampleRate ? 1024 * 1000000LL / mSampleRate : 23220;
        case Codec::kAmrNb:
        case Codec::kAmrWb:
            return 20000;
        default:
            return mFrameRate > 0 ? 1000000LL / mFrameRate : 33333;
    }
}

status_t Mp4TrackWriter::finish() {
    if (mTables.sampleCount() == 0) return ERROR_END_OF_STREAM;
    if (mCodec == Codec::kAvc || mCodec == Codec::kHevc || mCodec == Codec::kAac) {
        mFinalConfig = buildConfig();
        if (mFinalConfig.empty()) {
            ALOGE("no codec configuration for a track of %zu samples; track left out", mTables.sampleCount());
            return ERROR_MALFORMED;
        }
    }
    // Audio counts in samples, times off that grid rounded to it: players
    // start the audio late when its edit's media time is not a whole number
    // of samples (as with a 1 MHz time scale).
    std::vector<uint32_t> candidates;
    if (isVideo()) {
        candidates = {90000, 1000000};
    } else if (mSampleRate > 0) {
        candidates = {mSampleRate};
    } else {
        candidates = {1000000};
    }
    std::vector<int64_t> dts, pts;
    mTables.times(&dts, &pts);
    Mp4TrackBounds bounds;
    bounds.endUs = mEndUs;
    bounds.startsOnSample = isVideo();
    const status_t err = mTiming.compute(dts, pts, candidates, defaultDurationUs(), bounds);
    if (err == OK && mTiming.rebuiltDecodingTimes) {
        ALOGW("decoding times out of order or after presentation; rebuilt from presentation times");
    }
    return err;
}

void Mp4TrackWriter::writeSampleEntry(Mp4BoxWriter& w) const {
    switch (mCodec) {
        case Codec::kAvc:
        case Codec::kHevc: {
            const bool avc = mCodec == Codec::kAvc;
            Mp4WriteVisualEntry(w, avc ? "avc1" : "hvc1", avc ? "avcC" : "hvcC", mFinalConfig,
                                static_cast<uint16_t>(mWidth), static_cast<uint16_t>(mHeight));
            break;
        }
        case Codec::kAac: {
            const double seconds = mTiming.timescale ? double(mTiming.mediaDuration) / mTiming.timescale : 0;
            const double bitrate = seconds > 0 ? double(mTables.totalBytes()) * 8 / seconds : 0;
            const uint32_t avg = bitrate >= double(UINT32_MAX) ? UINT32_MAX : static_cast<uint32_t>(bitrate);
            Mp4AacEntry e{mFinalConfig, mSampleRate, static_cast<uint16_t>(mChannels), avg, avg};
            Mp4WriteAacEntry(w, e);
            break;
        }
        case Codec::kAmrNb:
        case Codec::kAmrWb:
            Mp4WriteAmrEntry(w, mCodec == Codec::kAmrWb, mAmrModes);
            break;
    }
}

namespace {

// ISO/IEC 14496-12 8.3.2: {a, b, u, c, d, v, x, y, w}, 16.16 except u, v, w (2.30).
void writeMatrix(Mp4BoxWriter& w, int32_t rotation) {
    int32_t a = 0x10000, b = 0, c = 0, d = 0x10000;
    switch (rotation) {
        case 90: a = 0; b = 0x10000; c = -0x10000; d = 0; break;
        case 180: a = -0x10000; d = -0x10000; break;
        case 270: a = 0; b = -0x10000; c = 0x10000; d = 0; break;
        default: break;
    }
    const int32_t m[9] = {a, b, 0, c, d, 0, 0, 0, 0x40000000};
    for (int32_t v : m) w.be32(static_cast<uint32_t>(v));
}

}  // namespace

void Mp4TrackWriter::writeTrak(Mp4BoxWriter& w, uint32_t trackId, uint32_t movieTimescale, int32_t rotation,
                         uint32_t creationTime) const {
    const uint64_t duration = mTiming.presentedDuration(movieTimescale);
    const bool wideTrack = duration > UINT32_MAX;
    w.beginBox("trak");
    w.beginFullBox("tkhd", wideTrack ? 1 : 0, 0x000003);  // enabled, in movie
    if (wideTrack) {
        w.be64(creationTime);
        w.be64(creationTime);
        w.be32(trackId);
        w.be32(0);
        w.be64(duration);
    } else {
        w.be32(creationTime);
        w.be32(creationTime);
        w.be32(trackId);
        w.be32(0);
        w.be32(static_cast<uint32_t>(duration));
    }
    w.zeros(8);
    w.be16(0);  // layer
    w.be16(0);  // alternate_group
    w.be16(isVideo() ? 0 : 0x0100);
    w.be16(0);
    writeMatrix(w, isVideo() ? rotation : 0);
    w.be32(isVideo() ? static_cast<uint32_t>(mWidth) << 16 : 0);
    w.be32(isVideo() ? static_cast<uint32_t>(mHeight) << 16 : 0);
    w.endBox();

    mTiming.writeEdits(w, movieTimescale);

    w.beginBox("mdia");
    const bool wideMedia = mTiming.mediaDuration > UINT32_MAX;
    w.beginFullBox("mdhd", wideMedia ? 1 : 0, 0);
    if (wideMedia) {
        w.be64(creationTime);
        w.be64(creationTime);
        w.be32(mTiming.timescale);
        w.be64(mTiming.mediaDuration);
    } else {
        w.be32(creationTime);
        w.be32(creationTime);
        w.be32(mTiming.timescale);
        w.be32(static_cast<uint32_t>(mTiming.mediaDuration));
    }
    w.be16(0x55C4);  // 'und'
    w.be16(0);
    w.endBox();

    w.beginFullBox("hdlr", 0, 0);
    w.be32(0);
    w.fourcc(isVideo() ? "vide" : "soun");
    w.zeros(12);
    const char* name = isVideo() ? "VideoHandle" : "SoundHandle";
    w.bytes(name, strlen(name) + 1);
    w.endBox();

    w.beginBox("minf");
    if (isVideo()) {
        w.beginFullBox("vmhd", 0, 1);
        w.zeros(8);
    } else {
        w.beginFullBox("smhd", 0, 0);
        w.zeros(4);
    }
    w.endBox();
    w.beginBox("dinf");
    w.beginFullBox("dref", 0, 0);
    w.be32(1);
    w.beginFullBox("url ", 0, 1);  // media in this file
    w.endBox();
    w.endBox();
    w.endBox();

    w.beginBox("stbl");
    w.beginFullBox("stsd", 0, 0);
    w.be32(1);
    writeSampleEntry(w);
    w.endBox();
    mTiming.writeDecodingTimes(w);
    mTiming.writeCompositionOffsets(w);
    mTables.writeSyncSamples(w);
    mTables.writeChunks(w);
    mTables.writeSampleSizes(w);
    w.endBox();  // stbl
    w.endBox();  // minf
    w.endBox();  // mdia
    w.endBox();  // trak
}

}  // namespace android
