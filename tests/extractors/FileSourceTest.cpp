#include <gtest/gtest.h>

#include <fcntl.h>
#include <unistd.h>

#include <cstdlib>
#include <string>
#include <vector>

#include <media/stagefright/FileSource.h>
#include <media/stagefright/MediaErrors.h>

using namespace android;

namespace {

// A temporary file of 1000 bytes, byte i holding i % 251.
class TempFile {
public:
    TempFile() {
        char name[] = "/tmp/filesourcetestXXXXXX";
        const int fd = mkstemp(name);
        mPath = name;
        for (int i = 0; i < 1000; ++i) mBytes.push_back(static_cast<uint8_t>(i % 251));
        EXPECT_EQ(write(fd, mBytes.data(), mBytes.size()), 1000);
        close(fd);
    }
    ~TempFile() { unlink(mPath.c_str()); }
    int open(int flags) const { return ::open(mPath.c_str(), flags); }
    const std::string& path() const { return mPath; }
    const std::vector<uint8_t>& bytes() const { return mBytes; }

private:
    std::string mPath;
    std::vector<uint8_t> mBytes;
};

}  // namespace

TEST(FileSourceTest, ReadsOnlyInsideItsWindow) {
    TempFile file;
    const int fd = file.open(O_RDONLY);
    sp<FileSource> source = new FileSource(fd, 100, 50);
    close(fd);  // the source keeps its own descriptor
    ASSERT_EQ(source->initCheck(), OK);
    off64_t size;
    ASSERT_EQ(source->getSize(&size), OK);
    EXPECT_EQ(size, 50);

    uint8_t buf[64];
    ASSERT_EQ(source->readAt(0, buf, 10), 10);
    EXPECT_TRUE(std::equal(buf, buf + 10, file.bytes().begin() + 100));
    ASSERT_EQ(source->readAt(45, buf, 10), 5);  // cut at the window's end
    EXPECT_TRUE(std::equal(buf, buf + 5, file.bytes().begin() + 145));
    EXPECT_EQ(source->readAt(50, buf, 10), 0);
    EXPECT_LT(source->readAt(-1, buf, 10), 0);
    EXPECT_TRUE(source->readExactly(40, buf, 10));
    EXPECT_FALSE(source->readExactly(41, buf, 10));
    uint32_t word;
    ASSERT_TRUE(source->getUInt32(0, &word));
    EXPECT_EQ(word, (100u << 24) | (101u << 16) | (102u << 8) | 103u);
}

TEST(FileSourceTest, WindowPastTheEndEndsWithTheFile) {
    TempFile file;
    const int fd = file.open(O_RDONLY);
    for (int64_t length : {int64_t(-1), int64_t(5000)}) {
        sp<FileSource> source = new FileSource(fd, 900, length);
        ASSERT_EQ(source->initCheck(), OK);
        off64_t size;
        ASSERT_EQ(source->getSize(&size), OK);
        EXPECT_EQ(size, 100) << length;
        uint8_t buf[200];
        EXPECT_EQ(source->readAt(0, buf, sizeof(buf)), 100);
    }
    close(fd);
}

TEST(FileSourceTest, InitCheckFailsForUnreadableDescriptors) {
    TempFile file;
    const int writeOnly = file.open(O_WRONLY);
    ASSERT_GE(writeOnly, 0);
    sp<FileSource> source = new FileSource(writeOnly, 0, 10);
    EXPECT_NE(source->initCheck(), OK);
    uint8_t b;
    EXPECT_LT(source->readAt(0, &b, 1), 0);
    close(writeOnly);

    EXPECT_NE(sp<FileSource>(new FileSource(-1, 0, 10))->initCheck(), OK);
    const int closed = file.open(O_RDONLY);
    close(closed);
    EXPECT_NE(sp<FileSource>(new FileSource(closed, 0, 10))->initCheck(), OK);
    const int dir = open("/tmp", O_RDONLY | O_DIRECTORY);
    EXPECT_NE(sp<FileSource>(new FileSource(dir, 0, 10))->initCheck(), OK);
    close(dir);
    const int fd = file.open(O_RDONLY);
    EXPECT_NE(sp<FileSource>(new FileSource(fd, -5, 10))->initCheck(), OK);
    close(fd);

    EXPECT_EQ(sp<FileSource>(new FileSource(file.path().c_str()))->initCheck(), OK);
    EXPECT_NE(sp<FileSource>(new FileSource("/nonexistent/file"))->initCheck(), OK);
}

TEST(FileSourceTest, BufferSourceReadsItsCopy) {
    std::vector<uint8_t> bytes = {1, 2, 3, 4, 5};
    sp<DataSource> source = new BufferDataSource(bytes.data(), bytes.size());
    bytes[0] = 9;
    uint8_t buf[8] = {};
    EXPECT_EQ(source->readAt(3, buf, 8), 2);
    EXPECT_EQ(buf[0], 4);
    EXPECT_EQ(source->readAt(0, buf, 1), 1);
    EXPECT_EQ(buf[0], 1);
    EXPECT_EQ(source->readAt(5, buf, 1), 0);
    off64_t size;
    ASSERT_EQ(source->getSize(&size), OK);
    EXPECT_EQ(size, 5);
}
