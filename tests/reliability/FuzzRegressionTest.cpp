// Replays every input a fuzzer once failed on through the same harness, so
// the fix stays in the normal suite (and under the sanitizer builds).
#include <gtest/gtest.h>

#include <fcntl.h>
#include <unistd.h>

#include <map>

#include "../../fuzz/BitstreamTarget.h"
#include "../../fuzz/ExtractorTarget.h"
#include "../../fuzz/FlacConverterTarget.h"
#include "../../fuzz/MetadataTarget.h"
#include "../../fuzz/WaveformTarget.h"
#include "reliability/ReliabilitySupport.h"

using namespace reliability;

namespace {

using Harness = void (*)(const uint8_t*, size_t);

const std::map<std::string, Harness>& harnesses() {
    static const std::map<std::string, Harness> all = {
        {"fuzz_bitstream", fuzztargets::fuzzBitstream},
        {"fuzz_extractor", fuzztargets::fuzzExtractor},
        {"fuzz_flac_converter", fuzztargets::fuzzFlacConverter},
        {"fuzz_metadata", fuzztargets::fuzzMetadata},
        {"fuzz_waveform", fuzztargets::fuzzWaveform},
    };
    return all;
}

TEST(FuzzRegressionTest, EveryDirectoryNamesAHarness) {
    for (const std::string& dir : listDir(regressionsDir())) {
        EXPECT_EQ(1u, harnesses().count(dir)) << "inputs under " << dir << " would never run";
    }
}

TEST(FuzzRegressionTest, SavedInputsRunToTheEnd) {
    QuietLogs quiet;
    for (const auto& [name, harness] : harnesses()) {
        const std::string dir = regressionsDir() + "/" + name;
        for (const std::string& file : listDir(dir)) {
            SCOPED_TRACE(name + "/" + file);
            const Bytes input = readFile(dir + "/" + file);
            harness(input.data(), input.size());
        }
    }
}

// Sizes of the samples of one track, read with each of the three read forms.
std::vector<std::vector<size_t>> sampleSizes(const std::string& path, size_t track) {
    using namespace android;
    std::vector<std::vector<size_t>> sizes(3);
    for (int form = 0; form < 3; ++form) {
        const int fd = open(path.c_str(), O_RDONLY | O_CLOEXEC);
        sp<qnmediaeditor::QNMediaExtractorWrapper> w = new qnmediaeditor::QNMediaExtractorWrapper;
        const off_t length = lseek(fd, 0, SEEK_END);
        const bool open = w->setDataSource(fd, 0, length) == OK && w->selectTrack(track) == OK;
        close(fd);
        if (!open) return {};
        sp<ABuffer> own = new ABuffer(1 << 16);
        sp<MediaCodecBuffer> codec = new MediaCodecBuffer(new AMessage, new ABuffer(1 << 16));
        for (;;) {
            sp<ABuffer> fresh;
            if (form == 0 && w->readSampleData(&fresh) == OK) {
                sizes[form].push_back(fresh->size());
            } else if (form == 1 && w->readSampleData(own) == OK) {
                sizes[form].push_back(own->size());
            } else if (form == 2 && w->readSampleData(codec) == OK) {
                sizes[form].push_back(codec->size());
            } else {
                break;
            }
            w->advance();
        }
    }
    return sizes;
}

TEST(FuzzRegressionTest, AStoredSizeOfZeroGivesOneEmptySample) {
    // One audio sample size in the sample-size table set to 0.
    const std::vector<std::vector<size_t>> whole = sampleSizes(std::string(ME_TEST_MEDIA_DIR) + "/mp4/avc_aac.mp4", 1);
    const std::vector<std::vector<size_t>> damaged =
        sampleSizes(regressionsDir() + "/fuzz_extractor/mp4-zero-size-sample.mp4", 1);
    ASSERT_EQ(3u, damaged.size());
    for (int form = 0; form < 3; ++form) {
        SCOPED_TRACE("read form " + std::to_string(form));
        ASSERT_EQ(whole[form].size(), damaged[form].size());
        size_t empty = 0;
        for (size_t i = 0; i < damaged[form].size(); ++i) {
            if (damaged[form][i] == 0) {
                ++empty;
            } else {
                EXPECT_EQ(whole[form][i], damaged[form][i]) << "sample " << i;
            }
        }
        EXPECT_EQ(1u, empty);
    }
}

}  // namespace
