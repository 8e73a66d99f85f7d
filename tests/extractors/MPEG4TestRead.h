#ifndef TESTS_MPEG4_TEST_READ_H
#define TESTS_MPEG4_TEST_READ_H

#include <gtest/gtest.h>

#include <cstdint>
#include <fstream>
#include <iterator>
#include <string>
#include <vector>

#include <media/IMediaExtractor.h>
#include <media/stagefright/FileSource.h>
#include <media/stagefright/MediaBufferBase.h>
#include <media/stagefright/MediaErrors.h>

#include "extractor/Sniffers.h"

namespace mp4test {

// The status a track source answers for a sample with a broken NAL unit.
constexpr android::status_t kCorruptNal = -1099;

inline std::string MediaPath(const std::string& name) { return std::string(ME_TEST_MEDIA_DIR) + "/mp4/" + name; }

inline std::string ReadFile(const std::string& path) {
    std::ifstream in(path, std::ios::binary);
    return std::string(std::istreambuf_iterator<char>(in), std::istreambuf_iterator<char>());
}

inline android::sp<android::IMediaExtractor> OpenBytes(const std::string& bytes) {
    return android::CreateMPEG4Extractor(new android::BufferDataSource(bytes.data(), bytes.size()));
}

struct Read {
    int64_t timeUs = 0, decodingUs = 0, targetUs = -1;
    bool sync = false;
    std::string bytes;
};

// One read; the buffer is given back before returning.
inline android::status_t ReadOne(const android::sp<android::IMediaSource>& source, Read* out,
                                 const android::MediaTrack::ReadOptions* options = nullptr) {
    using namespace android;
    MediaBufferBase* buffer = nullptr;
    const status_t err = source->read(&buffer, options);
    if (err != OK) {
        EXPECT_EQ(nullptr, buffer);
        return err;
    }
    MetaDataBase& meta = buffer->meta_data();
    int32_t sync = 0;
    EXPECT_TRUE(meta.findInt64(kKeyTime, &out->timeUs));
    EXPECT_TRUE(meta.findInt64(kKeyDecodingTime, &out->decodingUs));
    EXPECT_TRUE(meta.findInt32(kKeyIsSyncFrame, &sync));
    if (!meta.findInt64(kKeyTargetTime, &out->targetUs)) out->targetUs = -1;
    out->sync = sync != 0;
    out->bytes.assign(static_cast<const char*>(buffer->data()) + buffer->range_offset(), buffer->range_length());
    buffer->release();
    return OK;
}

// Every sample until the first failure, whose status is returned.
inline android::status_t ReadAll(const android::sp<android::IMediaSource>& source, std::vector<Read>* out,
                                 size_t limit = SIZE_MAX) {
    android::status_t err = android::OK;
    for (Read r; out->size() < limit && (err = ReadOne(source, &r)) == android::OK;) out->push_back(r);
    return err;
}

// Starts track `index` and reads it to the end, which must be `expectedEnd`.
inline std::vector<Read> ReadTrack(const android::sp<android::IMediaExtractor>& extractor, size_t index,
                                   android::status_t expectedEnd = android::ERROR_END_OF_STREAM) {
    android::sp<android::IMediaSource> source = extractor->getTrack(index);
    EXPECT_EQ(android::OK, source->start());
    std::vector<Read> samples;
    EXPECT_EQ(expectedEnd, ReadAll(source, &samples));
    return samples;
}

}  // namespace mp4test

#endif
