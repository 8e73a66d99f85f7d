#ifndef TESTS_LOG_CAPTURE_H
#define TESTS_LOG_CAPTURE_H

#include <mutex>
#include <string>
#include <vector>

#include <log/log.h>

// Collects every log line while alive, through the platform's log sink.
class LogCapture {
public:
    struct Line {
        int priority;
        std::string tag;
        std::string message;
    };

    LogCapture() {
        mPrevious = android::setLogSink([this](int prio, const char* tag, const char* msg) {
            std::lock_guard<std::mutex> lock(mLock);
            mLines.push_back({prio, tag, msg});
        });
    }
    ~LogCapture() { android::setLogSink(mPrevious); }

    std::vector<Line> lines() const {
        std::lock_guard<std::mutex> lock(mLock);
        return mLines;
    }
    // How many lines carry exactly this message (and tag, when given).
    int count(const std::string& message, const char* tag = nullptr) const {
        std::lock_guard<std::mutex> lock(mLock);
        int n = 0;
        for (const Line& l : mLines) {
            if (l.message == message && (tag == nullptr || l.tag == tag)) ++n;
        }
        return n;
    }
    bool contains(const std::string& message, const char* tag = nullptr) const { return count(message, tag) > 0; }
    // Whether a line of this priority contains the text.
    bool containsAt(int priority, const std::string& text) const {
        std::lock_guard<std::mutex> lock(mLock);
        for (const Line& l : mLines) {
            if (l.priority == priority && l.message.find(text) != std::string::npos) return true;
        }
        return false;
    }
    void clear() {
        std::lock_guard<std::mutex> lock(mLock);
        mLines.clear();
    }

private:
    mutable std::mutex mLock;
    std::vector<Line> mLines;
    android::LogSink mPrevious;
};

#endif
