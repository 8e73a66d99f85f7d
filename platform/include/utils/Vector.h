#ifndef ANDROID_VECTOR_H
#define ANDROID_VECTOR_H

#include <cstddef>
#include <sys/types.h>
#include <vector>

namespace android {

// Ordered container with the platform's member names; elements are copied
// and moved as the vector grows or shrinks.
template <class TYPE>
class Vector {
public:
    typedef TYPE value_type;
    typedef typename std::vector<TYPE>::iterator iterator;
    typedef typename std::vector<TYPE>::const_iterator const_iterator;

    size_t size() const { return mItems.size(); }
    bool isEmpty() const { return mItems.empty(); }
    bool empty() const { return mItems.empty(); }
    size_t capacity() const { return mItems.capacity(); }
    ssize_t setCapacity(size_t size) { mItems.reserve(size); return static_cast<ssize_t>(mItems.capacity()); }
    ssize_t resize(size_t size) { mItems.resize(size); return static_cast<ssize_t>(size); }
    void clear() { mItems.clear(); }

    const TYPE* array() const { return mItems.data(); }
    TYPE* editArray() { return mItems.data(); }
    const TYPE& operator[](size_t index) const { return mItems[index]; }
    TYPE& operator[](size_t index) { return mItems[index]; }
    const TYPE& itemAt(size_t index) const { return mItems[index]; }
    TYPE& editItemAt(size_t index) { return mItems[index]; }
    const TYPE& top() const { return mItems.back(); }
    TYPE& editTop() { return mItems.back(); }

    ssize_t add(const TYPE& item) { mItems.push_back(item); return static_cast<ssize_t>(mItems.size() - 1); }
    ssize_t add() { mItems.emplace_back(); return static_cast<ssize_t>(mItems.size() - 1); }
    ssize_t push() { return add(); }
    void push(const TYPE& item) { add(item); }
    void push_back(const TYPE& item) { mItems.push_back(item); }
    void push_front(const TYPE& item) { insertAt(item, 0); }
    void pop() { if (!mItems.empty()) mItems.pop_back(); }
    ssize_t insertAt(const TYPE& item, size_t index, size_t numItems = 1) {
        mItems.insert(mItems.begin() + index, numItems, item);
        return static_cast<ssize_t>(index);
    }
    ssize_t insertAt(size_t index, size_t numItems = 1) { return insertAt(TYPE(), index, numItems); }
    ssize_t replaceAt(const TYPE& item, size_t index) { mItems[index] = item; return static_cast<ssize_t>(index); }
    ssize_t removeAt(size_t index) { return removeItemsAt(index, 1); }
    ssize_t removeItemsAt(size_t index, size_t count = 1) {
        if (index >= mItems.size()) return -1;
        if (count > mItems.size() - index) count = mItems.size() - index;
        mItems.erase(mItems.begin() + index, mItems.begin() + index + count);
        return static_cast<ssize_t>(index);
    }

    iterator begin() { return mItems.begin(); }
    iterator end() { return mItems.end(); }
    const_iterator begin() const { return mItems.begin(); }
    const_iterator end() const { return mItems.end(); }

private:
    std::vector<TYPE> mItems;
};

}  // namespace android

#endif
