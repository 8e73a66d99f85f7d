#include "Cli.h"

#include <algorithm>
#include <cctype>
#include <cerrno>
#include <cmath>
#include <cstdio>
#include <cstdlib>

namespace qnedit {

CommonOptions gCommon;

Args::Args(const std::vector<std::string>& words, const std::vector<std::string>& valued,
           const std::vector<std::string>& switches) {
    auto isValued = [&](const std::string& n) { return std::find(valued.begin(), valued.end(), n) != valued.end(); };
    auto isSwitch = [&](const std::string& n) { return std::find(switches.begin(), switches.end(), n) != switches.end(); };
    for (size_t i = 0; i < words.size(); ++i) {
        const std::string& w = words[i];
        if (w.size() < 2 || w[0] != '-' || (w[1] != '-' && w != "-o")) {
            if (w.empty()) usageError("an empty argument is not a file name");
            mPositional.push_back(w);
            continue;
        }
        std::string name = w;
        std::string value;
        bool inlineValue = false;
        const size_t eq = w.find('=');
        if (eq != std::string::npos) {
            name = w.substr(0, eq);
            value = w.substr(eq + 1);
            inlineValue = true;
        }
        if (isSwitch(name)) {
            if (inlineValue) usageError("option " + name + " takes no value");
            mSwitches[name] = true;
        } else if (isValued(name)) {
            if (!inlineValue) {
                if (i + 1 >= words.size()) usageError("option " + name + " needs a value");
                value = words[++i];
            }
            if (value.empty()) usageError("option " + name + " needs a value");
            mValues[name] = value;
        } else {
            usageError("unknown option " + name);
        }
    }
}

std::string Args::get(const std::string& name, const std::string& fallback) const {
    auto it = mValues.find(name);
    return it == mValues.end() ? fallback : it->second;
}

double Args::getDouble(const std::string& name, double fallback) const {
    auto it = mValues.find(name);
    return it == mValues.end() ? fallback : parseDouble(it->second, name);
}

long Args::getInt(const std::string& name, long fallback) const {
    auto it = mValues.find(name);
    return it == mValues.end() ? fallback : parseInt(it->second, name);
}

long Args::getIntIn(const std::string& name, long fallback, long lo, long hi) const {
    auto it = mValues.find(name);
    return it == mValues.end() ? fallback : parseIntIn(it->second, name, lo, hi);
}

void Args::expectPositional(size_t n, const char* usage) const {
    if (mPositional.size() != n) usageError(std::string("usage: ") + usage);
}

double parseDouble(const std::string& text, const std::string& what) {
    errno = 0;
    char* end = nullptr;
    const double v = strtod(text.c_str(), &end);
    if (text.empty() || *end != '\0' || errno != 0 || !std::isfinite(v)) usageError(what + ": not a number: " + text);
    return v;
}

long parseInt(const std::string& text, const std::string& what) {
    errno = 0;
    char* end = nullptr;
    const long v = strtol(text.c_str(), &end, 10);
    if (text.empty() || *end != '\0' || errno != 0) usageError(what + ": not a whole number: " + text);
    return v;
}

long parseIntIn(const std::string& text, const std::string& what, long lo, long hi) {
    const long v = parseInt(text, what);
    if (v < lo || v > hi) usageError(what + " takes " + std::to_string(lo) + " to " + std::to_string(hi) + ", not " + text);
    return v;
}

int64_t parseSeconds(const std::string& text, const std::string& what) {
    // About 31 years: longer than any recording, far from int64 overflow in microseconds.
    constexpr double kMaxSeconds = 1e9;
    const double v = parseDouble(text, what);
    if (v < 0) usageError(what + " must not be negative");
    if (v > kMaxSeconds) usageError(what + " is out of range: " + text);
    return static_cast<int64_t>(std::llround(v * 1e6));
}

std::string formatSeconds(int64_t us) {
    char text[32];
    snprintf(text, sizeof(text), "%.3f s", us / 1e6);
    return text;
}

std::vector<std::string> splitList(const std::string& text, char sep) {
    std::vector<std::string> parts;
    size_t start = 0;
    while (start <= text.size()) {
        const size_t end = text.find(sep, start);
        parts.push_back(text.substr(start, end == std::string::npos ? std::string::npos : end - start));
        if (end == std::string::npos) break;
        start = end + 1;
    }
    return parts;
}

std::string lowerExtension(const std::string& path) {
    const size_t dot = path.rfind('.');
    const size_t slash = path.rfind('/');
    if (dot == std::string::npos || (slash != std::string::npos && dot < slash)) return "";
    std::string ext = path.substr(dot + 1);
    for (char& c : ext) c = static_cast<char>(tolower(static_cast<unsigned char>(c)));
    return ext;
}

}  // namespace qnedit
