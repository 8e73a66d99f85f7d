#ifndef ANDROID_LIST_H
#define ANDROID_LIST_H

#include <cstddef>
#include <list>

namespace android {

// Doubly linked list with the platform's member names.
template <typename T>
class List {
public:
    typedef typename std::list<T>::iterator iterator;
    typedef typename std::list<T>::const_iterator const_iterator;

    bool empty() const { return mItems.empty(); }
    size_t size() const { return mItems.size(); }
    void clear() { mItems.clear(); }
    void push_front(const T& val) { mItems.push_front(val); }
    void push_back(const T& val) { mItems.push_back(val); }
    iterator insert(iterator posn, const T& val) { return mItems.insert(posn, val); }
    iterator erase(iterator posn) { return mItems.erase(posn); }
    iterator erase(iterator first, iterator last) { return mItems.erase(first, last); }
    T& front() { return mItems.front(); }
    const T& front() const { return mItems.front(); }
    T& back() { return mItems.back(); }
    iterator begin() { return mItems.begin(); }
    iterator end() { return mItems.end(); }
    const_iterator begin() const { return mItems.begin(); }
    const_iterator end() const { return mItems.end(); }

private:
    std::list<T> mItems;
};

}  // namespace android

#endif
