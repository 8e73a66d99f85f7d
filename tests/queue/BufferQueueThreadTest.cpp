#include <gtest/gtest.h>

#include <atomic>
#include <cstdio>
#include <cstdlib>
#include <chrono>
#include <functional>
#include <future>
#include <map>
#include <thread>
#include <vector>

#include <media/stagefright/MediaBuffer.h>
#include <media/stagefright/MediaErrors.h>

#include "QNMediaEditorBufferQueue.h"
#include "queue/QueueTestUtil.h"

using namespace android;
using android::qnmediaeditor::QNMediaEditorBufferQueue;
using namespace std::chrono_literals;

namespace {

// Runs consumers that are expected to block, then checks they all return in
// bounded time once `release` has run. A consumer still stuck after the
// deadline is a failure; `unstick` (by default `release`) is then repeated so
// the test still ends.
class Consumers {
public:
    void spawn(std::function<status_t()> body) { mResults.push_back(std::async(std::launch::async, body)); }

    bool noneReturnedWithin(std::chrono::milliseconds d) {
        std::this_thread::sleep_for(d);
        for (auto& f : mResults) {
            if (f.wait_for(0s) == std::future_status::ready) return false;
        }
        return true;
    }

    std::vector<status_t> finish(const std::function<void()>& release, std::function<void()> unstick = nullptr) {
        if (!unstick) unstick = release;
        release();
        const auto deadline = std::chrono::steady_clock::now() + 5s;
        std::vector<status_t> out;
        for (auto& f : mResults) {
            if (f.wait_until(deadline) != std::future_status::ready) {
                ADD_FAILURE() << "a consumer stayed blocked";
                // A wake-up that is lost for good would hang the suite until
                // ctest's timeout: give up on the stuck thread instead.
                const auto giveUp = std::chrono::steady_clock::now() + 5s;
                while (f.wait_for(10ms) != std::future_status::ready) {
                    if (std::chrono::steady_clock::now() > giveUp) {
                        fprintf(stderr, "a blocked consumer never returned, even after the end of stream\n");
                        fflush(stderr);
                        std::abort();
                    }
                    unstick();
                }
            }
            out.push_back(f.get());
        }
        return out;
    }

private:
    std::vector<std::future<status_t>> mResults;
};

status_t readOne(const sp<QNMediaEditorBufferQueue>& q) {
    MediaBufferBase* b = nullptr;
    const status_t err = q->read(&b);
    if (b != nullptr) b->release();
    return err;
}

TEST(BufferQueueConcurrencyTest, ReadBlocksUntilAUnitIsQueued) {
    sp<QNMediaEditorBufferQueue> queue = new QNMediaEditorBufferQueue(nullptr);
    int64_t seen = -1;
    Consumers c;
    c.spawn([&] {
        MediaBufferBase* b = nullptr;
        const status_t err = queue->read(&b);
        if (b != nullptr) {
            b->meta_data().findInt64(kKeyTime, &seen);
            b->release();
        }
        return err;
    });
    EXPECT_TRUE(c.noneReturnedWithin(50ms));
    auto results = c.finish([&] { queue->queueAccessUnit(makeUnit(4, 777)); },
                            [&] { queue->signalEOS(ERROR_END_OF_STREAM); });
    EXPECT_EQ(OK, results[0]);
    EXPECT_EQ(777, seen);
}

TEST(BufferQueueConcurrencyTest, ClearReopensTheStreamSoReadsBlockAgain) {
    sp<QNMediaEditorBufferQueue> queue = new QNMediaEditorBufferQueue(nullptr);
    queue->signalEOS(ERROR_END_OF_STREAM);
    queue->clear();
    Consumers c;
    c.spawn([&] { return readOne(queue); });
    EXPECT_TRUE(c.noneReturnedWithin(50ms));
    auto results = c.finish([&] { queue->signalEOS(ERROR_IO); });
    EXPECT_EQ(ERROR_IO, results[0]);
}

TEST(BufferQueueConcurrencyTest, EndOfStreamWakesEveryBlockedConsumer) {
    sp<QNMediaEditorBufferQueue> queue = new QNMediaEditorBufferQueue(nullptr);
    Consumers c;
    for (int i = 0; i < 2; ++i) {
        c.spawn([&] { return readOne(queue); });
        c.spawn([&] {
            sp<ABuffer> u;
            return queue->dequeueAccessUnit(&u);
        });
        c.spawn([&] {
            sp<ABuffer> u;
            return queue->dequeueAccessUnit(&u, 10, 10);
        });
    }
    EXPECT_TRUE(c.noneReturnedWithin(100ms));
    auto results = c.finish([&] { queue->signalEOS(ERROR_END_OF_STREAM); });
    for (status_t r : results) EXPECT_EQ(ERROR_END_OF_STREAM, r);
}

TEST(BufferQueueConcurrencyTest, PiecesOfOneUnitReachEveryBlockedPartialTaker) {
    // A partial take leaves the unit queued, so the other takers must be woken
    // too even though only one unit was queued.
    sp<QNMediaEditorBufferQueue> queue = new QNMediaEditorBufferQueue(nullptr);
    Consumers c;
    for (int i = 0; i < 3; ++i) {
        c.spawn([&] {
            sp<ABuffer> u;
            const status_t err = queue->dequeueAccessUnit(&u, 100, 1);
            return err == OK && u->size() == 100 ? OK : UNKNOWN_ERROR;
        });
    }
    EXPECT_TRUE(c.noneReturnedWithin(50ms));
    auto results = c.finish([&] { queue->queueAccessUnit(makeUnit(1000, 0)); });
    for (status_t r : results) EXPECT_EQ(OK, r);
    EXPECT_EQ(700u, queue->nextBufferSize());
}

TEST(BufferQueueConcurrencyTest, ManyProducersAndConsumersDeliverEachUnitOnceInOrder) {
    constexpr int kProducers = 3, kConsumers = 3, kUnits = 400;
    sp<QNMediaEditorBufferQueue> queue = new QNMediaEditorBufferQueue(nullptr);
    // The time encodes producer and sequence number.
    std::vector<std::vector<int64_t>> seen(kConsumers);
    Consumers c;
    for (int k = 0; k < kConsumers; ++k) {
        c.spawn([&, k] {
            for (;;) {
                int64_t t = -1;
                if (k == 0) {
                    MediaBufferBase* b = nullptr;
                    const status_t err = queue->read(&b);
                    if (err != OK) return err;
                    b->meta_data().findInt64(kKeyTime, &t);
                    b->release();
                } else {
                    sp<ABuffer> u;
                    const status_t err = queue->dequeueAccessUnit(&u);
                    if (err != OK) return err;
                    u->meta()->findInt64("timeUs", &t);
                }
                seen[k].push_back(t);
            }
        });
    }
    std::vector<std::thread> producers;
    for (int p = 0; p < kProducers; ++p) {
        producers.emplace_back([&, p] {
            for (int i = 0; i < kUnits; ++i) queue->queueAccessUnit(makeUnit(8, p * 1000000 + i));
        });
    }
    for (auto& t : producers) t.join();
    auto results = c.finish([&] { queue->signalEOS(ERROR_END_OF_STREAM); });
    for (status_t r : results) EXPECT_EQ(ERROR_END_OF_STREAM, r);

    std::map<int64_t, int> delivered;
    for (const auto& list : seen) {
        std::map<int64_t, int64_t> lastOf;  // producer -> last sequence seen
        for (int64_t t : list) {
            ++delivered[t];
            const int64_t p = t / 1000000, seq = t % 1000000;
            if (lastOf.count(p)) EXPECT_LT(lastOf[p], seq) << "producer " << p << " out of order";
            lastOf[p] = seq;
        }
    }
    EXPECT_EQ(static_cast<size_t>(kProducers * kUnits), delivered.size());
    for (const auto& [t, n] : delivered) EXPECT_EQ(1, n) << "unit " << t;
}

// The assertion line: tag, the service's path, the fixed line, the condition.
std::string checkMessage(int line, const std::string& condition) {
    std::string text = "F/QNMediaEditorBufferQueue: frameworks/av/services/mediaeditorservice/Utils/QNMediaEditorBufferQueue:" +
                       std::to_string(line) + " CHECK(" + condition + ") failed.";
    std::string re;
    for (char ch : text) {
        if (strchr("\\^$.|?*+()[]{}", ch)) re += '\\';
        re += ch;
    }
    return re;
}

// A unit that had its time when queued and lost it afterwards.
sp<QNMediaEditorBufferQueue> queueWithTimelessFront() {
    sp<QNMediaEditorBufferQueue> queue = new QNMediaEditorBufferQueue(nullptr);
    sp<ABuffer> unit = makeUnit(4, 1);
    queue->queueAccessUnit(unit);
    unit->meta()->clear();
    return queue;
}

TEST(BufferQueueDeathTest, BrokenInvariantsAbortWithTheirCheck) {
    GTEST_FLAG_SET(death_test_style, "threadsafe");
    EXPECT_DEATH(
        {
            MediaBufferBase* b;
            queueWithTimelessFront()->read(&b);
        },
        checkMessage(118, "buffer->meta()->findInt64(\"timeUs\", &timeUs)"));
    EXPECT_DEATH(
        {
            sp<QNMediaEditorBufferQueue> q = new QNMediaEditorBufferQueue(nullptr);
            q->queueAccessUnit(new ABuffer(4));
        },
        checkMessage(152, "buffer->meta()->findInt64(\"timeUs\", &lastQueuedTimeUs)"));
    EXPECT_DEATH(
        {
            sp<QNMediaEditorBufferQueue> q = new QNMediaEditorBufferQueue(nullptr);
            q->signalEOS(OK);
        },
        checkMessage(169, "result != OK"));
    EXPECT_DEATH(
        {
            int64_t t;
            queueWithTimelessFront()->nextBufferTime(&t);
        },
        checkMessage(225, "buffer->meta()->findInt64(\"timeUs\", timeUs)"));
    EXPECT_DEATH(
        {
            sp<ABuffer> u;
            queueWithTimelessFront()->dequeueAccessUnit(&u, 2, 0);
        },
        checkMessage(261, "iBuff->meta()->findInt64(\"timeUs\", &timeUs)"));
}

}  // namespace
