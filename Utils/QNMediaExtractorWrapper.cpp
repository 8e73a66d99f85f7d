#define LOG_TAG "QNMediaExtractorWrapper"
#include "QNMediaExtractorWrapper.h"

#include <cstring>
#include <new>
#include <strings.h>
#include <vector>

#include <log/log.h>
#include <media/stagefright/FileSource.h>
#include <media/stagefright/MediaDefs.h>
#include <media/stagefright/MediaErrors.h>
#include <media/stagefright/MediaExtractorFactory.h>
#include <media/stagefright/foundation/ADebug.h>

#include "QNMediaEditorAdapter.h"
#include "QNMediaEditorDefs.h"
#include "QNMediaEditorUtils.h"

namespace android {
namespace qnmediaeditor {

namespace {

// The raw STREAMINFO metadata block (header included) of a FLAC track.
const uint32_t kKeyFlacStreamInfoRaw = 'FRAW';

const int kMaxCorruptNalRetries = 101;
const uint64_t kMaxBookmarkSize = 1000000;

// Stops a source that leaves the table; a refusal cannot be acted on here.
void stopSource(const sp<IMediaSource>& source, size_t trackIndex) {
    const status_t err = source->stop();
    if (err != OK) ALOGE("stopping track %zu failed with error %d", trackIndex, err);
}

}  // namespace

QNMediaExtractorWrapper::QNMediaExtractorWrapper()
    : mTotalBitrate(-1),
      mDurationUs(-1),
      mFlacRaw(false),
      mConvertTrackIndex(-1),
      mConvertPcmEncoding(0) {}

QNMediaExtractorWrapper::~QNMediaExtractorWrapper() {
    // The last reference is gone: no other thread can be inside.
    releaseTrackSamples();
    for (size_t i = 0; i < mSelectedTracks.size(); ++i) {
        stopSource(mSelectedTracks[i].mSource, mSelectedTracks[i].mTrackIndex);
    }
    mSelectedTracks.clear();
    mDataSource.clear();
    mExtractor.clear();
}

status_t QNMediaExtractorWrapper::setDataSource(int fd, int64_t offset, int64_t length) {
    std::lock_guard<std::mutex> lock(mLock);
    if (mExtractor != nullptr) return BAD_VALUE;
    sp<DataSource> source = new FileSource(fd, offset, length);
    const status_t err = source->initCheck();
    if (err != OK) return err;
    return attachLocked(source, MediaExtractorFactory::Create(source, nullptr));
}

status_t QNMediaExtractorWrapper::setExtractorForTest(const sp<DataSource>& source,
                                                      const sp<IMediaExtractor>& extractor) {
    std::lock_guard<std::mutex> lock(mLock);
    if (mExtractor != nullptr) return BAD_VALUE;
    return attachLocked(source, extractor);
}

status_t QNMediaExtractorWrapper::attachLocked(const sp<DataSource>& source,
                                               const sp<IMediaExtractor>& extractor) {
    mExtractor = extractor;
    if (mExtractor == nullptr) return ERROR_UNSUPPORTED;
    mDataSource = source;
    updateDurationAndBitrate();
    return OK;
}

void QNMediaExtractorWrapper::updateDurationAndBitrate() {
    mConvertTrackIndex = -1;
    mTotalBitrate = 0;
    mDurationUs = -1;
    for (size_t i = 0; i < mExtractor->countTracks(); ++i) {
        sp<MetaData> meta = mExtractor->getTrackMetaData(i, 0);
        if (meta == nullptr) {
            ALOGW("no metadata for track %zu", i);
            continue;
        }
        int32_t bitrate;
        if (meta->findInt32(kKeyBitRate, &bitrate)) {
            if (mTotalBitrate >= 0) mTotalBitrate += bitrate;
        } else {
            const char* mime;
            CHECK(meta->findCString(kKeyMIMEType, &mime));
            ALOGV("track of type '%s' does not publish bitrate", mime);
            mTotalBitrate = -1;
        }
        int64_t durationUs;
        if (meta->findInt64(kKeyDuration, &durationUs) && durationUs > mDurationUs) {
            mDurationUs = durationUs;
        }
    }
}

size_t QNMediaExtractorWrapper::countTracks() const {
    std::lock_guard<std::mutex> lock(mLock);
    return mExtractor == nullptr ? 0 : mExtractor->countTracks();
}

status_t QNMediaExtractorWrapper::getTrackFormat(size_t index, sp<AMessage>* format) {
    std::lock_guard<std::mutex> lock(mLock);
    if (format == nullptr) return BAD_VALUE;
    *format = nullptr;
    if (mExtractor == nullptr) return BAD_VALUE;
    if (index >= mExtractor->countTracks()) return -ERANGE;

    sp<MetaData> meta = mExtractor->getTrackMetaData(index, 0);
    // Our additions rewrite the metadata; keep them off the extractor's object.
    if (meta != nullptr) meta = new MetaData(*meta);

    int encoding = 0;
    if (meta != nullptr && QNMediaEditorUtils::IsNeedConvert32To24(meta, &encoding)) {
        mConvertTrackIndex = static_cast<int32_t>(index);
        mConvertPcmEncoding = encoding;
    }

    const status_t err = QNMediaEditorUtils::ConvertMetaDataToMessage(meta, format);
    if (err == OK && mFlacRaw && meta != nullptr && !makeFlacCSD(meta, format)) {
        ALOGD("not support flac raw format");
    }

    int64_t bookmarkSize;
    if (*format != nullptr && meta != nullptr && meta->findInt64(kEditorKeyBookmarkSize, &bookmarkSize)) {
        // Read as unsigned so that a negative size counts as out of bounds.
        const uint64_t size = static_cast<uint64_t>(bookmarkSize);
        if (size <= kMaxBookmarkSize) {
            (*format)->setInt32("AM-bookmarksize", static_cast<int32_t>(size));
            ALOGD("has bookmarksize %d", static_cast<int32_t>(size));
        } else {
            ALOGD("weird bookmark size %lld", static_cast<long long>(bookmarkSize));
        }
    }
    return err;
}

sp<MetaData> QNMediaExtractorWrapper::getTrackMeta(size_t index, uint32_t flags) const {
    std::lock_guard<std::mutex> lock(mLock);
    if (mExtractor == nullptr || index >= mExtractor->countTracks()) return nullptr;
    return mExtractor->getTrackMetaData(index, flags | IMediaExtractor::kIncludeExtensiveMetaData);
}

void QNMediaExtractorWrapper::releaseTrackSamples() {
    for (size_t i = 0; i < mSelectedTracks.size(); ++i) {
        TrackInfo& info = mSelectedTracks.editItemAt(i);
        if (info.mSample != nullptr) {
            info.mSample->release();
            info.mSample = nullptr;
            info.mSampleTimeUs = -1;
        }
    }
}

status_t QNMediaExtractorWrapper::getFileFormat(sp<AMessage>* format) const {
    std::lock_guard<std::mutex> lock(mLock);
    if (format == nullptr) return BAD_VALUE;
    *format = nullptr;
    if (mExtractor == nullptr) return BAD_VALUE;

    sp<MetaData> meta = mExtractor->getMetaData();
    CHECK(meta != nullptr);
    const char* mime;
    CHECK(meta->findCString(kKeyMIMEType, &mime));

    sp<AMessage> msg = new AMessage;
    *format = msg;
    msg->setString("mime", mime, -1);

    uint32_t type;
    const void* data;
    size_t size;
    const char* text;
    auto setCopy = [&msg](const char* key, const void* bytes, size_t length) {
        sp<ABuffer> buffer = ABuffer::CreateAsCopy(bytes, length);
        if (buffer != nullptr) msg->setBuffer(key, buffer);
    };
    if (meta->findData(kKeyPssh, &type, &data, &size)) setCopy("pssh", data, size);
    if (meta->findCString(kEditorKeyVideoRecordType, &text)) msg->setString("recording-type", text, -1);
    // The stored item carries one trailing byte beyond what was recorded.
    if (meta->findData(kEditorKeySphereView, &type, &data, &size) && size >= 2) {
        setCopy("uuid-data", data, size - 1);
    }
    if (meta->findData(kEditorKeyWaveForm, &type, &data, &size)) setCopy("AM-waveform1", data, size);
    if (meta->findCString(kEditorKeyUserMessage, &text)) msg->setString("qn-usermessage", text, -1);
    if (meta->findData(kEditorKeyWaveForm2, &type, &data, &size)) setCopy("AM-waveform2", data, size);
    if (meta->findCString(kEditorKeyRecMode, &text)) {
        ALOGD("vrmeta %s", text);
        msg->setString("qn-vrmeta", text, -1);
    }
    return OK;
}

bool QNMediaExtractorWrapper::makeFlacCSD(sp<MetaData> meta, sp<AMessage>* format) const {
    if (format == nullptr || *format == nullptr || meta == nullptr) {
        ALOGW("makeFlacCSD format == null");
        return false;
    }
    uint32_t type = 0;
    const void* data = nullptr;
    size_t size = 0;
    if (!meta->findData(kKeyFlacStreamInfoRaw, &type, &data, &size)) {
        ALOGW("streaminfo failed  size=%u,  minBlockSize=%d, maxBlockSize=%d ", 0u, 0, 0);
        return false;
    }
    if (size < 9) {
        ALOGW("streaminfo failed  size=%u,  minBlockSize=%d, maxBlockSize=%d ", static_cast<unsigned>(size), 0, 0);
        return false;
    }
    // FLAC STREAMINFO: minimum and maximum block size, 16 bits big-endian each,
    // right after the 4-byte metadata block header.
    const uint8_t* item = static_cast<const uint8_t*>(data);
    const int minBlockSize = item[4] * 256 + item[5];
    const int maxBlockSize = item[6] * 256 + item[7];
    if (minBlockSize == 0 || minBlockSize != maxBlockSize) {
        ALOGW("streaminfo failed  size=%u,  minBlockSize=%d, maxBlockSize=%d ", static_cast<unsigned>(size),
              minBlockSize, maxBlockSize);
        return false;
    }

    sp<ABuffer> csd = new (std::nothrow) ABuffer(size + 4);
    if (csd == nullptr || csd->base() == nullptr) return false;
    // The block becomes the only and last one of the header: its first byte
    // (last-block flag, type STREAMINFO) is cleared in the metadata as well.
    std::vector<uint8_t> block(item, item + size);
    block[0] = 0;
    meta->setData(kKeyFlacStreamInfoRaw, type, block.data(), block.size());
    memcpy(csd->base(), "fLaC", 4);
    memcpy(csd->base() + 4, block.data(), block.size());
    ALOGD("streaminfo size=%u,  minBlockSize=%d, maxBlockSize=%d ", static_cast<unsigned>(size), minBlockSize,
          minBlockSize);

    csd->setRange(0, size + 4);
    csd->meta()->setInt32("csd", 1);
    csd->meta()->setInt64("timeUs", 0);
    (*format)->setBuffer("csd-0", csd);
    (*format)->setInt32("editor-flactrim", 1);
    return true;
}

status_t QNMediaExtractorWrapper::setOutputFormatFlag(uint32_t flag) {
    if (mExtractor == nullptr) return BAD_VALUE;
    sp<IMediaExtractor> extractor = mExtractor;
    return Adapter::SetOutputFormatFlag(extractor, flag);
}

status_t QNMediaExtractorWrapper::setFlacRaw(bool raw) {
    mFlacRaw = raw;
    return OK;
}

status_t QNMediaExtractorWrapper::selectTrack(size_t index) {
    std::lock_guard<std::mutex> lock(mLock);
    if (mExtractor == nullptr) return BAD_VALUE;
    if (index >= mExtractor->countTracks()) return -ERANGE;
    for (size_t i = 0; i < mSelectedTracks.size(); ++i) {
        if (mSelectedTracks[i].mTrackIndex == index) return OK;
    }

    sp<IMediaSource> source = mExtractor->getTrack(index);
    if (source == nullptr) {
        ALOGE("no source for track %zu", index);
        return UNKNOWN_ERROR;
    }
    const status_t err = source->start(nullptr);
    if (err != OK) {
        ALOGE("starting track %zu failed with error %d", index, err);
        return err;
    }

    TrackInfo info;
    info.mSource = source;
    info.mTrackIndex = index;
    info.mFinalResult = OK;
    info.mSample = nullptr;
    info.mSampleTimeUs = -1;
    info.mTrackFlags = 0;
    mSelectedTracks.push(info);

    // The format is held while `mime`, which points into it, is compared.
    sp<MetaData> trackFormat = source->getFormat();
    const char* mime = nullptr;
    LOG_ALWAYS_FATAL_IF(trackFormat == nullptr || !trackFormat->findCString(kKeyMIMEType, &mime), "%s",
                        __FILE__ ":" LITERAL_TO_STRING(__LINE__)
                        " CHECK(source->getFormat()->findCString(kKeyMIMEType, &mime)) failed.");
    if (!strcasecmp(mime, MEDIA_MIMETYPE_AUDIO_VORBIS)) {
        mSelectedTracks.editTop().mTrackFlags |= kIsVorbis;
    }
    return OK;
}

status_t QNMediaExtractorWrapper::unselectTrack(size_t index) {
    std::lock_guard<std::mutex> lock(mLock);
    if (mExtractor == nullptr) return BAD_VALUE;
    if (index >= mExtractor->countTracks()) return -ERANGE;
    for (size_t i = 0; i < mSelectedTracks.size(); ++i) {
        TrackInfo& info = mSelectedTracks.editItemAt(i);
        if (info.mTrackIndex != index) continue;
        if (info.mSample != nullptr) {
            info.mSample->release();
            info.mSample = nullptr;
            info.mSampleTimeUs = -1;
        }
        stopSource(info.mSource, index);
        mSelectedTracks.removeAt(i);
        break;
    }
    return OK;
}

ssize_t QNMediaExtractorWrapper::fetchTrackSamples(int64_t seekTimeUs, SeekMode mode) {
    if (mSelectedTracks.isEmpty()) return -1;
    const bool seeking = seekTimeUs >= 0;
    TrackInfo* best = nullptr;
    ssize_t bestPosition = -1;
    for (size_t i = 0; i < mSelectedTracks.size(); ++i) {
        TrackInfo* info = &mSelectedTracks.editItemAt(i);
        if (seeking) {
            info->mFinalResult = OK;
            if (info->mSample != nullptr) {
                info->mSample->release();
                info->mSample = nullptr;
                info->mSampleTimeUs = -1;
            }
        } else if (info->mFinalResult != OK) {
            continue;
        }

        if (info->mSample == nullptr) {
            MediaTrack::ReadOptions options;
            if (seeking) {
                ALOGV("setSeekTo : [%lld]", static_cast<long long>(seekTimeUs));
                options.setSeekTo(seekTimeUs, mode);
            }
            status_t err = info->mSource->read(&info->mSample, &options);
            // A retry must not seek again: the source already moved.
            for (int retry = 0; err == EDITOR_ERROR_CORRUPT_NAL && retry < kMaxCorruptNalRetries; ++retry) {
                ALOGW("corrupt nal, retry");
                err = info->mSource->read(&info->mSample, nullptr);
            }
            if (err == EDITOR_ERROR_CORRUPT_NAL) {
                CHECK(info->mSample == NULL);
                info->mFinalResult = ERROR_END_OF_STREAM;
                info->mSampleTimeUs = -1;
                continue;
            }
            if (err != OK) {
                CHECK(info->mSample == NULL);
                info->mFinalResult = err;
                if (err != ERROR_END_OF_STREAM) {
                    ALOGW("read on track %zu failed with error %d", info->mTrackIndex, err);
                }
                info->mSampleTimeUs = -1;
                continue;
            }
            CHECK(info->mSample != NULL);
            CHECK(info->mSample->meta_data().findInt64( kKeyTime, &info->mSampleTimeUs));
        }

        // Strictly earlier only: at equal times the track selected first wins.
        if (best == nullptr || info->mSampleTimeUs < best->mSampleTimeUs) {
            best = info;
            bestPosition = static_cast<ssize_t>(i);
        }
    }
    return bestPosition;
}

status_t QNMediaExtractorWrapper::seekTo(int64_t timeUs, SeekMode mode) {
    std::lock_guard<std::mutex> lock(mLock);
    if (fetchTrackSamples(timeUs, mode) < 0) return ERROR_END_OF_STREAM;
    return OK;
}

status_t QNMediaExtractorWrapper::advance() {
    std::lock_guard<std::mutex> lock(mLock);
    const ssize_t position = fetchTrackSamples();
    if (position < 0) return ERROR_END_OF_STREAM;
    TrackInfo& info = mSelectedTracks.editItemAt(position);
    info.mSample->release();
    info.mSample = nullptr;
    info.mSampleTimeUs = -1;
    return OK;
}

size_t QNMediaExtractorWrapper::sampleSize(const TrackInfo& info) const {
    size_t size = info.mSample->range_length();
    if (info.mTrackFlags & kIsVorbis) size += sizeof(int32_t);
    return size;
}

bool QNMediaExtractorWrapper::isConvertTrack(const TrackInfo& info) const {
    return mConvertTrackIndex >= 0 && info.mTrackIndex == static_cast<size_t>(mConvertTrackIndex);
}

size_t QNMediaExtractorWrapper::copySample(const TrackInfo& info, uint8_t* dst) const {
    MediaBufferBase* sample = info.mSample;
    const size_t length = sample->range_length();
    // An empty sample (a stored size of 0) may come without any data at all.
    if (length > 0) memcpy(dst, static_cast<const uint8_t*>(sample->data()) + sample->range_offset(), length);
    if (info.mTrackFlags & kIsVorbis) {
        // The decoder needs the page's valid-sample count; -1 when untrimmed.
        int32_t validSamples;
        if (!sample->meta_data().findInt32(kKeyValidSamples, &validSamples)) validSamples = -1;
        memcpy(dst + length, &validSamples, sizeof(validSamples));
        return length + sizeof(validSamples);
    }
    return length;
}

template <typename Buffer>
void QNMediaExtractorWrapper::deliverSample(const TrackInfo& info, const sp<Buffer>& buffer) {
    // From the base, so that the range set below covers exactly the copy.
    const size_t size = copySample(info, buffer->base());
    buffer->setRange(0, size);
    if (isConvertTrack(info)) QNMediaEditorUtils::ConvertXto24packed(buffer, mConvertPcmEncoding);
}

template <typename Buffer>
status_t QNMediaExtractorWrapper::readIntoCallerBuffer(const sp<Buffer>& buffer, bool warnWhenSmall) {
    std::lock_guard<std::mutex> lock(mLock);
    if (buffer == nullptr) return BAD_VALUE;
    const ssize_t position = fetchTrackSamples();
    if (position < 0) return ERROR_END_OF_STREAM;
    const TrackInfo& info = mSelectedTracks[position];
    const size_t size = sampleSize(info);
    if (buffer->capacity() < size) {
        if (warnWhenSmall) {
            ALOGW("capacity(%u) < samplesize(%u)", static_cast<unsigned>(buffer->capacity()),
                  static_cast<unsigned>(size));
        }
        return NO_MEMORY;
    }
    deliverSample(info, buffer);
    return OK;
}

status_t QNMediaExtractorWrapper::readSampleData(const sp<ABuffer>& buffer) {
    return readIntoCallerBuffer(buffer, true);
}

status_t QNMediaExtractorWrapper::readSampleData(const sp<MediaCodecBuffer>& buffer) {
    return readIntoCallerBuffer(buffer, false);
}

status_t QNMediaExtractorWrapper::readSampleData(sp<ABuffer>* buffer) {
    std::lock_guard<std::mutex> lock(mLock);
    const ssize_t position = fetchTrackSamples();
    if (position < 0 || buffer == nullptr) return ERROR_END_OF_STREAM;
    const TrackInfo& info = mSelectedTracks[position];
    sp<ABuffer> out = new (std::nothrow) ABuffer(sampleSize(info) + 4);
    if (out == nullptr || out->base() == nullptr) {
        ALOGW("ABuffer is null");
        return NO_MEMORY;
    }
    deliverSample(info, out);
    *buffer = out;
    return OK;
}

status_t QNMediaExtractorWrapper::getSampleTrackIndex(size_t* trackIndex) {
    std::lock_guard<std::mutex> lock(mLock);
    if (trackIndex == nullptr) return BAD_VALUE;
    const ssize_t position = fetchTrackSamples();
    if (position < 0) return ERROR_END_OF_STREAM;
    *trackIndex = mSelectedTracks[position].mTrackIndex;
    return OK;
}

status_t QNMediaExtractorWrapper::getSampleTime(int64_t* sampleTimeUs) {
    std::lock_guard<std::mutex> lock(mLock);
    if (sampleTimeUs == nullptr) return BAD_VALUE;
    const ssize_t position = fetchTrackSamples();
    if (position < 0) return ERROR_END_OF_STREAM;
    *sampleTimeUs = mSelectedTracks[position].mSampleTimeUs;
    return OK;
}

status_t QNMediaExtractorWrapper::getSampleMeta(sp<MetaData>* sampleMeta) {
    std::lock_guard<std::mutex> lock(mLock);
    if (sampleMeta == nullptr) return BAD_VALUE;
    *sampleMeta = nullptr;
    const ssize_t position = fetchTrackSamples();
    if (position < 0) return ERROR_END_OF_STREAM;
    *sampleMeta = new MetaData(mSelectedTracks[position].mSample->meta_data());
    return OK;
}

bool QNMediaExtractorWrapper::getTotalBitrate(int64_t* bitrate) const {
    if (bitrate == nullptr) return false;
    if (mTotalBitrate >= 0) {
        *bitrate = mTotalBitrate;
        return true;
    }
    // No duration, or one of 0, gives no rate.
    if (mDurationUs <= 0 || mDataSource == nullptr) return false;
    off64_t size;
    if (mDataSource->getSize(&size) != OK || size < 0) return false;
    // size * 8000000 / duration, split so that the product cannot overflow:
    // q * S + (r * S) / d is the same truncated quotient.
    const int64_t kScale = 8000000;  // bits per byte times microseconds per second
    const int64_t q = size / mDurationUs;
    const int64_t r = size % mDurationUs;
    int64_t whole, part, total;
    if (__builtin_mul_overflow(q, kScale, &whole)) return false;
    if (__builtin_mul_overflow(r, kScale, &part)) {
        part = static_cast<int64_t>(static_cast<double>(r) * kScale / mDurationUs);
    } else {
        part /= mDurationUs;
    }
    if (__builtin_add_overflow(whole, part, &total)) return false;
    *bitrate = total;
    return true;
}

}  // namespace qnmediaeditor
}  // namespace android
