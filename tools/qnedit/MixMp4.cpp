#include "MixMp4.h"

#include <cstring>
#include <map>
#include <new>

#include <media/stagefright/AacEncoderSource.h>
#include <media/stagefright/MediaBuffer.h>
#include <media/stagefright/MediaDefs.h>
#include <media/stagefright/MediaErrors.h>
#include <media/stagefright/PcmConvert.h>
#include <media/stagefright/Utils.h>
#include <media/stagefright/foundation/ABuffer.h>

#include "Cli.h"
#include "DeviceItems.h"
#include "Interrupt.h"
#include "Progress.h"
#include "QNMediaMuxer.h"

using namespace android;
using namespace android::qnmediaeditor;

namespace qnedit {

namespace {

// The mixed audio as a 16-bit PCM source for the encoder.
class MixedSource : public MediaSource {
public:
    MixedSource(MixEngine& mix, int64_t durationUs) : mMix(mix), mFormat(new MetaData) {
        const PcmLayout& l = mix.layout();
        mFormat->setCString(kKeyMIMEType, MEDIA_MIMETYPE_AUDIO_RAW);
        mFormat->setInt32(kKeySampleRate, l.rate);
        mFormat->setInt32(kKeyChannelCount, l.channels);
        mFormat->setInt32(kKeyBitsPerSample, 16);
        mFormat->setInt32(kKeyPcmEncoding, kAudioEncodingPcm16bit);
        if (durationUs > 0) mFormat->setInt64(kKeyDuration, durationUs);
    }
    status_t start(MetaData*) override { return OK; }
    status_t stop() override { return OK; }
    sp<MetaData> getFormat() override { return mFormat; }

