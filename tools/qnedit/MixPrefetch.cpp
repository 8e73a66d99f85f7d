#include "MixPrefetch.h"

#include "Cli.h"

namespace qnedit {

namespace {

// A few chunks of a second or so: enough to ride over a slow read.
constexpr size_t kMaxQueuedBytes = 4 << 20;
constexpr size_t kMaxQueuedChunks = 16;

}  // namespace

PrefetchedPcm::PrefetchedPcm(const Opener& open, bool loop) : mOpen(open), mLoop(loop) {
    // The first opening is here, so that a file that cannot be mixed is
    // reported before any output exists.
    mReader = open();
    mLayout = mReader->layout();
    mFormat = mReader->format();
    mDecoded = mReader->decoded();
    mDurationUs = mReader->durationUs();
    mThread = std::thread([this] { run(); });
}

PrefetchedPcm::~PrefetchedPcm() { finish(); }

void PrefetchedPcm::run() {
    bool first = true, any = false;
    try {
        for (;;) {
            PcmChunk chunk;
            if (!mReader->next(&chunk)) {
                std::unique_lock<std::mutex> lock(mLock);
                if (first) {
                    mCoverage = mReader->coverage();
                    mHaveCoverage = true;
                    first = false;
                }
                // An input with nothing in it would loop for ever.
                if (!mLoop || !any || mStop) break;
                lock.unlock();
                mReader = mOpen();
                continue;
            }
            any = true;
            std::unique_lock<std::mutex> lock(mLock);
            mChanged.wait(lock, [&] { return mStop || (mQueuedBytes < kMaxQueuedBytes && mQueue.size() < kMaxQueuedChunks); });
            if (mStop) break;
            mQueuedBytes += chunk.bytes.size();
            mQueue.push_back(std::move(chunk));
            mChanged.notify_all();
        }
    } catch (const ToolError& e) {
        std::lock_guard<std::mutex> lock(mLock);
        mFailed = true;
        mErrorCode = e.code;
        mError = e.what();
    } catch (const std::exception& e) {
        std::lock_guard<std::mutex> lock(mLock);
        mFailed = true;
        mErrorCode = kExitBadInput;
        mError = e.what();
    }
    std::lock_guard<std::mutex> lock(mLock);
    mDone = true;
    mChanged.notify_all();
}

bool PrefetchedPcm::next(PcmChunk* chunk) {
    std::unique_lock<std::mutex> lock(mLock);
    mChanged.wait(lock, [&] { return !mQueue.empty() || mDone; });
    if (mQueue.empty()) {
        if (mFailed) throw ToolError(mErrorCode, mError);
        return false;
    }
    *chunk = std::move(mQueue.front());
    mQueue.pop_front();
    mQueuedBytes -= chunk->bytes.size();
    mChanged.notify_all();
    return true;
}

const ReadCoverage& PrefetchedPcm::finish() {
    {
        std::lock_guard<std::mutex> lock(mLock);
        mStop = true;
        mChanged.notify_all();
    }
    if (mThread.joinable()) mThread.join();
    // Stopped before the end: what was read so far.
    if (!mHaveCoverage && mReader != nullptr) {
        mCoverage = mReader->coverage();
        mHaveCoverage = true;
    }
    return mCoverage;
}

}  // namespace qnedit
