#include <gtest/gtest.h>

#include <media/stagefright/MediaAdapter.h>
#include <media/stagefright/MetaData.h>
#include <media/stagefright/foundation/ABuffer.h>
#include <media/stagefright/foundation/ADebug.h>
#include <media/stagefright/foundation/AMessage.h>
#include <utils/RefBase.h>

#include <thread>

#include "LogCapture.h"

using namespace android;

namespace {
struct Counted : public RefBase {
    explicit Counted(int* deaths) : mDeaths(deaths) {}
    ~Counted() override { ++*mDeaths; }
    void onFirstRef() override { ++firstRefs; }
    int* mDeaths;
    int firstRefs = 0;
};
}  // namespace

TEST(RefBaseTest, ObjectDiesWithItsLastStrongReferenceAndWeakOnesCannotRevive) {
    int deaths = 0;
    wp<Counted> weak;
    {
        sp<Counted> a = new Counted(&deaths);
        sp<Counted> b = a;
        EXPECT_EQ(1, a->firstRefs);
        EXPECT_EQ(2, a->getStrongCount());
        weak = a;
        EXPECT_NE(nullptr, weak.promote());
    }
    EXPECT_EQ(1, deaths);
    EXPECT_EQ(nullptr, weak.promote());
}

TEST(AMessageTest, FindAnswersFalseForAbsentKeyOrOtherType) {
    sp<AMessage> msg = new AMessage;
    msg->setInt32("a", 7);
    msg->setString("s", "hello world", 5);
    msg->setRect("crop", 1, 2, 3, 4);
    int32_t i32;
    int64_t i64;
    EXPECT_TRUE(msg->findInt32("a", &i32));
    EXPECT_EQ(7, i32);
    EXPECT_FALSE(msg->findInt64("a", &i64));
    EXPECT_FALSE(msg->findInt32("b", &i32));
    AString s;
    ASSERT_TRUE(msg->findString("s", &s));
    EXPECT_STREQ("hello", s.c_str());
    int32_t l, t, r, b;
    ASSERT_TRUE(msg->findRect("crop", &l, &t, &r, &b));
    EXPECT_EQ(4, b);
    msg->setInt64("a", 9);  // a key set again takes the new type
    EXPECT_FALSE(msg->findInt32("a", &i32));
    sp<AMessage> copy = msg->dup();
    msg->clear();
    EXPECT_FALSE(msg->contains("s"));
    EXPECT_TRUE(copy->contains("s"));
}

TEST(MetaDataTest, TypedBlobsAreCopiedAndTypeChecked) {
    sp<MetaData> meta = new MetaData;
    uint8_t bytes[3] = {1, 2, 3};
    meta->setData('blob', 'tag1', bytes, sizeof(bytes));
    bytes[0] = 9;
    uint32_t type;
    const void* data;
    size_t size;
    ASSERT_TRUE(meta->findData('blob', &type, &data, &size));
    EXPECT_EQ(uint32_t('tag1'), type);
    EXPECT_EQ(3u, size);
    EXPECT_EQ(1, static_cast<const uint8_t*>(data)[0]);
    int32_t v;
    EXPECT_FALSE(meta->findInt32('blob', &v));
    meta->setCString(kKeyMIMEType, "audio/raw");
    const char* mime;
    ASSERT_TRUE(meta->findCString(kKeyMIMEType, &mime));
    EXPECT_STREQ("audio/raw", mime);
}

TEST(LogTest, SinkSeesEveryPriorityAndCanBeRestored) {
    {
        LogCapture capture;
        __android_log_print(ANDROID_LOG_VERBOSE, "Tag", "value %d", 3);
        EXPECT_TRUE(capture.contains("value 3", "Tag"));
    }
    LogCapture outer;
    { LogCapture inner; }
    __android_log_print(ANDROID_LOG_DEBUG, "Tag", "after");
    EXPECT_TRUE(outer.contains("after"));
}

TEST(CheckDeathTest, MessagesNameTheConditionAndValues) {
    EXPECT_DEATH(CHECK(1 + 1 == 3), "CHECK\\(1 \\+ 1 == 3\\) failed\\.");
    EXPECT_DEATH(CHECK_EQ((status_t)OK, (status_t)-22), "CHECK_EQ\\( \\(status_t\\)OK,\\(status_t\\)-22\\) failed: 0 vs\\. -22");
    EXPECT_DEATH(CHECK_AT("some/fixed/Path", 169, 2 < 1), "some/fixed/Path:169 CHECK\\(2 < 1\\) failed\\.");
}

TEST(MediaAdapterConcurrencyTest, BuffersPushedBeforeStopAreAllDeliveredThenEndOfStream) {
    sp<MediaAdapter> adapter = new MediaAdapter(new MetaData, 4);
    adapter->start();
    std::thread producer([&] {
        for (int i = 0; i < 100; ++i) {
            MediaBuffer* b = new MediaBuffer(4);
            b->meta_data().setInt64(kKeyTime, i);
            b->add_ref();
            ASSERT_EQ(OK, adapter->pushBuffer(b));
        }
        adapter->stop();
    });
    MediaTrack::ReadOptions options;
    int64_t expected = 0;
    MediaBufferBase* buffer;
    while (adapter->read(&buffer, &options) == OK) {
        int64_t t;
        ASSERT_TRUE(buffer->meta_data().findInt64(kKeyTime, &t));
        EXPECT_EQ(expected++, t);
        buffer->release();
    }
    producer.join();
    EXPECT_EQ(100, expected);
    MediaBuffer* late = new MediaBuffer(4);
    late->add_ref();
    EXPECT_EQ(INVALID_OPERATION, adapter->pushBuffer(late));
    EXPECT_EQ(ERROR_END_OF_STREAM, adapter->read(&buffer, nullptr));
}

TEST(MediaAdapterConcurrencyTest, AReaderWokenInBatchesStillGetsTheLastFewBuffersAtStop) {
    // Fewer buffers than wake a waiting reader, and more than one batch.
    for (int count : {3, 40}) {
        sp<MediaAdapter> adapter = new MediaAdapter(new MetaData);
        adapter->start();
        int got = 0;
        std::thread reader([&] {
            MediaTrack::ReadOptions options;
            MediaBufferBase* buffer;
            while (adapter->read(&buffer, &options) == OK) {
                ++got;
                buffer->release();
            }
        });
        for (int i = 0; i < count; ++i) {
            MediaBuffer* b = new MediaBuffer(4);
            b->add_ref();
            ASSERT_EQ(OK, adapter->pushBuffer(b));
        }
        adapter->stop();
        reader.join();
        EXPECT_EQ(count, got);
    }
}
