#ifndef A_STRING_H_
#define A_STRING_H_

#include <cstddef>
#include <string>

#include <utils/Errors.h>

namespace android {

class String8;

struct AString {
    AString() = default;
    AString(const char* s) : mString(s ? s : "") {}
    AString(const char* s, size_t size) : mString(s, size) {}
    AString(const String8& from);
    AString(const AString& from, size_t offset, size_t n) : mString(from.mString, offset, n) {}

    void setTo(const char* s) { mString = s ? s : ""; }
    void setTo(const char* s, size_t size) { mString.assign(s, size); }
    void setTo(const AString& from, size_t offset, size_t n) { mString.assign(from.mString, offset, n); }
    size_t size() const { return mString.size(); }
    const char* c_str() const { return mString.c_str(); }
    bool empty() const { return mString.empty(); }
    void clear() { mString.clear(); }
    void trim();
    void erase(size_t start, size_t n) { mString.erase(start, n); }
    void append(char c) { mString.push_back(c); }
    void append(const char* s) { if (s) mString += s; }
    void append(const char* s, size_t size) { mString.append(s, size); }
    void append(const AString& from) { mString += from.mString; }
    void append(const AString& from, size_t offset, size_t n) { mString.append(from.mString, offset, n); }
    void append(int x);
    void append(unsigned x);
    void append(long x);
    void append(unsigned long x);
    void append(long long x);
    void append(unsigned long long x);
    void append(float x);
    void append(double x);
    void append(void* x);
    void insert(const AString& from, size_t insertionPos) { mString.insert(insertionPos, from.mString); }
    void insert(const char* from, size_t size, size_t insertionPos) { mString.insert(insertionPos, from, size); }
    ssize_t find(const char* substring, size_t start = 0) const {
        const size_t pos = mString.find(substring, start);
        return pos == std::string::npos ? -1 : static_cast<ssize_t>(pos);
    }
    void tolower();
    bool startsWith(const char* prefix) const { return mString.rfind(prefix, 0) == 0; }
    bool endsWith(const char* suffix) const;
    bool startsWithIgnoreCase(const char* prefix) const;
    bool endsWithIgnoreCase(const char* suffix) const;
    int compare(const AString& other) const { return mString.compare(other.mString); }
    bool equalsIgnoreCase(const AString& other) const;

    bool operator==(const AString& other) const { return mString == other.mString; }
    bool operator!=(const AString& other) const { return mString != other.mString; }
    bool operator<(const AString& other) const { return mString < other.mString; }
    bool operator>(const AString& other) const { return mString > other.mString; }
    char operator[](size_t i) const { return mString[i]; }

private:
    std::string mString;
};

AString AStringPrintf(const char* format, ...) __attribute__((format(printf, 1, 2)));

}  // namespace android

#endif
