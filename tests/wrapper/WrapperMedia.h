#ifndef TESTS_WRAPPER_WRAPPER_MEDIA_H
#define TESTS_WRAPPER_WRAPPER_MEDIA_H

// Opening the sample files through the wrapper and reading what it delivers.

#include <fcntl.h>
#include <sys/stat.h>
#include <unistd.h>

#include <gtest/gtest.h>

#include "QNMediaExtractorWrapper.h"
#include "extractors/AudioMediaFacts.h"

namespace wrappertest {

using android::qnmediaeditor::QNMediaExtractorWrapper;

inline android::sp<QNMediaExtractorWrapper> OpenWrapper(const std::string& path) {
    const int fd = open(path.c_str(), O_RDONLY);
    struct stat st;
    if (fd < 0) return nullptr;
    android::sp<QNMediaExtractorWrapper> wrapper = new QNMediaExtractorWrapper;
    const bool ok = fstat(fd, &st) == 0 && wrapper->setDataSource(fd, 0, st.st_size) == android::OK;
    close(fd);  // the wrapper keeps its own
    return ok ? wrapper : nullptr;
}

struct Delivered {
    size_t track;
    int64_t timeUs;
    std::vector<uint8_t> bytes;
};

// Takes the next sample (index, time, bytes) and consumes it.
inline bool TakeSample(const android::sp<QNMediaExtractorWrapper>& wrapper, Delivered* d) {
    android::sp<android::ABuffer> buffer;
    if (wrapper->getSampleTrackIndex(&d->track) != android::OK || wrapper->getSampleTime(&d->timeUs) != android::OK ||
        wrapper->readSampleData(&buffer) != android::OK) {
        return false;
    }
    d->bytes.assign(buffer->data(), buffer->data() + buffer->size());
    return wrapper->advance() == android::OK;
}

inline std::vector<Delivered> ReadAll(const android::sp<QNMediaExtractorWrapper>& wrapper) {
    std::vector<Delivered> out;
    Delivered d;
    while (TakeSample(wrapper, &d)) out.push_back(d);
    return out;
}

inline std::vector<uint8_t> Concat(const std::vector<Delivered>& samples) {
    std::vector<uint8_t> all;
    for (const Delivered& s : samples) all.insert(all.end(), s.bytes.begin(), s.bytes.end());
    return all;
}

}  // namespace wrappertest

#endif
