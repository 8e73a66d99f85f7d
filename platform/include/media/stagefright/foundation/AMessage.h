#ifndef A_MESSAGE_H_
#define A_MESSAGE_H_

#include <cstddef>
#include <cstdint>
#include <vector>
#include <sys/types.h>
#include <string>

#include <media/stagefright/foundation/ABase.h>
#include <media/stagefright/foundation/AString.h>
#include <utils/RefBase.h>

namespace android {

struct ABuffer;

// String keys to typed values. A find answers false for an absent key or a
// value of another type. Entries keep the order in which they were first set.
struct AMessage : public RefBase {
    enum Type {
        kTypeInt32,
        kTypeInt64,
        kTypeSize,
        kTypeFloat,
        kTypeDouble,
        kTypePointer,
        kTypeString,
        kTypeObject,
        kTypeMessage,
        kTypeRect,
        kTypeBuffer,
    };

    AMessage();
    explicit AMessage(uint32_t what);

    void setWhat(uint32_t what) { mWhat = what; }
    uint32_t what() const { return mWhat; }

    void setInt32(const char* name, int32_t value);
    void setInt64(const char* name, int64_t value);
    void setSize(const char* name, size_t value);
    void setFloat(const char* name, float value);
    void setDouble(const char* name, double value);
    void setPointer(const char* name, void* value);
    void setString(const char* name, const char* s, ssize_t len = -1);
    void setString(const char* name, const AString& s);
    void setObject(const char* name, const sp<RefBase>& obj);
    void setBuffer(const char* name, const sp<ABuffer>& buffer);
    void setMessage(const char* name, const sp<AMessage>& obj);
    void setRect(const char* name, int32_t left, int32_t top, int32_t right, int32_t bottom);

    bool contains(const char* name) const;

    bool findInt32(const char* name, int32_t* value) const;
    bool findInt64(const char* name, int64_t* value) const;
    bool findSize(const char* name, size_t* value) const;
    bool findFloat(const char* name, float* value) const;
    bool findDouble(const char* name, double* value) const;
    bool findPointer(const char* name, void** value) const;
    bool findString(const char* name, AString* value) const;
    bool findObject(const char* name, sp<RefBase>* obj) const;
    bool findBuffer(const char* name, sp<ABuffer>* buffer) const;
    bool findMessage(const char* name, sp<AMessage>* obj) const;
    bool findRect(const char* name, int32_t* left, int32_t* top, int32_t* right, int32_t* bottom) const;
    // Any integer type widened to 64 bits.
    bool findAsInt64(const char* name, int64_t* value) const;

    bool removeEntryAt(size_t index);
    bool removeEntry(const char* name);

    void clear();
    // A copy whose nested messages are copied too; buffers and objects are shared.
    sp<AMessage> dup() const;

    size_t countEntries() const { return mItems.size(); }
    const char* getEntryNameAt(size_t index, Type* type) const;

    AString debugString(int32_t indent = 0) const;

protected:
    virtual ~AMessage();

private:
    struct Rect { int32_t mLeft, mTop, mRight, mBottom; };
    struct Item {
        std::string mName;
        Type mType;
        union {
            int32_t int32Value;
            int64_t int64Value;
            size_t sizeValue;
            float floatValue;
            double doubleValue;
            void* ptrValue;
            Rect rectValue;
        } u;
        std::string mString;
        sp<RefBase> mObject;
    };

    Item* findItem(const char* name, Type type);
    const Item* findItem(const char* name, Type type) const;
    Item* allocateItem(const char* name, Type type);

    uint32_t mWhat;
    std::vector<Item> mItems;

    DISALLOW_EVIL_CONSTRUCTORS(AMessage);
};

}  // namespace android

#endif
