#ifndef ANDROID_STRONG_POINTER_H
#define ANDROID_STRONG_POINTER_H

#include <cstddef>
#include <utility>

namespace android {

template <typename T> class wp;

template <typename T>
class sp {
public:
    sp() : m_ptr(nullptr) {}
    sp(std::nullptr_t) : m_ptr(nullptr) {}
    sp(T* other) : m_ptr(other) { if (m_ptr) m_ptr->incStrong(this); }
    sp(const sp<T>& other) : m_ptr(other.m_ptr) { if (m_ptr) m_ptr->incStrong(this); }
    sp(sp<T>&& other) noexcept : m_ptr(other.m_ptr) { other.m_ptr = nullptr; }
    template <typename U> sp(U* other) : m_ptr(other) { if (m_ptr) m_ptr->incStrong(this); }
    template <typename U> sp(const sp<U>& other) : m_ptr(other.get()) { if (m_ptr) m_ptr->incStrong(this); }
    template <typename U> sp(sp<U>&& other) : m_ptr(other.get()) { other.set_pointer(nullptr); }
    ~sp() { if (m_ptr) m_ptr->decStrong(this); }

    sp& operator=(T* other) {
        if (other) other->incStrong(this);
        T* old = m_ptr;
        m_ptr = other;
        if (old) old->decStrong(this);
        return *this;
    }
    sp& operator=(const sp<T>& other) { return *this = other.m_ptr; }
    sp& operator=(sp<T>&& other) noexcept {
        if (this != &other) {
            T* old = m_ptr;
            m_ptr = other.m_ptr;
            other.m_ptr = nullptr;
            if (old) old->decStrong(this);
        }
        return *this;
    }
    template <typename U> sp& operator=(const sp<U>& other) { return *this = static_cast<T*>(other.get()); }
    template <typename U> sp& operator=(U* other) { return *this = static_cast<T*>(other); }
    sp& operator=(std::nullptr_t) { clear(); return *this; }

    template <typename U> static sp<T> cast(const sp<U>& other) { return sp<T>(static_cast<T*>(other.get())); }
    template <typename... Args> static sp<T> make(Args&&... args) { return sp<T>(new T(std::forward<Args>(args)...)); }

    void clear() {
        T* old = m_ptr;
        m_ptr = nullptr;
        if (old) old->decStrong(this);
    }

    T& operator*() const { return *m_ptr; }
    T* operator->() const { return m_ptr; }
    T* get() const { return m_ptr; }
    explicit operator bool() const { return m_ptr != nullptr; }

    // Used by wp<>::promote() after it has taken the strong reference itself.
    void set_pointer(T* ptr) { m_ptr = ptr; }

private:
    T* m_ptr;
};

template <typename T, typename U> bool operator==(const sp<T>& a, const sp<U>& b) { return a.get() == b.get(); }
template <typename T, typename U> bool operator!=(const sp<T>& a, const sp<U>& b) { return a.get() != b.get(); }
template <typename T, typename U> bool operator==(const sp<T>& a, const U* b) { return a.get() == b; }
template <typename T, typename U> bool operator!=(const sp<T>& a, const U* b) { return a.get() != b; }
template <typename T> bool operator==(const sp<T>& a, std::nullptr_t) { return a.get() == nullptr; }
template <typename T> bool operator!=(const sp<T>& a, std::nullptr_t) { return a.get() != nullptr; }
template <typename T> bool operator==(std::nullptr_t, const sp<T>& a) { return a.get() == nullptr; }
template <typename T> bool operator!=(std::nullptr_t, const sp<T>& a) { return a.get() != nullptr; }

}  // namespace android

#endif
