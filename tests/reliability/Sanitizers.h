#ifndef TESTS_RELIABILITY_SANITIZERS_H
#define TESTS_RELIABILITY_SANITIZERS_H

// Which sanitizer the tests were built with: gcc says so with __SANITIZE_*__,
// clang through __has_feature.
#if defined(__SANITIZE_ADDRESS__)
#define TESTS_WITH_ASAN 1
#endif
#if defined(__SANITIZE_THREAD__)
#define TESTS_WITH_TSAN 1
#endif
#if defined(__has_feature)
#if __has_feature(address_sanitizer) && !defined(TESTS_WITH_ASAN)
#define TESTS_WITH_ASAN 1
#endif
#if __has_feature(thread_sanitizer) && !defined(TESTS_WITH_TSAN)
#define TESTS_WITH_TSAN 1
#endif
#endif

#endif
