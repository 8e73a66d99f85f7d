#ifndef TESTS_RELIABILITY_THREAD_SUPPORT_H
#define TESTS_RELIABILITY_THREAD_SUPPORT_H

#include <chrono>
#include <cstdio>
#include <cstdlib>
#include <future>

#include "reliability/Sanitizers.h"

namespace reliability {

// Runs the scenario on its own thread. One that has not finished within the
// limit is a deadlock or a lost wake-up: its threads cannot be joined, so the
// process ends with a message rather than hanging the whole suite.
template <typename Body>
void runWithin(std::chrono::seconds limit, const char* what, Body body) {
    auto done = std::async(std::launch::async, body);
    if (done.wait_for(limit) != std::future_status::ready) {
        fprintf(stderr, "%s did not finish within %llds\n", what, static_cast<long long>(limit.count()));
        fflush(stderr);
        std::abort();
    }
    done.get();
}

// Sanitized builds run several times slower; limits scale with them.
#if defined(TESTS_WITH_TSAN) || defined(TESTS_WITH_ASAN)
constexpr std::chrono::seconds kThreadTestLimit{240};
#else
constexpr std::chrono::seconds kThreadTestLimit{60};
#endif

}  // namespace reliability

#endif
