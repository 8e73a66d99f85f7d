#include <utils/String8.h>

#include <cstdio>
#include <cstdlib>

namespace android {

status_t String8::appendFormat(const char* fmt, ...) {
    va_list ap;
    va_start(ap, fmt);
    char* buffer = nullptr;
    const int n = vasprintf(&buffer, fmt, ap);
    va_end(ap);
    if (n < 0 || !buffer) return NO_MEMORY;
    mString.append(buffer, n);
    free(buffer);
    return OK;
}

String8 String8::format(const char* fmt, ...) {
    va_list ap;
    va_start(ap, fmt);
    char* buffer = nullptr;
    const int n = vasprintf(&buffer, fmt, ap);
    va_end(ap);
    String8 result;
    if (n >= 0 && buffer) result.setTo(buffer, n);
    free(buffer);
    return result;
}

}  // namespace android
