#include <media/stagefright/foundation/AString.h>

#include <algorithm>
#include <cctype>
#include <cstdarg>
#include <cstdio>
#include <cstdlib>
#include <cstring>
#include <strings.h>

#include <utils/String8.h>

namespace android {

AString::AString(const String8& from) : mString(from.string(), from.length()) {}

void AString::trim() {
    const auto notSpace = [](unsigned char c) { return !isspace(c); };
    mString.erase(mString.begin(), std::find_if(mString.begin(), mString.end(), notSpace));
    mString.erase(std::find_if(mString.rbegin(), mString.rend(), notSpace).base(), mString.end());
}

void AString::append(int x) { mString += std::to_string(x); }
void AString::append(unsigned x) { mString += std::to_string(x); }
void AString::append(long x) { mString += std::to_string(x); }
void AString::append(unsigned long x) { mString += std::to_string(x); }
void AString::append(long long x) { mString += std::to_string(x); }
void AString::append(unsigned long long x) { mString += std::to_string(x); }
void AString::append(float x) { char b[32]; snprintf(b, sizeof(b), "%f", x); mString += b; }
void AString::append(double x) { char b[32]; snprintf(b, sizeof(b), "%f", x); mString += b; }
void AString::append(void* x) { char b[32]; snprintf(b, sizeof(b), "%p", x); mString += b; }

void AString::tolower() {
    for (char& c : mString) c = static_cast<char>(::tolower(static_cast<unsigned char>(c)));
}

bool AString::endsWith(const char* suffix) const {
    const size_t n = strlen(suffix);
    return n <= mString.size() && mString.compare(mString.size() - n, n, suffix) == 0;
}

bool AString::startsWithIgnoreCase(const char* prefix) const {
    const size_t n = strlen(prefix);
    return n <= mString.size() && strncasecmp(mString.c_str(), prefix, n) == 0;
}

bool AString::endsWithIgnoreCase(const char* suffix) const {
    const size_t n = strlen(suffix);
    return n <= mString.size() && strncasecmp(mString.c_str() + mString.size() - n, suffix, n) == 0;
}

bool AString::equalsIgnoreCase(const AString& other) const {
    return mString.size() == other.mString.size() && strcasecmp(mString.c_str(), other.c_str()) == 0;
}

AString AStringPrintf(const char* format, ...) {
    va_list ap;
    va_start(ap, format);
    char* buffer = nullptr;
    const int n = vasprintf(&buffer, format, ap);
    va_end(ap);
    AString result;
    if (n >= 0 && buffer) result.setTo(buffer, n);
    free(buffer);
    return result;
}

}  // namespace android
