#ifndef A_DEBUG_H_
#define A_DEBUG_H_

#include <string>

#include <log/log.h>
#include <media/stagefright/foundation/ABase.h>

#define LITERAL_TO_STRING_INTERNAL(x) #x
#define LITERAL_TO_STRING(x) LITERAL_TO_STRING_INTERNAL(x)

// "file:line CHECK(condition) failed." through the platform assertion.
#define CHECK(condition)                                                             \
    LOG_ALWAYS_FATAL_IF(!(condition), "%s",                                          \
                        __FILE__ ":" LITERAL_TO_STRING(__LINE__) " CHECK(" #condition \
                                                                 ") failed.")

// The same with a fixed source path and line, for messages that must read the
// same wherever the source file lives.
#define CHECK_AT(path, line, condition) \
    LOG_ALWAYS_FATAL_IF(!(condition), "%s", path ":" LITERAL_TO_STRING(line) " CHECK(" #condition ") failed.")

namespace android {
namespace adebug_detail {
template <typename T>
std::string toString(const T& v) { return std::to_string(v); }
inline std::string toString(const char* v) { return v ? v : "(null)"; }
inline std::string toString(const std::string& v) { return v; }
template <typename T>
std::string toString(T* v) { char b[32]; snprintf(b, sizeof(b), "%p", static_cast<const void*>(v)); return b; }
}  // namespace adebug_detail
}  // namespace android

// "file:line CHECK_EQ( x,y) failed: X vs. Y"
#define CHECK_OP(x, y, suffix, op)                                                            \
    do {                                                                                      \
        const auto& a__ = (x);                                                                \
        const auto& b__ = (y);                                                                \
        if (!(a__ op b__)) {                                                                  \
            std::string full__ = __FILE__ ":" LITERAL_TO_STRING(__LINE__) " CHECK_" #suffix  \
                                                                         "( " #x "," #y       \
                                                                         ") failed: ";        \
            full__ += ::android::adebug_detail::toString(a__);                                \
            full__ += " vs. ";                                                                \
            full__ += ::android::adebug_detail::toString(b__);                                \
            LOG_ALWAYS_FATAL("%s", full__.c_str());                                           \
        }                                                                                     \
    } while (false)

#define CHECK_EQ(x, y) CHECK_OP(x, y, EQ, ==)
#define CHECK_NE(x, y) CHECK_OP(x, y, NE, !=)
#define CHECK_LE(x, y) CHECK_OP(x, y, LE, <=)
#define CHECK_LT(x, y) CHECK_OP(x, y, LT, <)
#define CHECK_GE(x, y) CHECK_OP(x, y, GE, >=)
#define CHECK_GT(x, y) CHECK_OP(x, y, GT, >)

#define TRESPASS(...) LOG_ALWAYS_FATAL("Should not be here. " __VA_ARGS__)

#endif
