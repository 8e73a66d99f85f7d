#include "MixPcm.h"

#include <media/stagefright/AudioDecoderSource.h>
#include <media/stagefright/FileSource.h>
#include <media/stagefright/MediaBufferBase.h>
#include <media/stagefright/MediaDefs.h>
#include <media/stagefright/MediaErrors.h>
#include <media/stagefright/MediaExtractorFactory.h>
#include <media/stagefright/foundation/ABuffer.h>

#include "Cli.h"
#include "Input.h"

using namespace android;
using namespace android::qnmediaeditor;

namespace qnedit {

namespace {

// Decoded audio comes a codec frame at a time; the mixer and the encoder
// work better on longer runs.
constexpr size_t kDecodedChunkFrames = 8192;

size_t firstAudioTrack(const Input& in, long track) {
    if (track >= 0) return static_cast<size_t>(track);
    for (size_t i = 0; i < in.trackCount(); ++i) {
        if (Input::isAudio(in.trackFormat(i))) return i;
    }
    inputError(in.path() + ": no audio track");
}

void checkLayout(const std::string& path, const PcmLayout& l) {
    if (l.channels < 1 || l.channels > 2 || l.rate <= 0 || (l.bits != 16 && l.bits != 24 && l.bits != 8)) {
        inputError(path + ": audio must be mono or stereo, 8, 16 or 24 bit");
    }
}

// PCM as the file stores it, through the extractor wrapper.
class StoredPcm : public PcmReader {
public:
    StoredPcm(std::unique_ptr<Input> in, size_t track) : mIn(std::move(in)), mTrack(track) {
        mFormat = mIn->trackFormat(track);
        mFormat->findInt32("channel-count", &mLayout.channels);
        mFormat->findInt32("sample-rate", &mLayout.rate);
        mFormat->findInt32("bits-per-sample", &mLayout.bits);
        checkLayout(mIn->path(), mLayout);
        mDurationUs = mIn->durationUs();
        mIn->wrapper().selectTrack(track);
    }

    bool next(PcmChunk* chunk) override {
        QNMediaExtractorWrapper& w = mIn->wrapper();
        if (mEnded || w.getSampleTime(&chunk->timeUs) != OK) return end();
        mCoverage.saw(mTrack, chunk->timeUs);
        sp<ABuffer> buffer;
        const status_t err = w.readSampleData(&buffer);
        if (err != OK) {
            mCoverage.fail(chunk->timeUs, describeStatus(err));
            return end();
        }
        mCoverage.reached(mTrack, chunk->timeUs + mLayout.durationUs(buffer->size()));
        chunk->bytes.assign(buffer->data(), buffer->data() + buffer->size());
        mEnded = w.advance() != OK;
        return true;
    }

private:
    bool end() {
        if (!mEnded && mDurationUs > 0) mCoverage.expectReach(mTrack, mDurationUs);
        mEnded = true;
        return false;
    }

    std::unique_ptr<Input> mIn;
    const size_t mTrack;
    bool mEnded = false;
};

// Compressed audio through the platform's decoder; a damaged sample is
// silence there, a read that fails ends the audio as damage.
class DecodedPcm : public PcmReader {
public:
    DecodedPcm(const std::string& path, size_t track, int64_t durationUs) : mTrack(track) {
        sp<IMediaExtractor> extractor = MediaExtractorFactory::Create(new FileSource(path.c_str()));
        if (extractor != nullptr && track < extractor->countTracks()) {
            mDecoder = AudioDecoderSource::Create(extractor->getTrack(track));
        }
        if (mDecoder == nullptr) inputError(path + ": track " + std::to_string(track) + " cannot be decoded");
        const status_t err = mDecoder->start();
        if (err != OK) inputError(path + ": " + describeStatus(err));
        mStarted = true;
        const sp<MetaData> format = mDecoder->getFormat();
        format->findInt32(kKeySampleRate, &mLayout.rate);
        format->findInt32(kKeyChannelCount, &mLayout.channels);
        mLayout.bits = 16;
        if (mLayout.channels > 2) inputError(path + ": more than two channels cannot be mixed");
        checkLayout(path, mLayout);
        mDecoded = true;
        mDurationUs = durationUs;
        mFormat = new AMessage;
        mFormat->setString("mime", MEDIA_MIMETYPE_AUDIO_RAW);
        mFormat->setInt32("sample-rate", mLayout.rate);
        mFormat->setInt32("channel-count", mLayout.channels);
        mFormat->setInt32("bits-per-sample", 16);
        mFormat->setInt32("pcm-encoding", kAudioEncodingPcm16bit);
        if (durationUs > 0) mFormat->setInt64("durationUs", durationUs);
    }
    ~DecodedPcm() override {
        if (mStarted) mDecoder->stop();
    }

    bool next(PcmChunk* chunk) override {
        chunk->bytes.clear();
        const size_t want = kDecodedChunkFrames * mLayout.frameBytes();
        while (!mEnded && chunk->bytes.size() < want) {
            MediaBufferBase* buffer = nullptr;
            const status_t err = mDecoder->read(&buffer);
            if (err != OK) {
                if (err != ERROR_END_OF_STREAM) mCoverage.fail(mNextUs, describeStatus(err));
                if (mDurationUs > 0) mCoverage.expectReach(mTrack, mDurationUs);
                mEnded = true;
                break;
            }
            int64_t timeUs = mNextUs;
            buffer->meta_data().findInt64(kKeyTime, &timeUs);
            if (chunk->bytes.empty()) chunk->timeUs = timeUs;
            mCoverage.saw(mTrack, timeUs);
            const uint8_t* data = static_cast<const uint8_t*>(buffer->data()) + buffer->range_offset();
            chunk->bytes.insert(chunk->bytes.end(), data, data + buffer->range_length());
            mNextUs = timeUs + mLayout.durationUs(buffer->range_length());
            mCoverage.reached(mTrack, mNextUs);
            buffer->release();
        }
        return !chunk->bytes.empty();
    }

private:
    const size_t mTrack;
    sp<AudioDecoderSource> mDecoder;
    bool mStarted = false;
    bool mEnded = false;
    int64_t mNextUs = 0;
};

}  // namespace

std::unique_ptr<PcmReader> openPcmReader(const std::string& path, long track) {
    std::unique_ptr<Input> in(new Input(path));
    const size_t index = firstAudioTrack(*in, track);
    if (index >= in->trackCount() || !Input::isAudio(in->trackFormat(index))) {
        inputError(path + ": track " + std::to_string(index) + " is not an audio track");
    }
    const std::string mime = Input::mimeOf(in->trackFormat(index));
    if (mime == MEDIA_MIMETYPE_AUDIO_RAW) return std::unique_ptr<PcmReader>(new StoredPcm(std::move(in), index));
    if (!AudioDecoderSource::CanDecode(mime.c_str())) inputError(path + ": " + mime + " audio cannot be decoded");
    int64_t durationUs = -1;
    in->trackFormat(index)->findInt64("durationUs", &durationUs);
    return std::unique_ptr<PcmReader>(new DecodedPcm(path, index, durationUs));
}

}  // namespace qnedit
