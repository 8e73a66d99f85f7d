#ifndef CPU_FEATURES_H_
#define CPU_FEATURES_H_

// Run-time choice of vector kernels on x86; other machines take the
// portable code.
#if (defined(__x86_64__) || defined(__i386__)) && (defined(__GNUC__) || defined(__clang__))
#define ME_X86_KERNELS 1
#define ME_TARGET_AVX2 __attribute__((target("avx2")))
#else
#define ME_X86_KERNELS 0
#endif

namespace android {

inline bool cpuHasAvx2() {
#if ME_X86_KERNELS
    static const bool has = [] {
        __builtin_cpu_init();
        return __builtin_cpu_supports("avx2") != 0;
    }();
    return has;
#else
    return false;
#endif
}

}  // namespace android

#endif
