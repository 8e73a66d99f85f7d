#ifndef QNEDIT_CLI_H
#define QNEDIT_CLI_H

#include <cstdint>
#include <map>
#include <stdexcept>
#include <string>
#include <vector>

namespace qnedit {

// Exit statuses: 1 for a bad input or a failed operation, 2 for bad usage.
enum ExitCode { kExitOk = 0, kExitBadInput = 1, kExitUsage = 2 };

// What ends a subcommand early; main turns it into one line and a status.
struct ToolError : std::runtime_error {
    ToolError(int code, const std::string& message) : std::runtime_error(message), code(code) {}
    int code;
};

[[noreturn]] inline void usageError(const std::string& message) { throw ToolError(kExitUsage, message); }
[[noreturn]] inline void inputError(const std::string& message) { throw ToolError(kExitBadInput, message); }

// The words after the subcommand: positional arguments, options with a value
// ("--start 1.5" or "--start=1.5") and switches ("--json").
class Args {
public:
    // `valued` lists the options that take a value, `switches` those that do not.
    Args(const std::vector<std::string>& words, const std::vector<std::string>& valued,
         const std::vector<std::string>& switches);

    const std::vector<std::string>& positional() const { return mPositional; }
    bool has(const std::string& name) const { return mValues.count(name) > 0 || mSwitches.count(name) > 0; }
    std::string get(const std::string& name, const std::string& fallback = "") const;
    double getDouble(const std::string& name, double fallback) const;
    long getInt(const std::string& name, long fallback) const;
    long getIntIn(const std::string& name, long fallback, long lo, long hi) const;
    // Exactly `n` positional arguments, else a usage error naming `usage`.
    void expectPositional(size_t n, const char* usage) const;

private:
    std::vector<std::string> mPositional;
    std::map<std::string, std::string> mValues;
    std::map<std::string, bool> mSwitches;
};

double parseDouble(const std::string& text, const std::string& what);
long parseInt(const std::string& text, const std::string& what);
// A whole number within [lo, hi], else a usage error naming `what`.
long parseIntIn(const std::string& text, const std::string& what, long lo, long hi);
// A non-negative time in seconds as microseconds; values too large for any
// recording are refused rather than overflowing.
int64_t parseSeconds(const std::string& text, const std::string& what);
// Microseconds as "3.360 s".
std::string formatSeconds(int64_t us);
// "a,b,c" -> {"a","b","c"}
std::vector<std::string> splitList(const std::string& text, char sep = ',');
std::string lowerExtension(const std::string& path);

// Options every subcommand takes.
struct CommonOptions {
    bool quiet = false;
    bool verbose = false;
};
extern CommonOptions gCommon;

}  // namespace qnedit

#endif
