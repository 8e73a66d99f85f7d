// Many producers and consumers of every kind on one queue: whole reads, whole
// dequeues and partial takes race, queries run beside them, and every byte
// queued must come out exactly once, unchanged, in order per producer.
#include <gtest/gtest.h>

#include <atomic>
#include <map>
#include <mutex>
#include <thread>
#include <vector>

#include <media/stagefright/MediaBuffer.h>
#include <media/stagefright/MediaErrors.h>
#include <media/stagefright/foundation/ABuffer.h>
#include <media/stagefright/foundation/AMessage.h>

#include "QNMediaEditorBufferQueue.h"
#include "reliability/ThreadSupport.h"

using namespace android;
using android::qnmediaeditor::QNMediaEditorBufferQueue;
using namespace reliability;

namespace {

constexpr int kProducers = 4;
constexpr int kUnitsPerProducer = 250;
constexpr size_t kUnitSize = 7;
constexpr uint32_t kPiece = 3;

// A byte is named by its unit's time plus its position in the unit: pieces
// are taken with a time offset equal to their size, so whatever carries time
// t and n bytes holds the bytes t .. t + n - 1.
int64_t unitTime(int producer, int seq) { return (int64_t(producer) << 32) | (int64_t(seq) << 8); }
uint8_t byteValue(int64_t id) { return static_cast<uint8_t>((id >> 32) * 31 + ((id >> 8) & 0xFFFFFF) * 7 + (id & 0xFF)); }

sp<ABuffer> makeUnit(int producer, int seq) {
    sp<ABuffer> unit = new ABuffer(kUnitSize);
    const int64_t t = unitTime(producer, seq);
    for (size_t i = 0; i < kUnitSize; ++i) unit->data()[i] = byteValue(t + int64_t(i));
    unit->meta()->setInt64("timeUs", t);
    return unit;
}

struct Delivery {
    int64_t timeUs;
    std::vector<uint8_t> bytes;
};

class Collector {
public:
    void add(int consumer, int64_t timeUs, const uint8_t* data, size_t size) {
        std::lock_guard<std::mutex> lock(mLock);
        mByConsumer[consumer].push_back({timeUs, std::vector<uint8_t>(data, data + size)});
    }
    std::map<int, std::vector<Delivery>> all() {
        std::lock_guard<std::mutex> lock(mLock);
        return mByConsumer;
    }

private:
    std::mutex mLock;
    std::map<int, std::vector<Delivery>> mByConsumer;
};

// The three ways to consume; each returns the status that ended it.
status_t readAll(const sp<QNMediaEditorBufferQueue>& q, Collector* c, int id) {
    for (;;) {
        MediaBufferBase* b = nullptr;
        const status_t err = q->read(&b);
        if (err != OK) return err;
        int64_t t = -1;
        b->meta_data().findInt64(kKeyTime, &t);
        c->add(id, t, static_cast<const uint8_t*>(b->data()) + b->range_offset(), b->range_length());
        b->release();
    }
}

status_t dequeueAll(const sp<QNMediaEditorBufferQueue>& q, Collector* c, int id) {
    for (;;) {
        sp<ABuffer> u;
        const status_t err = q->dequeueAccessUnit(&u);
        if (err != OK) return err;
        int64_t t = -1;
        u->meta()->findInt64("timeUs", &t);
        c->add(id, t, u->data(), u->size());
    }
}

// Takes pieces the way a caller does: sized from nextBufferSize(), and an
// exhausted unit at the front is dropped with a whole dequeue. Racing with
// the others, the front may change between the look and the take.
status_t takePieces(const sp<QNMediaEditorBufferQueue>& q, Collector* c, int id) {
    for (;;) {
        sp<ABuffer> u;
        status_t err;
        if (q->nextBufferSize() == 0) {
            err = q->dequeueAccessUnit(&u);
        } else {
            err = q->dequeueAccessUnit(&u, kPiece, kPiece);
        }
        if (err != OK) return err;
        int64_t t = -1;
        u->meta()->findInt64("timeUs", &t);
        if (u->size() > 0) c->add(id, t, u->data(), u->size());
    }
}

TEST(BufferQueueStressTest, EveryByteArrivesOnceWhateverMixOfConsumersTakesIt) {
    sp<QNMediaEditorBufferQueue> queue = new QNMediaEditorBufferQueue(nullptr);
    Collector collector;
    std::vector<status_t> ends(6, OK);
    std::atomic<bool> producing{true};

    runWithin(kThreadTestLimit, "queue stress", [&] {
        std::vector<std::thread> consumers;
        for (int k = 0; k < 6; ++k) {
            consumers.emplace_back([&, k] {
                ends[k] = k % 3 == 0 ? readAll(queue, &collector, k)
                        : k % 3 == 1 ? dequeueAll(queue, &collector, k)
                                     : takePieces(queue, &collector, k);
            });
        }
        // Lookers: the non-blocking queries and the enable flag, beside the traffic.
        std::thread looker([&] {
            while (producing) {
                status_t final;
                int64_t t;
                queue->hasBufferAvailable(&final);
                EXPECT_GE(queue->getAvailableBufferCount(&final), 0);
                const status_t next = queue->nextBufferTime(&t);
                EXPECT_TRUE(next == OK || next == WOULD_BLOCK) << next;
                EXPECT_LE(queue->nextBufferSize(), kUnitSize);
                queue->isEmpty();
                EXPECT_FALSE(queue->isFinished(0));
                queue->enable(false);
                queue->enable(true);
            }
        });
        std::vector<std::thread> producers;
        for (int p = 0; p < kProducers; ++p) {
            producers.emplace_back([&, p] {
                for (int i = 0; i < kUnitsPerProducer; ++i) queue->queueAccessUnit(makeUnit(p, i));
            });
        }
        for (auto& t : producers) t.join();
        producing = false;
        looker.join();
        queue->signalEOS(ERROR_END_OF_STREAM);
        for (auto& t : consumers) t.join();
    });

    for (status_t e : ends) EXPECT_EQ(ERROR_END_OF_STREAM, e) << "every consumer sees the end";
    std::map<int64_t, int> seen;
    for (const auto& [consumer, list] : collector.all()) {
        std::map<int64_t, int64_t> lastOf;  // producer -> last byte id this consumer saw
        for (const Delivery& d : list) {
            const int64_t producer = d.timeUs >> 32;
            if (lastOf.count(producer)) {
                EXPECT_LT(lastOf[producer], d.timeUs) << "consumer " << consumer << " producer " << producer;
            }
            for (size_t i = 0; i < d.bytes.size(); ++i) {
                const int64_t id = d.timeUs + int64_t(i);
                ASSERT_EQ(byteValue(id), d.bytes[i]) << "byte " << id << " corrupted";
                ++seen[id];
                lastOf[producer] = id;
            }
        }
    }
    EXPECT_EQ(size_t(kProducers * kUnitsPerProducer * kUnitSize), seen.size());
    for (const auto& [id, n] : seen) ASSERT_EQ(1, n) << "byte " << id;
}

TEST(BufferQueueStressTest, UnitsQueuedBeforeTheEndAreAllDeliveredToLateConsumers) {
    // The end is signalled while producers still run; nothing queued before
    // it may be dropped, and consumers that arrive afterwards drain the rest.
    for (int round = 0; round < 20; ++round) {
        sp<QNMediaEditorBufferQueue> queue = new QNMediaEditorBufferQueue(nullptr);
        std::atomic<int> queued{0}, taken{0};
        runWithin(kThreadTestLimit, "queue end race", [&] {
            std::vector<std::thread> producers;
            for (int p = 0; p < 2; ++p) {
                producers.emplace_back([&, p] {
                    for (int i = 0; i < 200; ++i) {
                        queue->queueAccessUnit(makeUnit(p, i));
                        ++queued;
                    }
                });
            }
            std::thread early([&] {
                sp<ABuffer> u;
                while (queue->dequeueAccessUnit(&u) == OK) ++taken;
            });
            std::this_thread::sleep_for(std::chrono::microseconds(50 * round));
            queue->signalEOS(ERROR_IO);
            for (auto& t : producers) t.join();
            early.join();
            std::thread late([&] {
                sp<ABuffer> u;
                while (queue->dequeueAccessUnit(&u) == OK) ++taken;
            });
            late.join();
        });
        EXPECT_EQ(queued.load(), taken.load()) << "round " << round;
        sp<ABuffer> u;
        EXPECT_EQ(ERROR_IO, queue->dequeueAccessUnit(&u));
    }
}

}  // namespace
