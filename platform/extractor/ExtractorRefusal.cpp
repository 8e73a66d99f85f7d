#include <media/stagefright/ExtractorRefusal.h>

#include <cstdarg>
#include <cstdio>

namespace android {

namespace {
thread_local std::string tReason;
}  // namespace

void setRefusalReason(const char* fmt, ...) {
    char text[256];
    va_list ap;
    va_start(ap, fmt);
    const int n = vsnprintf(text, sizeof(text), fmt, ap);
    va_end(ap);
    tReason.assign(n > 0 ? text : "");
}

std::string takeRefusalReason() {
    std::string reason;
    reason.swap(tReason);
    return reason;
}

const std::string& peekRefusalReason() { return tReason; }

void clearRefusalReason() { tReason.clear(); }

}  // namespace android
