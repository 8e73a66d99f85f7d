#include <gtest/gtest.h>

#include <fcntl.h>
#include <unistd.h>

#include <cerrno>
#include <functional>

#include <media/stagefright/MediaDefs.h>
#include <media/stagefright/MediaErrors.h>

#include "extractor/Sniffers.h"
#include "muxer/MuxerTestSupport.h"
#include "writers/AudioWriterTestSupport.h"

using namespace android;
using android::qnmediaeditor::OutputFileFormat;
using android::qnmediaeditor::QNMediaMuxer;
using writertest::Bytes;

namespace {

// One output format: its track and enough samples to overrun the capped file.
struct Case {
    const char* name;
    int format;
    std::function<sp<AMessage>()> track;
    std::function<std::vector<Bytes>()> samples;
};

sp<AMessage> audioTrack(const char* mime, int32_t rate, int32_t channels) {
    sp<AMessage> f = muxertest::trackFormat(mime);
    f->setInt32("sample-rate", rate);
    f->setInt32("channel-count", channels);
    return f;
}

sp<AMessage> pcmTrack() {
    sp<AMessage> f = audioTrack(MEDIA_MIMETYPE_AUDIO_RAW, 44100, 2);
    f->setInt32("bits-per-sample", 16);
    return f;
}

std::vector<Bytes> amrFrames() {
    std::vector<Bytes> out;
    for (int i = 0; i < 2000; ++i) {
        Bytes frame(32, uint8_t(i));
        frame[0] = (7 << 3) | 0x04;  // 12.2 kbit/s
        out.push_back(frame);
    }
    return out;
}

std::vector<Bytes> pcmPieces() {
    const Bytes pcm = writertest::tone16(2, 44100);
    std::vector<Bytes> out;
    for (size_t pos = 0; pos < pcm.size(); pos += 1024) {
        out.emplace_back(pcm.begin() + pos, pcm.begin() + std::min(pos + 1024, pcm.size()));
    }
    return out;
}

// Real frames, with no stream header up front: the FLAC writer's first write
// then happens on its reader thread, mid-run. The writer does not look at
// frame numbers, so the file's frames are simply given several times.
std::vector<Bytes> flacFrames() {
    sp<IMediaExtractor> extractor = CreateFLACExtractor(audiotest::OpenMedia("b4096.flac"));
    std::vector<Bytes> out;
    if (extractor == nullptr) return out;
    extractor->setOutputFormatFlag(5);
    const std::vector<audiotest::Sample> frames = writertest::readTrack(extractor);
    for (int copy = 0; copy < 8; ++copy) {
        for (const audiotest::Sample& s : frames) out.push_back(s.bytes);
    }
    return out;
}

const Case kCases[] = {
    {"mp4", 2, [] { return audioTrack(MEDIA_MIMETYPE_AUDIO_AMR_NB, 8000, 1); }, amrFrames},
    {"amr", 11, [] { return audioTrack(MEDIA_MIMETYPE_AUDIO_AMR_NB, 8000, 1); }, amrFrames},
    {"amr-b", 12, [] { return audioTrack(MEDIA_MIMETYPE_AUDIO_AMR_NB, 8000, 1); }, amrFrames},
    {"wave", 13, pcmTrack, pcmPieces},
    {"flac-pcm", 14, pcmTrack, pcmPieces},
    {"flac-frames", 14, [] { return audioTrack(MEDIA_MIMETYPE_AUDIO_FLAC, 44100, 2); }, flacFrames},
    {"m4a", 15, [] { return audioTrack(MEDIA_MIMETYPE_AUDIO_AMR_NB, 8000, 1); }, amrFrames},
};

// Runs one muxer over `fd` to the end: every push returns (OK, or refused
// once the writer gave up), and the result is what stop() answered.
status_t writeAll(int fd, const Case& c) {
    const std::vector<Bytes> samples = c.samples();
    EXPECT_GT(samples.size(), 64u) << "more samples than a track queue holds";
    sp<QNMediaMuxer> muxer = new QNMediaMuxer(fd, static_cast<OutputFileFormat>(c.format));
    EXPECT_EQ(0, muxer->addTrack(c.track()));
    const status_t started = muxer->start();
    for (size_t i = 0; i < samples.size(); ++i) {
        sp<ABuffer> b = ABuffer::CreateAsCopy(samples[i].data(), samples[i].size());
        const status_t pushed = muxer->writeSampleData(0, b, 0, int64_t(i) * 20000, 1);
        if (pushed != OK) EXPECT_EQ(INVALID_OPERATION, pushed) << "sample " << i;
    }
    const status_t stopped = muxer->stop();
    if (started != OK) EXPECT_EQ(started, stopped) << "stop() must answer the failure start() met";
    return stopped;
}

TEST(MuxerWriteFailureTest, StopAnswersWhatTheDeviceDid) {
    // Every write to /dev/full fails with ENOSPC. /dev/null takes every
    // write, and its fsync fails with EINVAL, which is no failure.
    const std::pair<const char*, status_t> kDevices[] = {{"/dev/full", -ENOSPC}, {"/dev/null", OK}};
    for (const auto& device : kDevices) {
        for (const Case& c : kCases) {
            SCOPED_TRACE(std::string(device.first) + " " + c.name);
            const int fd = open(device.first, O_RDWR);
            ASSERT_GE(fd, 0);
            LogCapture log;
            EXPECT_EQ(device.second, writeAll(fd, c));
            close(fd);
        }
    }
}

TEST(MuxerWriteFailureTest, AFileThatStopsGrowingMidRunIsReportedWithItsCause) {
    // Each format's header fits in 32 KiB, so the failure comes while
    // samples flow.
    std::vector<std::pair<const char*, status_t>> results;
    {
        LogCapture log;
        writertest::FileSizeCap cap(32 * 1024);
        ASSERT_TRUE(cap.active());
        for (const Case& c : kCases) {
            writertest::ScratchFile file;
            results.emplace_back(c.name, writeAll(file.fd, c));
        }
    }
    for (const auto& r : results) EXPECT_EQ(-EFBIG, r.second) << r.first;
}

}  // namespace
