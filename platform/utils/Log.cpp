#include <log/log.h>

#include <atomic>
#include <cstdio>
#include <cstdlib>
#include <mutex>
#include <string>

namespace android {
namespace {

std::mutex gSinkLock;
LogSink gSink;
std::atomic<int> gThreshold{ANDROID_LOG_WARN};

char priorityLetter(int prio) {
    static const char kLetters[] = "??VDIWEFS";
    return (prio >= 0 && prio <= ANDROID_LOG_SILENT) ? kLetters[prio] : '?';
}

void deliver(int prio, const char* tag, const char* message) {
    LogSink sink;
    {
        std::lock_guard<std::mutex> lock(gSinkLock);
        sink = gSink;
    }
    if (sink) {
        sink(prio, tag ? tag : "", message);
        return;
    }
    if (prio >= gThreshold.load(std::memory_order_relaxed)) {
        fprintf(stderr, "%c/%s: %s\n", priorityLetter(prio), tag ? tag : "", message);
    }
}

std::string formatMessage(const char* fmt, va_list ap) {
    char small[512];
    va_list copy;
    va_copy(copy, ap);
    const int n = vsnprintf(small, sizeof(small), fmt, copy);
    va_end(copy);
    if (n < 0) return std::string();
    if (static_cast<size_t>(n) < sizeof(small)) return std::string(small, n);
    std::string big(static_cast<size_t>(n) + 1, '\0');
    vsnprintf(&big[0], big.size(), fmt, ap);
    big.resize(n);
    return big;
}

}  // namespace

LogSink setLogSink(LogSink sink) {
    std::lock_guard<std::mutex> lock(gSinkLock);
    LogSink previous = std::move(gSink);
    gSink = std::move(sink);
    return previous;
}

int setLogThreshold(int priority) { return gThreshold.exchange(priority); }

}  // namespace android

extern "C" int __android_log_vprint(int prio, const char* tag, const char* fmt, va_list ap) {
    const std::string message = android::formatMessage(fmt ? fmt : "", ap);
    android::deliver(prio, tag, message.c_str());
    return 1;
}

extern "C" int __android_log_print(int prio, const char* tag, const char* fmt, ...) {
    va_list ap;
    va_start(ap, fmt);
    const int r = __android_log_vprint(prio, tag, fmt, ap);
    va_end(ap);
    return r;
}

extern "C" void __android_log_assert(const char* cond, const char* tag, const char* fmt, ...) {
    std::string message;
    if (fmt) {
        va_list ap;
        va_start(ap, fmt);
        message = android::formatMessage(fmt, ap);
        va_end(ap);
    } else if (cond) {
        message = std::string("Assertion failed: ") + cond;
    }
    android::LogSink sink = android::setLogSink(nullptr);
    if (sink) sink(ANDROID_LOG_FATAL, tag ? tag : "", message.c_str());
    // Death tests match on stderr, so the message is always printed there.
    fprintf(stderr, "F/%s: %s\n", tag ? tag : "", message.c_str());
    fflush(stderr);
    abort();
}
