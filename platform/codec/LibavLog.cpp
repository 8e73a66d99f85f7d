#define LOG_TAG "LibavLog"
#include "codec/LibavLog.h"

#include <cstdarg>
#include <cstdio>
#include <cstring>
#include <mutex>

#include <log/log.h>

extern "C" {
#include <libavutil/log.h>
}

namespace android {

namespace {

void ForwardLog(void*, int level, const char* format, va_list args) {
    if (level > AV_LOG_ERROR) return;
    char line[256];
    vsnprintf(line, sizeof(line), format, args);
    const size_t n = strlen(line);
    if (n > 0 && line[n - 1] == '\n') line[n - 1] = '\0';
    ALOGW("codec: %s", line);
}

}  // namespace

void RouteLibavLog() {
    static std::once_flag once;
    std::call_once(once, [] { av_log_set_callback(ForwardLog); });
}

}  // namespace android
