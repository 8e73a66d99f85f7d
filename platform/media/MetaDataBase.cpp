#include <media/stagefright/MetaDataBase.h>

#include <cinttypes>
#include <cstring>

#include <log/log.h>

namespace android {

MetaDataBase::MetaDataBase() = default;
MetaDataBase::MetaDataBase(const MetaDataBase& from) = default;
MetaDataBase& MetaDataBase::operator=(const MetaDataBase& rhs) = default;
MetaDataBase::~MetaDataBase() = default;

void MetaDataBase::clear() { mItems.clear(); }

bool MetaDataBase::remove(uint32_t key) { return mItems.erase(key) > 0; }

bool MetaDataBase::setData(uint32_t key, uint32_t type, const void* data, size_t size) {
    typed_data& item = mItems[key];
    const bool overwrote = item.mType != TYPE_NONE;
    item.mType = type;
    const uint8_t* bytes = static_cast<const uint8_t*>(data);
    if (bytes != nullptr && size > 0) {
        item.mData.assign(bytes, bytes + size);
    } else {
        item.mData.clear();
    }
    return overwrote;
}

bool MetaDataBase::findData(uint32_t key, uint32_t* type, const void** data, size_t* size) const {
    auto it = mItems.find(key);
    if (it == mItems.end()) return false;
    *type = it->second.mType;
    *data = it->second.mData.data();
    *size = it->second.mData.size();
    return true;
}

bool MetaDataBase::hasData(uint32_t key) const { return mItems.count(key) > 0; }

bool MetaDataBase::setCString(uint32_t key, const char* value) {
    return setData(key, TYPE_C_STRING, value, value ? strlen(value) + 1 : 0);
}
bool MetaDataBase::setInt32(uint32_t key, int32_t value) { return setData(key, TYPE_INT32, &value, sizeof(value)); }
bool MetaDataBase::setInt64(uint32_t key, int64_t value) { return setData(key, TYPE_INT64, &value, sizeof(value)); }
bool MetaDataBase::setFloat(uint32_t key, float value) { return setData(key, TYPE_FLOAT, &value, sizeof(value)); }
bool MetaDataBase::setPointer(uint32_t key, void* value) { return setData(key, TYPE_POINTER, &value, sizeof(value)); }
bool MetaDataBase::setRect(uint32_t key, int32_t left, int32_t top, int32_t right, int32_t bottom) {
    const int32_t r[4] = {left, top, right, bottom};
    return setData(key, TYPE_RECT, r, sizeof(r));
}

namespace {
template <typename T>
bool findTyped(const MetaDataBase& m, uint32_t key, uint32_t wanted, T* out) {
    uint32_t type;
    const void* data;
    size_t size;
    if (!m.findData(key, &type, &data, &size) || type != wanted || size != sizeof(T)) return false;
    memcpy(out, data, sizeof(T));
    return true;
}
}  // namespace

bool MetaDataBase::findCString(uint32_t key, const char** value) const {
    auto it = mItems.find(key);
    if (it == mItems.end() || it->second.mType != TYPE_C_STRING) return false;
    // An empty string is stored without bytes.
    static const char kEmpty[] = "";
    *value = it->second.mData.empty() ? kEmpty : reinterpret_cast<const char*>(it->second.mData.data());
    return true;
}
bool MetaDataBase::findInt32(uint32_t key, int32_t* value) const { return findTyped(*this, key, TYPE_INT32, value); }
bool MetaDataBase::findInt64(uint32_t key, int64_t* value) const { return findTyped(*this, key, TYPE_INT64, value); }
bool MetaDataBase::findFloat(uint32_t key, float* value) const { return findTyped(*this, key, TYPE_FLOAT, value); }
bool MetaDataBase::findPointer(uint32_t key, void** value) const { return findTyped(*this, key, TYPE_POINTER, value); }
bool MetaDataBase::findRect(uint32_t key, int32_t* left, int32_t* top, int32_t* right, int32_t* bottom) const {
    int32_t r[4];
    uint32_t type;
    const void* data;
    size_t size;
    if (!findData(key, &type, &data, &size) || type != TYPE_RECT || size != sizeof(r)) return false;
    memcpy(r, data, sizeof(r));
    *left = r[0];
    *top = r[1];
    *right = r[2];
    *bottom = r[3];
    return true;
}

std::vector<uint32_t> MetaDataBase::keys() const {
    std::vector<uint32_t> result;
    result.reserve(mItems.size());
    for (const auto& entry : mItems) result.push_back(entry.first);
    return result;
}

String8 MetaDataBase::toString() const {
    String8 s;
    for (const auto& entry : mItems) {
        const uint32_t k = entry.first;
        s.appendFormat("%c%c%c%c: type %08x, %zu bytes\n", (char)(k >> 24), (char)(k >> 16), (char)(k >> 8),
                       (char)k, entry.second.mType, entry.second.mData.size());
    }
    return s;
}

void MetaDataBase::dumpToLog() const {
    __android_log_print(ANDROID_LOG_INFO, "MetaData", "%s", toString().string());
}

}  // namespace android
