#ifndef ANDROID_REF_BASE_H
#define ANDROID_REF_BASE_H

#include <atomic>
#include <cstddef>
#include <cstdint>
#include <utility>

#include <utils/StrongPointer.h>

namespace android {

// Intrusive reference counting. The object dies with its last strong
// reference; weak references (wp<>) keep only the bookkeeping alive.
class RefBase {
public:
    void incStrong(const void* id) const;
    void decStrong(const void* id) const;
    int32_t getStrongCount() const;

    class weakref_type {
    public:
        RefBase* refBase() const;
        void incWeak(const void* id);
        void decWeak(const void* id);
        // Takes a strong reference if the object is still alive.
        bool attemptIncStrong(const void* id);
        int32_t getWeakCount() const;
    };

    weakref_type* createWeak(const void* id) const;
    weakref_type* getWeakRefs() const;

protected:
    RefBase();
    virtual ~RefBase();

    // The four hooks: first strong reference taken, last strong reference
    // dropped (before deletion), attempt to revive from a weak reference, and
    // the lifetime flags of weakref_type.
    virtual void onFirstRef();
    virtual void onLastStrongRef(const void* id);
    virtual bool onIncStrongAttempted(uint32_t flags, const void* id);
    virtual void onLastWeakRef(const void* id);

private:
    friend class weakref_type;
    class weakref_impl;

    RefBase(const RefBase&) = delete;
    RefBase& operator=(const RefBase&) = delete;

    weakref_impl* const mRefs;
};

// Counting without weak references, for small value-like objects.
template <class T>
class LightRefBase {
public:
    LightRefBase() : mCount(0) {}
    void incStrong(const void*) const { mCount.fetch_add(1, std::memory_order_relaxed); }
    void decStrong(const void*) const {
        if (mCount.fetch_sub(1, std::memory_order_release) == 1) {
            std::atomic_thread_fence(std::memory_order_acquire);
            delete static_cast<const T*>(this);
        }
    }
    int32_t getStrongCount() const { return mCount.load(std::memory_order_relaxed); }

protected:
    ~LightRefBase() {}

private:
    mutable std::atomic<int32_t> mCount;
};

template <typename T>
class wp {
public:
    typedef RefBase::weakref_type weakref_type;

    wp() : m_ptr(nullptr), m_refs(nullptr) {}
    wp(T* other) : m_ptr(other), m_refs(other ? other->createWeak(this) : nullptr) {}
    wp(const sp<T>& other) : wp(other.get()) {}
    wp(const wp<T>& other) : m_ptr(other.m_ptr), m_refs(other.m_refs) {
        if (m_ptr) m_refs->incWeak(this);
    }
    ~wp() { if (m_ptr) m_refs->decWeak(this); }

    wp& operator=(const wp<T>& other) {
        wp tmp(other);
        std::swap(m_ptr, tmp.m_ptr);
        std::swap(m_refs, tmp.m_refs);
        return *this;
    }
    wp& operator=(const sp<T>& other) { return *this = wp<T>(other); }

    sp<T> promote() const {
        sp<T> result;
        if (m_ptr && m_refs->attemptIncStrong(&result)) {
            result.set_pointer(m_ptr);
        }
        return result;
    }
    void clear() { *this = wp<T>(); }
    T* unsafe_get() const { return m_ptr; }

private:
    T* m_ptr;
    weakref_type* m_refs;
};

}  // namespace android

#endif
