#ifndef ANDROID_STRING8_H
#define ANDROID_STRING8_H

#include <cstdarg>
#include <cstddef>
#include <string>

#include <utils/Errors.h>

namespace android {

class String8 {
public:
    String8() = default;
    String8(const char* s) : mString(s ? s : "") {}
    String8(const char* s, size_t len) : mString(s ? std::string(s, len) : std::string()) {}

    const char* string() const { return mString.c_str(); }
    const char* c_str() const { return mString.c_str(); }
    size_t length() const { return mString.size(); }
    size_t size() const { return mString.size(); }
    size_t bytes() const { return mString.size(); }
    bool isEmpty() const { return mString.empty(); }

    void clear() { mString.clear(); }
    void setTo(const String8& other) { mString = other.mString; }
    status_t setTo(const char* s) { mString = s ? s : ""; return OK; }
    status_t setTo(const char* s, size_t len) { mString.assign(s, len); return OK; }
    status_t append(const String8& other) { mString += other.mString; return OK; }
    status_t append(const char* s) { if (s) mString += s; return OK; }
    status_t append(const char* s, size_t len) { mString.append(s, len); return OK; }
    status_t appendFormat(const char* fmt, ...) __attribute__((format(printf, 2, 3)));
    static String8 format(const char* fmt, ...) __attribute__((format(printf, 1, 2)));

    operator const char*() const { return mString.c_str(); }
    bool operator==(const String8& o) const { return mString == o.mString; }
    bool operator!=(const String8& o) const { return mString != o.mString; }
    bool operator<(const String8& o) const { return mString < o.mString; }
    String8& operator+=(const String8& o) { mString += o.mString; return *this; }
    String8& operator+=(const char* s) { append(s); return *this; }

    const std::string& std_string() const { return mString; }

private:
    std::string mString;
};

}  // namespace android

#endif
