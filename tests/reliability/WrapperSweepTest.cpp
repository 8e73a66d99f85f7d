// Every sample file cut short at many lengths and with single bytes damaged,
// read through the extractor wrapper as the editor reads it: each case ends
// with a status, in bounded time, and the heap stays bounded.
#include <gtest/gtest.h>

#include <sys/mman.h>
#include <unistd.h>

#include <string>
#include <vector>

#include "../../fuzz/ExtractorTarget.h"
#include "reliability/ReliabilitySupport.h"
#include "reliability/ResourceBounds.h"
#include "reliability/Sanitizers.h"

using namespace android;
using namespace reliability;

namespace {

// Files up to kSmallFile bytes are cut and damaged at every offset; larger
// ones at every header byte (where most parsing happens) and then at a stride.
#if defined(TESTS_WITH_ASAN) || defined(TESTS_WITH_TSAN)
constexpr size_t kSmallFile = 2048;  // sanitized runs are several times slower
constexpr size_t kHeaderBytes = 128;
constexpr size_t kStridedCases = 200;
#else
constexpr size_t kSmallFile = 8192;
constexpr size_t kHeaderBytes = 512;
constexpr size_t kStridedCases = 1000;
#endif
constexpr int kMaxSamples = 3000;
constexpr size_t kMaxHeapGrowth = size_t(256) << 20;
constexpr size_t kMaxAllocation = size_t(64) << 20;

// The offsets a file is cut or damaged at: every one of a small file; else
// every header byte, then evenly spread over the rest.
std::vector<size_t> offsetsOf(size_t size) {
    std::vector<size_t> out;
    const size_t head = size <= kSmallFile ? size : kHeaderBytes;
    for (size_t i = 0; i < head; ++i) out.push_back(i);
    if (size > head) {
        const size_t stride = std::max<size_t>(1, (size - head) / kStridedCases);
        for (size_t i = head; i < size; i += stride) out.push_back(i);
    }
    return out;
}

// A descriptor whose content the cases change in place.
class MemFile {
public:
    explicit MemFile(const Bytes& bytes) : mFd(memfd_create("sweep", MFD_CLOEXEC)) {
        if (mFd >= 0 && !bytes.empty()) mOk = pwrite(mFd, bytes.data(), bytes.size(), 0) == ssize_t(bytes.size());
    }
    ~MemFile() {
        if (mFd >= 0) close(mFd);
    }
    bool ok() const { return mOk; }
    int fd() const { return mFd; }
    bool truncate(size_t size) { return ftruncate(mFd, static_cast<off_t>(size)) == 0; }
    bool put(size_t offset, uint8_t value) { return pwrite(mFd, &value, 1, static_cast<off_t>(offset)) == 1; }

private:
    int mFd;
    bool mOk = false;
};

class Sweep {
public:
    Sweep() : mWatchdog(std::chrono::seconds(30)) {}

    fuzztargets::WrapperRun run(const SampleFile& f, const MemFile& file, size_t length, const std::string& what) {
        mWatchdog.arm(f.name + " " + what);
        fuzztargets::WrapperRun r = fuzztargets::exerciseWrapper(file.fd(), int64_t(length), false, kMaxSamples);
        if (r.flac) fuzztargets::exerciseWrapper(file.fd(), int64_t(length), true, kMaxSamples);
        mWatchdog.disarm();
        return r;
    }

    void expectBoundedHeap(const std::string& what) {
        EXPECT_LE(mHeap.peakGrowth(), kMaxHeapGrowth) << what;
        EXPECT_LE(mHeap.largestAllocation(), kMaxAllocation) << what;
    }

private:
    QuietLogs mQuiet;
    Watchdog mWatchdog;
    HeapGrowth mHeap;
};

TEST(WrapperSweepTest, EveryFileOpensWhole) {
    // Otherwise the sweeps below would only exercise the refusal path.
    const std::vector<SampleFile> files = sampleFiles();
    ASSERT_GE(files.size(), 15u);
    Sweep sweep;
    for (const SampleFile& f : files) {
        MemFile file(f.bytes);
        ASSERT_TRUE(file.ok());
        const fuzztargets::WrapperRun r = sweep.run(f, file, f.bytes.size(), "whole");
        EXPECT_EQ(OK, r.open) << f.name;
        EXPECT_GT(r.samples, 0u) << f.name;
        EXPECT_EQ(f.flac, r.flac) << f.name << ": the raw-frame pass depends on it";
    }
}

TEST(WrapperSweepTest, PrefixesEndWithAStatusAndNeverGainSamples) {
    Sweep sweep;
    for (const SampleFile& f : sampleFiles()) {
        MemFile file(f.bytes);
        ASSERT_TRUE(file.ok());
        const size_t whole = sweep.run(f, file, f.bytes.size(), "whole").samples;
        std::vector<size_t> cuts = offsetsOf(f.bytes.size());
        // Longest first, so each cut only shortens the file further.
        for (auto it = cuts.rbegin(); it != cuts.rend(); ++it) {
            ASSERT_TRUE(file.truncate(*it));
            const std::string what = "cut at " + std::to_string(*it);
            const fuzztargets::WrapperRun r = sweep.run(f, file, *it, what);
            if (r.open != OK) EXPECT_LT(r.open, 0) << f.name << " " << what;
            EXPECT_LE(r.samples, whole) << f.name << " " << what << ": samples from nowhere";
        }
        sweep.expectBoundedHeap(f.name + " prefixes");
    }
}

TEST(WrapperSweepTest, SingleDamagedBytesEndWithAStatus) {
    Sweep sweep;
    for (const SampleFile& f : sampleFiles()) {
        MemFile file(f.bytes);
        ASSERT_TRUE(file.ok());
        for (size_t at : offsetsOf(f.bytes.size())) {
            // Alternate between inverting the byte and the two extremes.
            const uint8_t value = at % 3 == 0 ? uint8_t(~f.bytes[at]) : at % 3 == 1 ? 0xFF : 0x00;
            if (value == f.bytes[at]) continue;
            ASSERT_TRUE(file.put(at, value));
            const std::string what = "byte " + std::to_string(at) + " = " + std::to_string(value);
            const fuzztargets::WrapperRun r = sweep.run(f, file, f.bytes.size(), what);
            if (r.open != OK) EXPECT_LT(r.open, 0) << f.name << " " << what;
            ASSERT_TRUE(file.put(at, f.bytes[at]));
        }
        sweep.expectBoundedHeap(f.name + " damaged bytes");
    }
}

}  // namespace
