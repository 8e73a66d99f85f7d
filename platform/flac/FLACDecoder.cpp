#define LOG_TAG "FLACDecoder"
#include "flac/FLACDecoder.h"

#include <new>

#include <log/log.h>
#include <media/stagefright/MediaErrors.h>

#include "extractor/SeekPolicy.h"

namespace android {

FLACDecoder::FLACDecoder(const sp<DataSource>& source, const FlacStreamInfo& info)
    : mSource(source),
      mInfo(info),
      mOutputBits(OutputBits(info.bitsPerSample)),
      mSize(-1),
      mPosition(0),
      mReadFailed(false),
      mFrameDamaged(false),
      mDecoder(nullptr),
      mPending(nullptr) {}

FLACDecoder::~FLACDecoder() {
    dropPending();
    if (mDecoder != nullptr) {
        FLAC__stream_decoder_finish(mDecoder);
        FLAC__stream_decoder_delete(mDecoder);
    }
}

uint32_t FLACDecoder::OutputBits(uint32_t bitsPerSample) {
    return bitsPerSample <= 16 ? 16 : bitsPerSample <= 24 ? 24 : 32;
}

status_t FLACDecoder::init() {
    if (mSource->getSize(&mSize) != OK) mSize = -1;
    mDecoder = FLAC__stream_decoder_new();
    if (mDecoder == nullptr) return NO_MEMORY;
    FLAC__stream_decoder_set_md5_checking(mDecoder, false);
    const FLAC__StreamDecoderInitStatus status = FLAC__stream_decoder_init_stream(
        mDecoder, ReadCb, SeekCb, TellCb, LengthCb, EofCb, WriteCb, MetadataCb, ErrorCb, this);
    if (status != FLAC__STREAM_DECODER_INIT_STATUS_OK) {
        ALOGE("decoder init failed (%d)", status);
        return UNKNOWN_ERROR;
    }
    if (!FLAC__stream_decoder_process_until_end_of_metadata(mDecoder)) {
        ALOGW("cannot read the metadata");
        return ERROR_MALFORMED;
    }
    return OK;
}

void FLACDecoder::dropPending() {
    if (mPending != nullptr) {
        mPending->release();
        mPending = nullptr;
    }
}

status_t FLACDecoder::decodeNext(MediaBuffer** out) {
    *out = nullptr;
    // Each call consumes a block, a frame or bytes while looking for sync;
    // the end of the data ends the loop.
    while (mPending == nullptr) {
        if (FLAC__stream_decoder_get_state(mDecoder) == FLAC__STREAM_DECODER_END_OF_STREAM) {
            return ERROR_END_OF_STREAM;
        }
        mFrameDamaged = false;
        if (!FLAC__stream_decoder_process_single(mDecoder)) {
            ALOGW("decoder stopped in state %d", FLAC__stream_decoder_get_state(mDecoder));
            dropPending();
            return mReadFailed ? ERROR_IO : ERROR_MALFORMED;
        }
        if (mFrameDamaged) {
            // The decoder resynchronises; this frame is not handed out.
            dropPending();
            return ERROR_MALFORMED;
        }
    }
    *out = mPending;
    mPending = nullptr;
    return OK;
}

status_t FLACDecoder::seek(uint64_t sample) {
    dropPending();
    mFrameDamaged = false;
    if (!FLAC__stream_decoder_seek_absolute(mDecoder, sample)) {
        ALOGW("seek to sample %llu failed", (unsigned long long)sample);
        dropPending();
        // A failed seek leaves the decoder unusable until it is flushed.
        FLAC__stream_decoder_flush(mDecoder);
        return mReadFailed ? ERROR_IO : ERROR_MALFORMED;
    }
    // Sync searches during the seek are not damage; the frame holding the
    // target may already be pending.
    mFrameDamaged = false;
    return OK;
}

FLAC__StreamDecoderWriteStatus FLACDecoder::write(const FLAC__Frame* frame, const FLAC__int32* const buffer[]) {
    dropPending();
    const uint32_t channels = frame->header.channels;
    const uint32_t blockSize = frame->header.blocksize;
    // Buffers are sized from STREAMINFO; a frame that disagrees is damage.
    if (channels != mInfo.channels || frame->header.bits_per_sample != mInfo.bitsPerSample ||
        blockSize > mInfo.maxBlockSize) {
        ALOGW("frame of %u samples, %u channels, %u bits in a stream of %u, %u, %u", blockSize, channels,
              frame->header.bits_per_sample, mInfo.maxBlockSize, mInfo.channels, mInfo.bitsPerSample);
        mFrameDamaged = true;
        return FLAC__STREAM_DECODER_WRITE_STATUS_CONTINUE;
    }
    uint64_t first = frame->header.number.sample_number;
    if (frame->header.number_type == FLAC__FRAME_NUMBER_TYPE_FRAME_NUMBER) {
        first = uint64_t(frame->header.number.frame_number) * mInfo.maxBlockSize;
    }
    const uint32_t bytesPerSample = mOutputBits / 8;
    const size_t size = size_t(blockSize) * channels * bytesPerSample;
    MediaBuffer* out = new (std::nothrow) MediaBuffer(size);
    if (out == nullptr || (size > 0 && out->data() == nullptr)) {
        if (out != nullptr) out->release();
        return FLAC__STREAM_DECODER_WRITE_STATUS_ABORT;
    }
    out->add_ref();
    out->meta_data().setInt64(kKeyTime, TicksToUs(first, mInfo.sampleRate));
    out->meta_data().setInt32(kKeyIsSyncFrame, 1);
    const uint32_t shift = mOutputBits - mInfo.bitsPerSample;
    uint8_t* p = static_cast<uint8_t*>(out->data());
    for (uint32_t i = 0; i < blockSize; ++i) {
        for (uint32_t c = 0; c < channels; ++c) {
            const uint32_t v = static_cast<uint32_t>(buffer[c][i]) << shift;
            for (uint32_t b = 0; b < bytesPerSample; ++b) *p++ = static_cast<uint8_t>(v >> (8 * b));
        }
    }
    mPending = out;
    return FLAC__STREAM_DECODER_WRITE_STATUS_CONTINUE;
}

FLAC__StreamDecoderReadStatus FLACDecoder::ReadCb(const FLAC__StreamDecoder*, FLAC__byte buffer[], size_t* bytes,
                                                  void* me) {
    FLACDecoder* self = static_cast<FLACDecoder*>(me);
    const ssize_t n = self->mSource->readAt(self->mPosition, buffer, *bytes);
    if (n < 0) {
        self->mReadFailed = true;
        *bytes = 0;
        return FLAC__STREAM_DECODER_READ_STATUS_ABORT;
    }
    *bytes = static_cast<size_t>(n);
    self->mPosition += n;
    return n == 0 ? FLAC__STREAM_DECODER_READ_STATUS_END_OF_STREAM : FLAC__STREAM_DECODER_READ_STATUS_CONTINUE;
}

FLAC__StreamDecoderSeekStatus FLACDecoder::SeekCb(const FLAC__StreamDecoder*, FLAC__uint64 offset, void* me) {
    FLACDecoder* self = static_cast<FLACDecoder*>(me);
    if (offset > static_cast<FLAC__uint64>(INT64_MAX)) return FLAC__STREAM_DECODER_SEEK_STATUS_ERROR;
    self->mPosition = static_cast<off64_t>(offset);
    return FLAC__STREAM_DECODER_SEEK_STATUS_OK;
}

FLAC__StreamDecoderTellStatus FLACDecoder::TellCb(const FLAC__StreamDecoder*, FLAC__uint64* offset, void* me) {
    *offset = static_cast<FLAC__uint64>(static_cast<FLACDecoder*>(me)->mPosition);
    return FLAC__STREAM_DECODER_TELL_STATUS_OK;
}

FLAC__StreamDecoderLengthStatus FLACDecoder::LengthCb(const FLAC__StreamDecoder*, FLAC__uint64* length, void* me) {
    FLACDecoder* self = static_cast<FLACDecoder*>(me);
    if (self->mSize < 0) return FLAC__STREAM_DECODER_LENGTH_STATUS_UNSUPPORTED;
    *length = static_cast<FLAC__uint64>(self->mSize);
    return FLAC__STREAM_DECODER_LENGTH_STATUS_OK;
}

FLAC__bool FLACDecoder::EofCb(const FLAC__StreamDecoder*, void* me) {
    FLACDecoder* self = static_cast<FLACDecoder*>(me);
    return self->mSize >= 0 && self->mPosition >= self->mSize;
}

FLAC__StreamDecoderWriteStatus FLACDecoder::WriteCb(const FLAC__StreamDecoder*, const FLAC__Frame* frame,
                                                    const FLAC__int32* const buffer[], void* me) {
    return static_cast<FLACDecoder*>(me)->write(frame, buffer);
}

void FLACDecoder::ErrorCb(const FLAC__StreamDecoder*, FLAC__StreamDecoderErrorStatus status, void* me) {
    ALOGW("decoder error: %s", FLAC__StreamDecoderErrorStatusString[status]);
    static_cast<FLACDecoder*>(me)->mFrameDamaged = true;
}

}  // namespace android
