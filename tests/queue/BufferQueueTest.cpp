#include <gtest/gtest.h>

#include <media/stagefright/MediaBuffer.h>
#include <media/stagefright/MediaErrors.h>

#include "QNMediaEditorBufferQueue.h"
#include "queue/QueueTestUtil.h"

using namespace android;
using android::qnmediaeditor::QNMediaEditorBufferQueue;

namespace {

const uint8_t* bytesOf(MediaBufferBase* b) {
    return static_cast<const uint8_t*>(b->data()) + b->range_offset();
}

TEST(BufferQueueTest, ReadDeliversUnitsInOrderThenTheEndStatus) {
    sp<QNMediaEditorBufferQueue> queue = new QNMediaEditorBufferQueue(nullptr);
    sp<ABuffer> second = makeUnit(8, 2000, 10);
    second->setRange(3, 4);  // only the range is the unit
    queue->queueAccessUnit(makeUnit(5, 1000));
    queue->queueAccessUnit(second);
    queue->signalEOS(ERROR_END_OF_STREAM);
    EXPECT_TRUE(queue->isFinished(0));

    MediaBufferBase* b = nullptr;
    ASSERT_EQ(OK, queue->read(&b));
    int64_t t;
    ASSERT_TRUE(b->meta_data().findInt64(kKeyTime, &t));
    EXPECT_EQ(1000, t);
    EXPECT_EQ(5u, b->range_length());
    b->release();

    ASSERT_EQ(OK, queue->read(&b));
    ASSERT_EQ(4u, b->range_length());
    EXPECT_EQ(13, bytesOf(b)[0]);
    b->release();

    b = reinterpret_cast<MediaBufferBase*>(0x1);
    EXPECT_EQ(ERROR_END_OF_STREAM, queue->read(&b));
    EXPECT_EQ(nullptr, b);
    sp<ABuffer> unit = makeUnit(1, 1);
    EXPECT_EQ(ERROR_END_OF_STREAM, queue->dequeueAccessUnit(&unit));
    EXPECT_EQ(nullptr, unit);
    int64_t next = 7;
    EXPECT_EQ(ERROR_END_OF_STREAM, queue->nextBufferTime(&next));
    EXPECT_EQ(0, next);
}

TEST(BufferQueueTest, ReadCopiesOnlyTheOptionalKeysPresent) {
    sp<QNMediaEditorBufferQueue> queue = new QNMediaEditorBufferQueue(nullptr);
    sp<ABuffer> tagged = makeUnit(4, 0);
    tagged->meta()->setInt32("isSync", 0);
    tagged->meta()->setBuffer("sei", makeUnit(3, 0, 0x40));
    tagged->meta()->setBuffer("mpegUserData", makeUnit(2, 0, 0x50));
    queue->queueAccessUnit(tagged);
    queue->queueAccessUnit(makeUnit(4, 0));

    MediaBufferBase* b = nullptr;
    ASSERT_EQ(OK, queue->read(&b));
    int32_t sync = -1;
    ASSERT_TRUE(b->meta_data().findInt32(kKeyIsSyncFrame, &sync));
    EXPECT_EQ(0, sync);  // copied as is, not forced to 1
    uint32_t type = 99;
    const void* data;
    size_t size;
    ASSERT_TRUE(b->meta_data().findData(kKeySEI, &type, &data, &size));
    EXPECT_EQ(0u, type);
    ASSERT_EQ(3u, size);
    EXPECT_EQ(0x42, static_cast<const uint8_t*>(data)[2]);
    ASSERT_TRUE(b->meta_data().findData(kKeyMpegUserData, &type, &data, &size));
    EXPECT_EQ(2u, size);
    b->release();

    ASSERT_EQ(OK, queue->read(&b));
    EXPECT_FALSE(b->meta_data().findInt32(kKeyIsSyncFrame, &sync));
    EXPECT_FALSE(b->meta_data().findData(kKeySEI, &type, &data, &size));
    b->release();
}

TEST(BufferQueueTest, QueriesFollowTheEnabledFlagButReadDoesNot) {
    sp<QNMediaEditorBufferQueue> queue = new QNMediaEditorBufferQueue(nullptr);
    status_t final = -1;
    int64_t t = 5;
    EXPECT_EQ(WOULD_BLOCK, queue->nextBufferTime(&t));
    EXPECT_EQ(0, t);
    EXPECT_EQ(0u, queue->nextBufferSize());
    EXPECT_FALSE(queue->hasBufferAvailable(&final));
    EXPECT_EQ(OK, final);

    for (int i = 0; i < 3; ++i) queue->queueAccessUnit(makeUnit(10 + i, 100 * i));
    EXPECT_EQ(3, queue->getAvailableBufferCount(&final));
    queue->enable(false);
    EXPECT_TRUE(queue->isEmpty());
    final = -1;
    EXPECT_FALSE(queue->hasBufferAvailable(&final));
    EXPECT_EQ(OK, final);
    final = -1;
    EXPECT_EQ(0, queue->getAvailableBufferCount(&final));
    EXPECT_EQ(OK, final);
    EXPECT_EQ(10u, queue->nextBufferSize());
    MediaBufferBase* b = nullptr;
    ASSERT_EQ(OK, queue->read(&b));
    b->release();

    queue->enable(true);
    sp<ABuffer> unit;
    ASSERT_EQ(OK, queue->dequeueAccessUnit(&unit));
    ASSERT_EQ(OK, queue->dequeueAccessUnit(&unit));
    queue->signalEOS(ERROR_IO);
    EXPECT_FALSE(queue->hasBufferAvailable(&final));
    EXPECT_EQ(ERROR_IO, final);
    EXPECT_EQ(0, queue->getAvailableBufferCount(&final));
    EXPECT_EQ(ERROR_IO, final);

    queue->clear();
    EXPECT_FALSE(queue->isFinished(0));
    EXPECT_EQ(WOULD_BLOCK, queue->nextBufferTime(&t));
}

TEST(BufferQueueTest, WholeDequeueHandsOutTheQueuedBufferItself) {
    sp<QNMediaEditorBufferQueue> queue = new QNMediaEditorBufferQueue(nullptr);
    queue->signalEOS(ERROR_END_OF_STREAM);
    sp<ABuffer> unit = makeUnit(6, 42);
    unit->meta()->setInt32("isSync", 1);
    queue->queueAccessUnit(unit);  // behind the end: still delivered
    sp<ABuffer> got;
    ASSERT_EQ(OK, queue->dequeueAccessUnit(&got));
    EXPECT_EQ(unit.get(), got.get());
    int32_t sync;
    EXPECT_TRUE(got->meta()->findInt32("isSync", &sync));
}

TEST(BufferQueueTest, PartialDequeueCutsTheFrontUnitAndAdvancesItsTime) {
    sp<QNMediaEditorBufferQueue> queue = new QNMediaEditorBufferQueue(nullptr);
    sp<ABuffer> unit = makeUnit(1000, 5000);
    unit->meta()->setInt32("isSync", 1);
    queue->queueAccessUnit(unit);

    sp<ABuffer> piece;
    ASSERT_EQ(OK, queue->dequeueAccessUnit(&piece, 400, 9000));
    ASSERT_EQ(400u, piece->size());
    EXPECT_EQ(0u, piece->offset());
    EXPECT_EQ(0, memcmp(piece->data(), unit->base(), 400));
    int64_t t;
    ASSERT_TRUE(piece->meta()->findInt64("timeUs", &t));
    EXPECT_EQ(5000, t);
    int32_t sync;
    EXPECT_FALSE(piece->meta()->findInt32("isSync", &sync));

    EXPECT_EQ(600u, queue->nextBufferSize());
    ASSERT_EQ(OK, queue->nextBufferTime(&t));
    EXPECT_EQ(14000, t);

    // More than is left: only the remaining bytes, never past the unit.
    ASSERT_EQ(OK, queue->dequeueAccessUnit(&piece, 5000, 1));
    ASSERT_EQ(600u, piece->size());
    EXPECT_EQ(static_cast<uint8_t>(999), piece->data()[599]);
    ASSERT_TRUE(piece->meta()->findInt64("timeUs", &t));
    EXPECT_EQ(14000, t);

    // The exhausted unit stays at the front until a whole take removes it.
    EXPECT_EQ(0u, queue->nextBufferSize());
    status_t final;
    EXPECT_EQ(1, queue->getAvailableBufferCount(&final));
    ASSERT_EQ(OK, queue->dequeueAccessUnit(&piece));
    EXPECT_EQ(unit.get(), piece.get());
    EXPECT_TRUE(queue->isEmpty());
}

TEST(BufferQueueTest, FormatIsSetOnceAndSourceDefaultsHold) {
    sp<MetaData> f1 = new MetaData, f2 = new MetaData;
    sp<QNMediaEditorBufferQueue> fixed = new QNMediaEditorBufferQueue(f1);
    fixed->setFormat(f2);
    EXPECT_EQ(f1.get(), fixed->getFormat().get());

    sp<QNMediaEditorBufferQueue> queue = new QNMediaEditorBufferQueue(nullptr);
    EXPECT_EQ(nullptr, queue->getFormat());
    queue->setFormat(nullptr);
    queue->setFormat(f2);
    queue->setFormat(f1);
    EXPECT_EQ(f2.get(), queue->getFormat().get());

    queue->queueAccessUnit(makeUnit(1, 0));
    EXPECT_EQ(OK, queue->start());
    EXPECT_EQ(OK, queue->stop());
    EXPECT_EQ(1u, queue->nextBufferSize());
    EXPECT_FALSE(queue->isFinished(0));
    EXPECT_EQ(ERROR_UNSUPPORTED, queue->pause());
    EXPECT_EQ(ERROR_UNSUPPORTED, queue->setStopTimeUs(0));
    EXPECT_EQ(0, queue->getCurrentMaxAmplitude());
}

}  // namespace
