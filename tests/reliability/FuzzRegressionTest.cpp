// Replays every input a fuzzer once failed on through the same harness, so
// the fix stays in the normal suite (and under the sanitizer builds).
#include <gtest/gtest.h>

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

}  // namespace
