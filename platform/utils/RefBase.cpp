#include <utils/RefBase.h>

namespace android {

namespace {
constexpr int32_t INITIAL_STRONG_VALUE = 1 << 28;
}

class RefBase::weakref_impl : public RefBase::weakref_type {
public:
    explicit weakref_impl(RefBase* base) : mStrong(INITIAL_STRONG_VALUE), mWeak(0), mBase(base) {}
    std::atomic<int32_t> mStrong;
    std::atomic<int32_t> mWeak;
    RefBase* const mBase;
};

RefBase::RefBase() : mRefs(new weakref_impl(this)) {}

RefBase::~RefBase() {
    // An object that never had a strong reference is deleted directly (or by
    // its last weak reference); it owns the bookkeeping then. Otherwise the
    // last weak reference frees it.
    if (mRefs->mStrong.load(std::memory_order_relaxed) == INITIAL_STRONG_VALUE ||
        mRefs->mWeak.load(std::memory_order_relaxed) == 0) {
        delete mRefs;
    }
}

void RefBase::incStrong(const void* id) const {
    mRefs->incWeak(id);
    const int32_t c = mRefs->mStrong.fetch_add(1, std::memory_order_relaxed);
    if (c != INITIAL_STRONG_VALUE) return;
    mRefs->mStrong.fetch_sub(INITIAL_STRONG_VALUE, std::memory_order_relaxed);
    const_cast<RefBase*>(this)->onFirstRef();
}

void RefBase::decStrong(const void* id) const {
    weakref_impl* const refs = mRefs;
    // acq_rel rather than release plus a fence: the same ordering, and one
    // that ThreadSanitizer can see (it does not model standalone fences).
    const int32_t c = refs->mStrong.fetch_sub(1, std::memory_order_acq_rel);
    if (c == 1) {
        const_cast<RefBase*>(this)->onLastStrongRef(id);
        delete this;
    }
    refs->decWeak(id);
}

int32_t RefBase::getStrongCount() const {
    const int32_t c = mRefs->mStrong.load(std::memory_order_relaxed);
    return c >= INITIAL_STRONG_VALUE ? c - INITIAL_STRONG_VALUE : c;
}

RefBase::weakref_type* RefBase::createWeak(const void* id) const {
    mRefs->incWeak(id);
    return mRefs;
}

RefBase::weakref_type* RefBase::getWeakRefs() const { return mRefs; }

void RefBase::onFirstRef() {}
void RefBase::onLastStrongRef(const void*) {}
bool RefBase::onIncStrongAttempted(uint32_t, const void*) { return false; }
void RefBase::onLastWeakRef(const void*) {}

RefBase* RefBase::weakref_type::refBase() const {
    return static_cast<const weakref_impl*>(this)->mBase;
}

void RefBase::weakref_type::incWeak(const void*) {
    static_cast<weakref_impl*>(this)->mWeak.fetch_add(1, std::memory_order_relaxed);
}

void RefBase::weakref_type::decWeak(const void* id) {
    weakref_impl* const impl = static_cast<weakref_impl*>(this);
    const int32_t c = impl->mWeak.fetch_sub(1, std::memory_order_acq_rel);
    if (c != 1) return;
    if (impl->mStrong.load(std::memory_order_relaxed) == INITIAL_STRONG_VALUE) {
        // Only weak references were ever taken: the object goes with them,
        // and its destructor frees this bookkeeping.
        impl->mBase->onLastWeakRef(id);
        delete impl->mBase;
    } else {
        // The object went with its last strong reference.
        delete impl;
    }
}

bool RefBase::weakref_type::attemptIncStrong(const void* id) {
    weakref_impl* const impl = static_cast<weakref_impl*>(this);
    incWeak(id);
    int32_t c = impl->mStrong.load(std::memory_order_relaxed);
    while (c > 0 && c != INITIAL_STRONG_VALUE) {
        if (impl->mStrong.compare_exchange_weak(c, c + 1, std::memory_order_relaxed)) return true;
    }
    if (c == INITIAL_STRONG_VALUE &&
        impl->mStrong.compare_exchange_strong(c, 1, std::memory_order_relaxed)) {
        impl->mBase->onFirstRef();
        return true;
    }
    decWeak(id);
    return false;
}

int32_t RefBase::weakref_type::getWeakCount() const {
    return static_cast<const weakref_impl*>(this)->mWeak.load(std::memory_order_relaxed);
}

}  // namespace android
