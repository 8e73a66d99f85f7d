// Compressed recordings cut short and with single bytes damaged, decoded as the
// waveform, mix and picture commands decode them: each case ends in bounded
// time with bounded heap, whatever the decoder is fed.
#include <gtest/gtest.h>

#include <string>
#include <vector>

#include "../../fuzz/DecoderTarget.h"
#include "reliability/ReliabilitySupport.h"
#include "reliability/ResourceBounds.h"

using namespace reliability;

namespace {

// Fewer cases than the extractor sweep: each one runs a codec.
constexpr size_t kCases = 24;
constexpr size_t kMaxHeapGrowth = size_t(256) << 20;

// One file of each decoder: H.264 (B-frames, 4:4:4), HEVC Main 10, AAC, MP3,
// AMR-NB and Vorbis.
const char* const kFiles[] = {"video/avc_bpyramid.mp4", "video/avc_444.mp4", "video/hevc_main10.mp4",
                              "mp4/aac.m4a",            "mp3/vbr_tags.mp3",  "audio/nb.amr",
                              "audio/stereo.ogg"};

std::vector<size_t> spread(size_t size) {
    std::vector<size_t> out;
    for (size_t i = 1; i <= kCases; ++i) out.push_back(size * i / (kCases + 1));
    return out;
}

TEST(DecoderSweepTest, CutAndDamagedRecordingsDecodeToAnEnd) {
    QuietLogs quiet;
    Watchdog watchdog(std::chrono::seconds(60));
    HeapGrowth heap;
    for (const char* name : kFiles) {
        Bytes bytes = readFile(std::string(ME_TEST_MEDIA_DIR) + "/" + name);
        ASSERT_FALSE(bytes.empty()) << name;
        for (size_t at : spread(bytes.size())) {
            watchdog.arm(std::string(name) + " cut at " + std::to_string(at));
            fuzztargets::fuzzDecoder(bytes.data(), at);
            const uint8_t kept = bytes[at];
            bytes[at] = static_cast<uint8_t>(~kept);
            watchdog.arm(std::string(name) + " byte " + std::to_string(at) + " inverted");
            fuzztargets::fuzzDecoder(bytes.data(), bytes.size());
            bytes[at] = kept;
            watchdog.disarm();
        }
        EXPECT_LE(heap.peakGrowth(), kMaxHeapGrowth) << name;
    }
}

}  // namespace
