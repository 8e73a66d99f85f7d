#include "Json.h"

#include <cinttypes>
#include <cmath>
#include <cstdio>

namespace qnedit {

void Json::prefix(const char* key) {
    if (!mFirst.empty()) {
        mOut += mFirst.back() ? "\n" : ",\n";
        mFirst.back() = false;
        mOut.append(mFirst.size() * 2, ' ');
    }
    if (key != nullptr) {
        mOut += quote(key);
        mOut += ": ";
    }
}

std::string Json::quote(const std::string& s) {
    std::string out = "\"";
    for (unsigned char c : s) {
        switch (c) {
            case '"': out += "\\\""; break;
            case '\\': out += "\\\\"; break;
            case '\n': out += "\\n"; break;
            case '\r': out += "\\r"; break;
            case '\t': out += "\\t"; break;
            default:
                if (c < 0x20) {
                    char b[8];
                    snprintf(b, sizeof(b), "\\u%04x", c);
                    out += b;
                } else {
                    out += static_cast<char>(c);
                }
        }
    }
    return out + "\"";
}

Json& Json::beginObject(const char* key) {
    prefix(key);
    mOut += "{";
    mFirst.push_back(true);
    return *this;
}

Json& Json::endObject() {
    const bool empty = mFirst.back();
    mFirst.pop_back();
    if (!empty) {
        mOut += "\n";
        mOut.append(mFirst.size() * 2, ' ');
    }
    mOut += "}";
    if (mFirst.empty()) mOut += "\n";
    return *this;
}

Json& Json::beginArray(const char* key) {
    prefix(key);
    mOut += "[";
    mFirst.push_back(true);
    return *this;
}

Json& Json::endArray() {
    const bool empty = mFirst.back();
    mFirst.pop_back();
    if (!empty) {
        mOut += "\n";
        mOut.append(mFirst.size() * 2, ' ');
    }
    mOut += "]";
    return *this;
}

Json& Json::value(const char* key, const std::string& v) {
    prefix(key);
    mOut += quote(v);
    return *this;
}

Json& Json::value(const char* key, int64_t v) {
    prefix(key);
    char b[32];
    snprintf(b, sizeof(b), "%" PRId64, v);
    mOut += b;
    return *this;
}

Json& Json::value(const char* key, double v) {
    prefix(key);
    if (!std::isfinite(v)) {
        mOut += "null";
        return *this;
    }
    char b[40];
    snprintf(b, sizeof(b), "%.6f", v);
    mOut += b;
    return *this;
}

Json& Json::value(const char* key, bool v) {
    prefix(key);
    mOut += v ? "true" : "false";
    return *this;
}

Json& Json::null(const char* key) {
    prefix(key);
    mOut += "null";
    return *this;
}

}  // namespace qnedit
