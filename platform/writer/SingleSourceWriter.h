#ifndef SINGLE_SOURCE_WRITER_H_
#define SINGLE_SOURCE_WRITER_H_

#include <atomic>
#include <mutex>
#include <thread>

#include <media/stagefright/ByteSink.h>
#include <media/stagefright/MediaSource.h>
#include <media/stagefright/MetaData.h>
#include <utils/Errors.h>
#include <utils/RefBase.h>

namespace android {

// What the one-track writers (WAVE, FLAC, AMR) share: one source, a thread
// that pulls its buffers and hands each non-empty one to the file format, and
// a stop() that drains the source before the format completes the file.
//
// Memory does not grow with the stream: one buffer is held at a time.
// After a write error the thread keeps taking buffers (and drops them) until
// the end of the stream, so that a producer blocked on a full queue is never
// left waiting; stop() then answers the first error. A failed start() ends
// the source for the same reason. Failed system calls are reported as their
// negated errno (-ENOSPC...), and a stop() that succeeds has synced the file.
class SingleSourceWriter {
public:
    class Format {
    public:
        virtual ~Format() = default;
        // OK when the writer can take a track of this format.
        virtual status_t checkSource(const sp<MetaData>& format) = 0;
        // In start(), before the first buffer: what precedes the samples.
        virtual status_t writeHeader(ByteSink& sink, const sp<MetaData>& format) = 0;
        // On the reader thread, once per buffer with a non-empty range.
        virtual status_t writeSample(ByteSink& sink, MediaBufferBase& buffer) = 0;
        // In stop(), after the last buffer (only when writeHeader succeeded).
        virtual status_t finish(ByteSink& sink) = 0;
        // Bytes of appends gathered into one write. 0 writes each sample as it
        // comes, so that after a failed write finish() still describes every
        // sample written before it; a format that gathers gives that up.
        virtual size_t writeBuffer() const { return 0; }
    };

    // `name` is the log prefix; `format` must outlive this object. The
    // owner calls stop() before `format` goes away.
    SingleSourceWriter(int fd, const char* name, Format* format);
    ~SingleSourceWriter();

    status_t addSource(const sp<MediaSource>& source);
    status_t start();
    // Ends the source (an adapter still delivers what was pushed before),
    // waits for the reader to drain it, then completes the file. Answers the
    // first error met since start(); a second call answers the same.
    status_t stop();
    status_t pause();
    bool reachedEOS() const { return mReachedEOS.load(); }
    bool started() const;

private:
    void readLoop();
    void recordError(status_t err);

    const int mFd;
    const char* const mName;
    Format* const mFormat;

    mutable std::mutex mLock;  // state below, and stop() against stop()
    sp<MediaSource> mSource;
    sp<FdSink> mSink;
    std::thread mThread;
    bool mStarted = false;
    bool mHeaderWritten = false;
    bool mStopped = false;
    status_t mStopStatus = OK;

    std::mutex mErrorLock;
    status_t mError = OK;  // first error of start() or of the reader
    std::atomic<bool> mReachedEOS{false};
};

}  // namespace android

#endif
