// Buffers handed out by the file source's read-ahead: the file's bytes, each
// range the caller's own to rewrite.
#include <cstdint>
#include <cstdio>
#include <cstring>
#include <unistd.h>
#include <vector>

#include <gtest/gtest.h>
#include <media/stagefright/FileSource.h>
#include <media/stagefright/MediaBuffer.h>
#include <media/stagefright/MediaErrors.h>

namespace android {
namespace {

class FileSourceReadAheadTest : public ::testing::Test {
protected:
    void SetUp() override {
        mFile = tmpfile();
        ASSERT_NE(nullptr, mFile);
        mBytes.resize(3 * FileSource::kReadAhead + 1000);
        for (size_t i = 0; i < mBytes.size(); ++i) mBytes[i] = uint8_t(i * 131 + (i >> 12));
        ASSERT_EQ(mBytes.size(), fwrite(mBytes.data(), 1, mBytes.size(), mFile));
        fflush(mFile);
    }
    void TearDown() override {
        if (mFile != nullptr) fclose(mFile);
    }
    // The range, checked against the file and then overwritten as a reader may.
    void expectRange(FileSource* source, off64_t offset, size_t size, size_t fileOffset = 0) {
        status_t err = OK;
        MediaBuffer* b = source->readBuffer(offset, size, &err);
        ASSERT_NE(nullptr, b) << offset << " " << size << " " << err;
        ASSERT_EQ(size, b->range_length());
        const uint8_t* data = static_cast<const uint8_t*>(b->data()) + b->range_offset();
        EXPECT_EQ(0, memcmp(mBytes.data() + fileOffset + offset, data, size)) << offset << " " << size;
        memset(static_cast<uint8_t*>(b->data()) + b->range_offset(), 0xEE, size);
        b->release();
    }

    FILE* mFile = nullptr;
    std::vector<uint8_t> mBytes;
};

TEST_F(FileSourceReadAheadTest, RangesInAnyOrderAreTheFilesBytesEvenAfterEarlierOnesWereRewritten) {
    sp<FileSource> source = new FileSource(fileno(mFile), 0, -1);
    ASSERT_EQ(OK, source->initCheck());
    const size_t far = 2 * FileSource::kReadAhead;
    // Interleaved tracks, tracks stored far apart, a range asked twice, an
    // overlapping one, one too large to share a read, the last byte.
    const std::vector<std::pair<off64_t, size_t>> ranges = {
        {0, 100},     {100, 5000},  {5100, 7},   {far, 300},   {5107, 40000}, {far + 300, 300},
        {100, 5000},  {5000, 200},  {90, 20},    {far + 600, FileSource::kReadAhead / 2},
        {static_cast<off64_t>(mBytes.size() - 1), 1}, {FileSource::kReadAhead - 10, 20},
    };
    for (const auto& r : ranges) expectRange(source.get(), r.first, r.second);
}

TEST_F(FileSourceReadAheadTest, NeighbouringRangesShareOneReadAndOutliveTheSource) {
    sp<FileSource> source = new FileSource(fileno(mFile), 0, -1);
    status_t err = OK;
    MediaBuffer* a = source->readBuffer(10, 1000, &err);
    MediaBuffer* b = source->readBuffer(1010, 2000, &err);
    ASSERT_NE(nullptr, a);
    ASSERT_NE(nullptr, b);
    EXPECT_EQ(static_cast<uint8_t*>(a->data()) + 1000, static_cast<uint8_t*>(b->data()));
    source.clear();
    EXPECT_EQ(0, memcmp(mBytes.data() + 1010, b->data(), 2000));
    a->release();
    b->release();
}

TEST_F(FileSourceReadAheadTest, RangesPastTheEndOfTheWindowFail) {
    // A window of the file that ends 500 bytes in.
    sp<FileSource> source = new FileSource(fileno(mFile), 1000, 500);
    expectRange(source.get(), 0, 500, 1000);
    status_t err = OK;
    EXPECT_EQ(nullptr, source->readBuffer(400, 200, &err));
    EXPECT_EQ(ERROR_IO, err);
    EXPECT_EQ(nullptr, source->readBuffer(500, 1, &err));
    EXPECT_EQ(nullptr, source->readBuffer(-1, 1, &err));
}

}  // namespace
}  // namespace android
