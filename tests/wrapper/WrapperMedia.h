#ifndef TESTS_WRAPPER_WRAPPER_MEDIA_H
#define TESTS_WRAPPER_WRAPPER_MEDIA_H

// Opening the sample files through the wrapper and reading what it delivers.

#include <fcntl.h>
#include <sys/stat.h>
#include <unistd.h>

#include <fstream>
#include <string>
#include <vector>

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

struct FactPacket {
    size_t stream;
    int64_t ptsUs;
    size_t size;
};

// The "packet STREAM PTS DTS SIZE KEY" lines of a facts file of tests/media/mp4,
// in file order, one list per stream.
inline std::vector<std::vector<FactPacket>> Mp4Packets(const std::string& name) {
    std::ifstream in(std::string(ME_TEST_MEDIA_DIR) + "/mp4/" + name + ".facts");
    std::vector<std::vector<FactPacket>> streams;
    std::string kind;
    while (in >> kind) {
        if (kind == "packet") {
            FactPacket p;
            int64_t dts;
            int key;
            in >> p.stream >> p.ptsUs >> dts >> p.size >> key;
            if (streams.size() <= p.stream) streams.resize(p.stream + 1);
            streams[p.stream].push_back(p);
        }
        in.ignore(1 << 16, '\n');
    }
    return streams;
}

// The order the wrapper delivers the selected streams in: of the streams'
// next samples the earliest, the one selected first on equal times.
inline std::vector<FactPacket> MergeOrder(const std::vector<std::vector<FactPacket>>& streams,
                                          const std::vector<size_t>& selection) {
    std::vector<FactPacket> out;
    std::vector<size_t> next(streams.size(), 0);
    for (;;) {
        const FactPacket* best = nullptr;
        for (size_t s : selection) {
            if (next[s] < streams[s].size() && (best == nullptr || streams[s][next[s]].ptsUs < best->ptsUs)) {
                best = &streams[s][next[s]];
            }
        }
        if (best == nullptr) return out;
        out.push_back(*best);
        ++next[best->stream];
    }
}

inline void ExpectDeliveredInOrder(const std::vector<FactPacket>& expected, const std::vector<Delivered>& delivered) {
    ASSERT_EQ(expected.size(), delivered.size());
    for (size_t i = 0; i < expected.size(); ++i) {
        ASSERT_EQ(expected[i].stream, delivered[i].track) << "sample " << i;
        EXPECT_NEAR(expected[i].ptsUs, delivered[i].timeUs, 1) << "sample " << i;
        EXPECT_EQ(expected[i].size, delivered[i].bytes.size()) << "sample " << i;
    }
}

}  // namespace wrappertest

#endif
