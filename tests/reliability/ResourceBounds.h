#ifndef TESTS_RELIABILITY_RESOURCE_BOUNDS_H
#define TESTS_RELIABILITY_RESOURCE_BOUNDS_H

#include <sys/resource.h>

#include <atomic>
#include <chrono>
#include <condition_variable>
#include <cstdio>
#include <cstdlib>
#include <mutex>
#include <string>
#include <thread>

#include "reliability/Sanitizers.h"

#if defined(TESTS_WITH_ASAN)
extern "C" {
size_t __sanitizer_get_current_allocated_bytes(void);
int __sanitizer_install_malloc_and_free_hooks(void (*malloc_hook)(const volatile void*, size_t),
                                              void (*free_hook)(const volatile void*));
}
#endif

namespace reliability {

// Ends the process with the case's name when one case runs past its limit: a
// hang must not stall the suite, and ctest's own timeout would not say which
// input caused it.
class Watchdog {
public:
    explicit Watchdog(std::chrono::seconds limit) : mLimit(limit), mThread([this] { watch(); }) {}
    ~Watchdog() {
        {
            std::lock_guard<std::mutex> lock(mLock);
            mQuit = true;
        }
        mWake.notify_all();
        mThread.join();
    }
    void arm(const std::string& what) {
        std::lock_guard<std::mutex> lock(mLock);
        mWhat = what;
        mDeadline = std::chrono::steady_clock::now() + mLimit;
        mArmed = true;
        mWake.notify_all();
    }
    void disarm() {
        std::lock_guard<std::mutex> lock(mLock);
        mArmed = false;
    }

private:
    void watch() {
        std::unique_lock<std::mutex> lock(mLock);
        while (!mQuit) {
            if (!mArmed) {
                mWake.wait(lock);
            } else if (mWake.wait_until(lock, mDeadline) == std::cv_status::timeout && mArmed &&
                       std::chrono::steady_clock::now() >= mDeadline) {
                fprintf(stderr, "%s ran for more than %llds\n", mWhat.c_str(),
                        static_cast<long long>(mLimit.count()));
                fflush(stderr);
                std::abort();
            }
        }
    }

    const std::chrono::seconds mLimit;
    std::mutex mLock;
    std::condition_variable mWake;
    std::string mWhat;
    std::chrono::steady_clock::time_point mDeadline;
    bool mArmed = false;
    bool mQuit = false;
    std::thread mThread;
};

// How far the heap grew while alive. Under AddressSanitizer the allocator's
// own count is exact (resident size would include its quarantine); elsewhere
// the resident high-water mark stands in for it, which also catches an
// allocation that is filled, though not one that is merely reserved.
class HeapGrowth {
public:
    HeapGrowth() {
#if defined(TESTS_WITH_ASAN)
        static const int installed = __sanitizer_install_malloc_and_free_hooks(onMalloc, onFree);
        (void)installed;
        mBase = __sanitizer_get_current_allocated_bytes();
        peak() = mBase;
        largest() = 0;
#else
        mBase = residentPeak();
#endif
    }
    size_t peakGrowth() const {
#if defined(TESTS_WITH_ASAN)
        return peak() > mBase ? peak() - mBase : 0;
#else
        const size_t now = residentPeak();
        return now > mBase ? now - mBase : 0;
#endif
    }
    // The largest single request seen; 0 where it cannot be observed.
    size_t largestAllocation() const {
#if defined(TESTS_WITH_ASAN)
        return largest();
#else
        return 0;
#endif
    }

private:
#if defined(TESTS_WITH_ASAN)
    static std::atomic<size_t>& peak() {
        static std::atomic<size_t> value{0};
        return value;
    }
    static std::atomic<size_t>& largest() {
        static std::atomic<size_t> value{0};
        return value;
    }
    static void onMalloc(const volatile void*, size_t size) {
        const size_t now = __sanitizer_get_current_allocated_bytes();
        for (size_t p = peak(); now > p && !peak().compare_exchange_weak(p, now);) {
        }
        for (size_t l = largest(); size > l && !largest().compare_exchange_weak(l, size);) {
        }
    }
    static void onFree(const volatile void*) {}
#endif
    static size_t residentPeak() {
        struct rusage usage;
        getrusage(RUSAGE_SELF, &usage);
        return static_cast<size_t>(usage.ru_maxrss) * 1024;
    }
    size_t mBase;
};

}  // namespace reliability

#endif
