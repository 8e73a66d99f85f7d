// The descriptor sink with and without its write buffer: the same bytes land
// at the same places, and a failed write is still answered.
#include <cerrno>
#include <fcntl.h>
#include <string>
#include <unistd.h>
#include <vector>

#include <gtest/gtest.h>
#include <media/stagefright/ByteSink.h>

#include "LogCapture.h"
#include "writers/AudioWriterTestSupport.h"

namespace android {
namespace {

std::string Pattern(size_t size, unsigned seed) {
    std::string s(size, '\0');
    for (size_t i = 0; i < size; ++i) s[i] = char((i * 31 + seed * 7) & 0xFF);
    return s;
}

TEST(FdSinkTest, BufferedAppendsPatchesAndReadsMatchDirectOnes) {
    struct Case {
        const char* name;
        std::vector<size_t> appends;  // sizes, against a 16-byte buffer
    };
    const Case kCases[] = {
        {"small ones", {1, 2, 3, 4, 5, 6, 7}},
        {"exactly the buffer", {16, 16, 16}},
        {"larger than the buffer between small ones", {3, 40, 5, 17, 1}},
        {"filling to the byte, then one more", {10, 6, 1}},
        {"nothing", {}},
    };
    for (const Case& c : kCases) {
        SCOPED_TRACE(c.name);
        std::string files[2];
        for (size_t buffered = 0; buffered < 2; ++buffered) {
            writertest::ScratchFile file;
            ASSERT_EQ(5, write(file.fd, "head:", 5));  // the sink starts where the descriptor is
            sp<FdSink> sink = new FdSink(file.fd, buffered ? 16 : 0);
            std::string expected;
            unsigned seed = 0;
            for (size_t size : c.appends) {
                const std::string bytes = Pattern(size, ++seed);
                ASSERT_EQ(OK, sink->write(bytes.data(), bytes.size()));
                expected += bytes;
                EXPECT_EQ(int64_t(expected.size()), sink->position());
            }
            if (expected.size() >= 4) {
                // Patch the last bytes, which a buffered sink may still hold.
                ASSERT_EQ(OK, sink->writeAt(int64_t(expected.size() - 4), "ABCD", 4));
                expected.replace(expected.size() - 4, 4, "ABCD");
                std::string back(expected.size(), '\0');
                ASSERT_EQ(OK, sink->readAt(0, &back[0], back.size()));
                EXPECT_EQ(expected, back);
                ASSERT_EQ(OK, sink->write("tail", 4));
                expected += "tail";
            }
            EXPECT_EQ(BAD_VALUE, sink->writeAt(int64_t(expected.size()), "x", 1));
            ASSERT_EQ(OK, sink->sync());
            const writertest::Bytes bytes = writertest::readFile(file.path());
            files[buffered].assign(bytes.begin(), bytes.end());
            EXPECT_EQ("head:" + expected, files[buffered]);
        }
        EXPECT_EQ(files[0], files[1]);
    }
}

TEST(FdSinkTest, ABufferedWriteThatFailsIsAnsweredByTheFlushAndEveryCallAfter) {
    LogCapture log;
    const int fd = open("/dev/full", O_RDWR);
    ASSERT_GE(fd, 0);
    {
        sp<FdSink> sink = new FdSink(fd, 64);
        EXPECT_EQ(OK, sink->write("held", 4));
        EXPECT_EQ(-ENOSPC, sink->flush());
        EXPECT_EQ(-ENOSPC, sink->write("more", 4));
        EXPECT_EQ(-ENOSPC, sink->sync());
    }
    {
        // An append larger than the buffer fails at once.
        sp<FdSink> sink = new FdSink(fd, 4);
        EXPECT_EQ(-ENOSPC, sink->write("larger", 6));
        EXPECT_EQ(-ENOSPC, sink->sync());
    }
    close(fd);
}

}  // namespace
}  // namespace android
