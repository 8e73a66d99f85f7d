#ifndef QNEDIT_JSON_H
#define QNEDIT_JSON_H

#include <cstdint>
#include <string>
#include <vector>

namespace qnedit {

// A small streaming JSON writer with stable key order (the order of calls)
// and two-space indentation.
class Json {
public:
    Json& beginObject(const char* key = nullptr);
    Json& endObject();
    Json& beginArray(const char* key = nullptr);
    Json& endArray();
    Json& value(const char* key, const std::string& v);
    Json& value(const char* key, const char* v) { return value(key, std::string(v ? v : "")); }
    Json& value(const char* key, int64_t v);
    Json& value(const char* key, int v) { return value(key, static_cast<int64_t>(v)); }
    Json& value(const char* key, double v);
    Json& value(const char* key, bool v);
    Json& null(const char* key);
    const std::string& str() const { return mOut; }

private:
    void prefix(const char* key);
    static std::string quote(const std::string& s);

    std::string mOut;
    std::vector<bool> mFirst;  // per open container: no member written yet
};

}  // namespace qnedit

#endif