    status_t read(MediaBufferBase** buffer, const ReadOptions*) override {
        *buffer = nullptr;
        PcmChunk chunk;
        if (!mMix.next(&chunk)) return ERROR_END_OF_STREAM;
        const PcmLayout& l = mMix.layout();
        const uint8_t* data = chunk.bytes.data();
        size_t bytes = chunk.bytes.size();
        if (l.bits != 16) {
            mWide.clear();
            AppendPcm16(l.bits == 8 ? PcmSampleType::kU8 : PcmSampleType::kS24, false, &data,
                        chunk.bytes.size() / l.frameBytes(), l.channels, &mWide);
            data = reinterpret_cast<const uint8_t*>(mWide.data());
            bytes = mWide.size() * sizeof(int16_t);
        }
        MediaBuffer* out = new (std::nothrow) MediaBuffer(bytes);
        if (out == nullptr || (bytes > 0 && out->data() == nullptr)) {
            if (out != nullptr) out->release();
            return NO_MEMORY;
        }
        out->add_ref();
        if (bytes > 0) memcpy(out->data(), data, bytes);
        out->meta_data().setInt64(kKeyTime, chunk.timeUs);
        *buffer = out;
        return OK;
    }

private:
    MixEngine& mMix;
    sp<MetaData> mFormat;
    std::vector<int16_t> mWide;
};

// Holds a started encoder and stops it on every way out.
struct StartedEncoder {
    explicit StartedEncoder(const sp<AacEncoderSource>& e) : source(e) {}
    ~StartedEncoder() { source->stop(); }
    sp<AacEncoderSource> source;
};

}  // namespace

sp<QNMediaMuxer> writeMixedMp4(Input& main, MixEngine& mix, int64_t audioDurationUs, int muxFormat, OutputFile& out,
                   ReadCoverage* videoCoverage) {
    sp<AacEncoderSource> encoder = AacEncoderSource::Create(new MixedSource(mix, audioDurationUs));
    if (encoder == nullptr) inputError(out.path() + ": the mixed audio cannot be encoded as AAC");
    sp<AMessage> audioFormat;
    const sp<MetaData> encoded = encoder->getFormat();
    if (convertMetaDataToMessage(encoded, &audioFormat) != OK) inputError(out.path() + ": no AAC track format");
    int32_t delay = 0, rate = 1;
    encoded->findInt32(kKeyEncoderDelay, &delay);
    encoded->findInt32(kKeySampleRate, &rate);
    // The writer presents from 0: the priming, at negative times, is left
    // out by an edit.
    const int64_t delayUs = int64_t(delay) * 1000000 / rate;
    if (audioDurationUs > 0) audioFormat->setInt64("durationUs", audioDurationUs);

    sp<QNMediaMuxer> muxer = new QNMediaMuxer(out.fd(), static_cast<OutputFileFormat>(muxFormat));
    if (muxer->getMuxerState() != QNMediaMuxer::INITIALIZED) inputError(out.path() + ": output format not supported");
    QNMediaExtractorWrapper& w = main.wrapper();
    std::map<size_t, size_t> video;  // source track -> muxer track
    for (size_t i = 0; i < main.trackCount(); ++i) {
        if (!Input::isVideo(main.trackFormat(i))) continue;
        const ssize_t index = muxer->addTrack(main.trackFormat(i)->dup());
        if (index < 0) inputError(out.path() + ": the writer refused video track " + std::to_string(i));
        video[i] = static_cast<size_t>(index);
        w.selectTrack(i);
    }
    const ssize_t audioTrack = muxer->addTrack(audioFormat);
    if (audioTrack < 0) inputError(out.path() + ": the writer refused the AAC track");
    copyDeviceItems(main, *muxer, muxFormat, 0, -1);
    if (muxer->start() != OK) inputError(out.path() + ": cannot start writing");
    if (encoder->start() != OK) inputError(out.path() + ": cannot start the encoder");
    StartedEncoder running(encoder);

    auto write = [&](const sp<ABuffer>& buffer, size_t track, int64_t timeUs, uint32_t flags) {
        const status_t err = muxer->writeSampleData(0, buffer, track, timeUs, flags);
        if (err != OK) inputError(out.path() + ": write failed (" + describeWriteStatus(err) + ")");
    };
    Progress progress("mix", main.durationUs());
    bool videoDone = video.empty(), audioDone = false;
    MediaBufferBase* unit = nullptr;
    int64_t unitUs = 0;
    while (!videoDone || !audioDone) {
        checkInterrupted();
        if (!audioDone && unit == nullptr) {
            const status_t err = encoder->read(&unit);
            if (err == ERROR_END_OF_STREAM) {
                audioDone = true;
            } else if (err != OK) {
                inputError(out.path() + ": encoding failed (" + describeStatus(err) + ")");
            } else {
                unit->meta_data().findInt64(kKeyTime, &unitUs);
                unitUs -= delayUs;
            }
        }
        size_t source = 0;
        int64_t videoUs = 0;
        if (!videoDone && (w.getSampleTrackIndex(&source) != OK || w.getSampleTime(&videoUs) != OK)) videoDone = true;
        // Samples go in time order, so the tracks interleave as recorded.
        if (unit != nullptr && (videoDone || unitUs <= videoUs)) {
            sp<ABuffer> copy = new ABuffer(unit->range_length());
            memcpy(copy->data(), static_cast<const uint8_t*>(unit->data()) + unit->range_offset(), unit->range_length());
            unit->release();
            unit = nullptr;
            write(copy, static_cast<size_t>(audioTrack), unitUs, 1);
            progress.update(unitUs);
            continue;
        }
        if (videoDone) continue;
        videoCoverage->saw(source, videoUs);
        sp<ABuffer> buffer;
        sp<MetaData> meta;
        w.getSampleMeta(&meta);
        const status_t err = w.readSampleData(&buffer);
        if (err != OK) {
            videoCoverage->fail(videoUs, describeStatus(err));
            videoDone = true;
            continue;
        }
        int32_t sync = 0;
        const uint32_t flags = meta != nullptr && meta->findInt32(kKeyIsSyncFrame, &sync) && sync ? 1 : 0;
        write(buffer, video[source], videoUs, flags);
        if (w.advance() != OK) videoDone = true;
    }
    progress.finish();
    for (const auto& entry : video) {
        int64_t durationUs = -1;
        if (main.trackFormat(entry.first)->findInt64("durationUs", &durationUs) && durationUs > 0) {
            videoCoverage->expectReach(entry.first, durationUs);
        }
    }
    return muxer;
}

}  // namespace qnedit
