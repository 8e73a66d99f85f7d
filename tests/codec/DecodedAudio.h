#ifndef TESTS_CODEC_DECODED_AUDIO_H
#define TESTS_CODEC_DECODED_AUDIO_H

// Decoding a file's first audio track to the end, for the codec tests.

#include <cstdint>
#include <cstring>
#include <string>
#include <vector>

#include <media/stagefright/AudioDecoderSource.h>
#include <media/stagefright/FileSource.h>
#include <media/stagefright/MediaBufferBase.h>
#include <media/stagefright/MediaExtractorFactory.h>

namespace codectest {

using namespace android;

struct Decoded {
    status_t status = NO_INIT;  // what ended the reading: ERROR_END_OF_STREAM when it all decoded
    int32_t rate = 0, channels = 0;
    std::vector<int16_t> pcm;
    std::vector<int64_t> timesUs;  // of each buffer
    std::vector<size_t> offsets;   // frame where each buffer starts
};

inline sp<IMediaSource> FirstAudioTrack(const sp<DataSource>& source) {
    sp<IMediaExtractor> extractor = MediaExtractorFactory::Create(source);
    for (size_t i = 0; extractor != nullptr && i < extractor->countTracks(); ++i) {
        const char* mime = nullptr;
        if (extractor->getTrackMetaData(i)->findCString(kKeyMIMEType, &mime) && strncmp(mime, "audio/", 6) == 0) {
            return extractor->getTrack(i);
        }
    }
    return nullptr;
}

inline Decoded DecodeAll(const sp<IMediaSource>& track) {
    Decoded out;
    sp<AudioDecoderSource> decoder = AudioDecoderSource::Create(track);
    if (decoder == nullptr || (out.status = decoder->start()) != OK) return out;
    sp<MetaData> format = decoder->getFormat();
    format->findInt32(kKeySampleRate, &out.rate);
    format->findInt32(kKeyChannelCount, &out.channels);
    MediaBufferBase* buffer;
    while ((out.status = decoder->read(&buffer)) == OK) {
        int64_t t = -1;
        buffer->meta_data().findInt64(kKeyTime, &t);
        out.timesUs.push_back(t);
        out.offsets.push_back(out.pcm.size() / out.channels);
        const int16_t* p = reinterpret_cast<const int16_t*>(static_cast<const uint8_t*>(buffer->data()) +
                                                            buffer->range_offset());
        out.pcm.insert(out.pcm.end(), p, p + buffer->range_length() / 2);
        buffer->release();
    }
    decoder->stop();
    return out;
}

inline Decoded DecodeFile(const std::string& path) {
    sp<IMediaSource> track = FirstAudioTrack(new FileSource(path.c_str()));
    if (track == nullptr) return Decoded();
    return DecodeAll(track);
}

}  // namespace codectest

#endif
