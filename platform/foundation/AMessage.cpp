#include <media/stagefright/foundation/AMessage.h>

#include <cinttypes>
#include <cstring>

#include <media/stagefright/foundation/ABuffer.h>

namespace android {

AMessage::AMessage() : mWhat(0) {}
AMessage::AMessage(uint32_t what) : mWhat(what) {}
AMessage::~AMessage() {}

const AMessage::Item* AMessage::findItem(const char* name, Type type) const {
    for (const Item& item : mItems) {
        if (item.mName == name) return item.mType == type ? &item : nullptr;
    }
    return nullptr;
}

AMessage::Item* AMessage::findItem(const char* name, Type type) {
    return const_cast<Item*>(static_cast<const AMessage*>(this)->findItem(name, type));
}

AMessage::Item* AMessage::allocateItem(const char* name, Type type) {
    for (Item& item : mItems) {
        if (item.mName == name) {
            item.mString.clear();
            item.mObject.clear();
            item.mType = type;
            memset(&item.u, 0, sizeof(item.u));
            return &item;
        }
    }
    mItems.emplace_back();
    Item& item = mItems.back();
    item.mName = name;
    item.mType = type;
    memset(&item.u, 0, sizeof(item.u));
    return &item;
}

#define BASIC_TYPE(NAME, FIELD, TYPENAME)                                  \
    void AMessage::set##NAME(const char* name, TYPENAME value) {           \
        allocateItem(name, kType##NAME)->u.FIELD = value;                  \
    }                                                                      \
    bool AMessage::find##NAME(const char* name, TYPENAME* value) const {   \
        const Item* item = findItem(name, kType##NAME);                    \
        if (item == nullptr) return false;                                 \
        *value = item->u.FIELD;                                            \
        return true;                                                       \
    }

BASIC_TYPE(Int32, int32Value, int32_t)
BASIC_TYPE(Int64, int64Value, int64_t)
BASIC_TYPE(Size, sizeValue, size_t)
BASIC_TYPE(Float, floatValue, float)
BASIC_TYPE(Double, doubleValue, double)
BASIC_TYPE(Pointer, ptrValue, void*)

#undef BASIC_TYPE

void AMessage::setString(const char* name, const char* s, ssize_t len) {
    Item* item = allocateItem(name, kTypeString);
    if (s == nullptr) return;
    item->mString.assign(s, len < 0 ? strlen(s) : static_cast<size_t>(len));
}

void AMessage::setString(const char* name, const AString& s) { setString(name, s.c_str(), s.size()); }

void AMessage::setObject(const char* name, const sp<RefBase>& obj) {
    allocateItem(name, kTypeObject)->mObject = obj;
}

void AMessage::setBuffer(const char* name, const sp<ABuffer>& buffer) {
    allocateItem(name, kTypeBuffer)->mObject = sp<RefBase>(buffer.get());
}

void AMessage::setMessage(const char* name, const sp<AMessage>& obj) {
    allocateItem(name, kTypeMessage)->mObject = sp<RefBase>(obj.get());
}

void AMessage::setRect(const char* name, int32_t left, int32_t top, int32_t right, int32_t bottom) {
    Item* item = allocateItem(name, kTypeRect);
    item->u.rectValue = Rect{left, top, right, bottom};
}

bool AMessage::contains(const char* name) const {
    for (const Item& item : mItems) {
        if (item.mName == name) return true;
    }
    return false;
}

bool AMessage::findString(const char* name, AString* value) const {
    const Item* item = findItem(name, kTypeString);
    if (item == nullptr) return false;
    value->setTo(item->mString.data(), item->mString.size());
    return true;
}

bool AMessage::findObject(const char* name, sp<RefBase>* obj) const {
    const Item* item = findItem(name, kTypeObject);
    if (item == nullptr) return false;
    *obj = item->mObject;
    return true;
}

bool AMessage::findBuffer(const char* name, sp<ABuffer>* buffer) const {
    const Item* item = findItem(name, kTypeBuffer);
    if (item == nullptr) return false;
    *buffer = static_cast<ABuffer*>(item->mObject.get());
    return true;
}

bool AMessage::findMessage(const char* name, sp<AMessage>* obj) const {
    const Item* item = findItem(name, kTypeMessage);
    if (item == nullptr) return false;
    *obj = static_cast<AMessage*>(item->mObject.get());
    return true;
}

bool AMessage::findRect(const char* name, int32_t* left, int32_t* top, int32_t* right,
                        int32_t* bottom) const {
    const Item* item = findItem(name, kTypeRect);
    if (item == nullptr) return false;
    *left = item->u.rectValue.mLeft;
    *top = item->u.rectValue.mTop;
    *right = item->u.rectValue.mRight;
    *bottom = item->u.rectValue.mBottom;
    return true;
}

bool AMessage::findAsInt64(const char* name, int64_t* value) const {
    for (const Item& item : mItems) {
        if (item.mName != name) continue;
        switch (item.mType) {
            case kTypeInt32: *value = item.u.int32Value; return true;
            case kTypeInt64: *value = item.u.int64Value; return true;
            case kTypeSize: *value = static_cast<int64_t>(item.u.sizeValue); return true;
            default: return false;
        }
    }
    return false;
}

bool AMessage::removeEntryAt(size_t index) {
    if (index >= mItems.size()) return false;
    mItems.erase(mItems.begin() + index);
    return true;
}

bool AMessage::removeEntry(const char* name) {
    for (size_t i = 0; i < mItems.size(); ++i) {
        if (mItems[i].mName == name) return removeEntryAt(i);
    }
    return false;
}

void AMessage::clear() { mItems.clear(); }

sp<AMessage> AMessage::dup() const {
    sp<AMessage> msg = new AMessage(mWhat);
    msg->mItems = mItems;
    for (Item& item : msg->mItems) {
        if (item.mType == kTypeMessage && item.mObject != nullptr) {
            item.mObject = sp<RefBase>(static_cast<AMessage*>(item.mObject.get())->dup().get());
        }
    }
    return msg;
}

const char* AMessage::getEntryNameAt(size_t index, Type* type) const {
    if (index >= mItems.size()) return nullptr;
    if (type) *type = mItems[index].mType;
    return mItems[index].mName.c_str();
}

AString AMessage::debugString(int32_t indent) const {
    AString s("AMessage(what = ");
    s.append(static_cast<unsigned>(mWhat));
    s.append(") = {\n");
    for (const Item& item : mItems) {
        s.append(std::string(indent + 2, ' ').c_str());
        char line[256];
        switch (item.mType) {
            case kTypeInt32: snprintf(line, sizeof(line), "int32_t %s = %d", item.mName.c_str(), item.u.int32Value); break;
            case kTypeInt64: snprintf(line, sizeof(line), "int64_t %s = %" PRId64, item.mName.c_str(), item.u.int64Value); break;
            case kTypeSize: snprintf(line, sizeof(line), "size_t %s = %zu", item.mName.c_str(), item.u.sizeValue); break;
            case kTypeFloat: snprintf(line, sizeof(line), "float %s = %f", item.mName.c_str(), item.u.floatValue); break;
            case kTypeDouble: snprintf(line, sizeof(line), "double %s = %f", item.mName.c_str(), item.u.doubleValue); break;
            case kTypePointer: snprintf(line, sizeof(line), "void *%s = %p", item.mName.c_str(), item.u.ptrValue); break;
            case kTypeString: snprintf(line, sizeof(line), "string %s = \"%.200s\"", item.mName.c_str(), item.mString.c_str()); break;
            case kTypeRect:
                snprintf(line, sizeof(line), "Rect %s(%d, %d, %d, %d)", item.mName.c_str(), item.u.rectValue.mLeft,
                         item.u.rectValue.mTop, item.u.rectValue.mRight, item.u.rectValue.mBottom);
                break;
            case kTypeBuffer: {
                const ABuffer* b = static_cast<const ABuffer*>(item.mObject.get());
                snprintf(line, sizeof(line), "ABuffer %s = %zu bytes", item.mName.c_str(), b ? b->size() : 0);
                break;
            }
            default: snprintf(line, sizeof(line), "%s %s", item.mType == kTypeMessage ? "AMessage" : "RefBase", item.mName.c_str()); break;
        }
        s.append(line);
        s.append("\n");
    }
    s.append(std::string(indent, ' ').c_str());
    s.append("}");
    return s;
}

}  // namespace android
