#define LOG_TAG "FLACExtractor"
#include "flac/FLACFrameScanner.h"

#include <algorithm>
#include <cstring>

#include <log/log.h>
#include <media/stagefright/MediaErrors.h>

#include <media/stagefright/FLACCrc.h>

namespace android {

namespace {
constexpr size_t kReadSize = 64 * 1024;
// Longest header: 4 fixed bytes, a 7-byte number, 2 + 2 trailer bytes, CRC-8.
constexpr size_t kMaxHeaderBytes = 16;
// Headers are looked for this far past the start; no frame is larger.
constexpr size_t kMaxFrameBound = kMaxHeaderBytes + 8 * (2 + (65536 * 33 + 7) / 8) + 2;
// Data full of headers that lead nowhere must not cost more than this much
// checksumming per frame asked for.
constexpr size_t kScanBudget = 8 * kMaxFrameBound;
}  // namespace

FLACFrameScanner::FLACFrameScanner(const sp<DataSource>& source, const FlacStreamInfo& info, off64_t firstFrame)
    : mSource(source),
      mInfo(info),
      mFirstFrame(firstFrame),
      mEnd(INT64_MAX),
      mReadError(OK),
      mBudget(kScanBudget),
      mWindowStart(0) {
    off64_t size;
    if (mSource->getSize(&size) == OK && size >= 0) mEnd = size;
}

size_t FLACFrameScanner::maxFrameSize() const { return frameLimit(mInfo.maxBlockSize); }

size_t FLACFrameScanner::frameLimit(uint32_t blockSize) const {
    // Verbatim subframes of every channel (one extra bit for a side channel),
    // subframe headers with wasted-bits codes, the frame header and CRC-16.
    const size_t verbatim = (size_t(blockSize) * (mInfo.bitsPerSample + 1) + 7) / 8;
    size_t limit = kMaxHeaderBytes + mInfo.channels * (verbatim + 2) + 2;
    // Encoders record the largest frame; renumbered copies may grow a little.
    if (mInfo.maxFrameSize != 0) limit = std::min<size_t>(limit, mInfo.maxFrameSize + kMaxHeaderBytes);
    return std::min(limit, kMaxFrameBound);
}

const uint8_t* FLACFrameScanner::window(off64_t offset, size_t length, size_t* available) {
    if (offset >= mEnd) {
        *available = 0;
        return mWindow.data();
    }
    const uint64_t toEnd = static_cast<uint64_t>(mEnd - offset);
    length = static_cast<size_t>(std::min<uint64_t>(length, toEnd));
    const bool inside = offset >= mWindowStart &&
                        static_cast<uint64_t>(offset - mWindowStart) + length <= mWindow.size();
    if (!inside) {
        // Read a step past what is asked for, and keep the bytes already held
        // from `offset` on: frames are read in order, so each byte of the file
        // is read once, in reads of at least kReadSize.
        const size_t want = static_cast<size_t>(std::min<uint64_t>(std::max(length, kReadSize) + kReadSize, toEnd));
        size_t keep = 0;
        if (offset >= mWindowStart && static_cast<uint64_t>(offset - mWindowStart) < mWindow.size()) {
            const size_t from = static_cast<size_t>(offset - mWindowStart);
            keep = std::min(mWindow.size() - from, want);
            memmove(mWindow.data(), mWindow.data() + from, keep);
        }
        mWindow.resize(want);
        const ssize_t n = mSource->readAt(offset + static_cast<off64_t>(keep), mWindow.data() + keep, want - keep);
        if (n < 0) {
            mReadError = static_cast<status_t>(n);
            mWindow.clear();
            return nullptr;
        }
        mWindow.resize(keep + static_cast<size_t>(n));
        mWindowStart = offset;
        if (keep + static_cast<size_t>(n) < want) mEnd = offset + static_cast<off64_t>(mWindow.size());  // the file is shorter than it said
    }
    const size_t at = static_cast<size_t>(offset - mWindowStart);
    *available = std::min(length, mWindow.size() - at);
    return mWindow.data() + at;
}

bool FLACFrameScanner::parseHeader(const uint8_t* data, size_t size, FlacFrameHeader* h) const {
    if (!FlacFrameHeader::parse(data, size, h)) return false;
    return h->channels == mInfo.channels && (h->bitsPerSample == 0 || h->bitsPerSample == mInfo.bitsPerSample) &&
           (h->sampleRate == 0 || h->sampleRate == mInfo.sampleRate) && h->blockSize <= mInfo.maxBlockSize;
}

bool FLACFrameScanner::headerAt(off64_t offset, FlacFrameHeader* header) {
    size_t n;
    const uint8_t* p = window(offset, kMaxHeaderBytes, &n);
    return p != nullptr && parseHeader(p, n, header);
}

uint64_t FLACFrameScanner::firstSampleOf(const FlacFrameHeader& header) const {
    // Fixed-size blocks carry a frame number; all but the last block have the
    // largest size.
    return header.variableBlockSize ? header.number : header.number * mInfo.maxBlockSize;
}

bool FLACFrameScanner::follows(const FlacFrameHeader& current, const FlacFrameHeader& next) const {
    if (next.variableBlockSize != current.variableBlockSize) return false;
    return current.variableBlockSize ? next.number == current.number + current.blockSize
                                     : next.number == current.number + 1;
}

bool FLACFrameScanner::findEnd(const FlacFrameHeader& header, FLACFrame* frame) {
    const size_t limit = frameLimit(header.blockSize);
    const uint64_t total = mInfo.totalSamples;
    const bool completesStream = total != 0 && frame->firstSample + header.blockSize == total;
    size_t fallback = 0;
    // crc covers frame bytes [0, k); an end at k + 2 must carry it in [k, k + 2).
    uint16_t crc = FLACCrc16(nullptr, 0);
    size_t k = 0;
    size_t span = std::min(limit + kMaxHeaderBytes, kReadSize);
    for (;;) {
        size_t available;
        const uint8_t* p = window(frame->offset, span, &available);
        if (p == nullptr) return false;
        const bool atEnd = frame->offset + static_cast<off64_t>(available) >= mEnd;
        // A candidate end needs the bytes of the header that may follow it.
        const size_t usable = atEnd ? available : (available > kMaxHeaderBytes ? available - kMaxHeaderBytes : 0);
        const size_t stop = std::min(std::min(usable, limit), k + mBudget + 2);
        mBudget -= stop > k + 2 ? stop - (k + 2) : 0;
        if (!completesStream) {
            // Only an end followed by a sync code (or the end of the file) can
            // count, so the sum is carried from one such place to the next in
            // long runs; the last frame, which may end where a tag begins,
            // keeps the byte loop for its fallback.
            if (fastEnd(header, p, available, stop, frame, &crc, &k)) return true;
            if (atEnd || k + 2 > limit || mBudget == 0) break;
            span = std::min(span * 2, limit + kMaxHeaderBytes);
            continue;
        }
        for (; k + 2 <= stop; ++k) {
            if (k >= header.headerBytes && crc == ((p[k] << 8) | p[k + 1])) {
                const size_t end = k + 2;
                FlacFrameHeader next;
                if (frame->offset + static_cast<off64_t>(end) >= mEnd ||
                    (parseHeader(p + end, available - end, &next) && follows(header, next))) {
                    frame->size = end;
                    return true;
                }
                if (fallback == 0) fallback = end;
            }
            crc = FLACCrc16Update(crc, p[k]);
        }
        if (atEnd || k + 2 > limit || mBudget == 0) break;
        span = std::min(span * 2, limit + kMaxHeaderBytes);
    }
    // What follows the last frame may be a tag rather than a frame.
    if (fallback != 0 && completesStream) {
        frame->size = fallback;
        return true;
    }
    return false;
}

bool FLACFrameScanner::fastEnd(const FlacFrameHeader& header, const uint8_t* p, size_t available, size_t stop,
                               FLACFrame* frame, uint16_t* crc, size_t* k) {
    size_t e = std::max(*k + 2, header.headerBytes + 2);
    for (; e <= stop; ++e) {
        // Candidate ends: a sync code, or the last byte of the file.
        if (e < available) {
            const void* ff = memchr(p + e, 0xFF, std::min(stop + 1, available) - e);
            if (ff == nullptr) {
                e = std::min(stop + 1, available);
                if (e > stop) break;
            } else {
                e = static_cast<size_t>(static_cast<const uint8_t*>(ff) - p);
            }
        }
        const bool lastByte = frame->offset + static_cast<off64_t>(e) >= mEnd;
        if (!lastByte && !(e + 1 < available && (p[e + 1] & 0xFE) == 0xF8)) continue;
        *crc = FLACCrc16Continue(*crc, p + *k, e - 2 - *k);
        *k = e - 2;
        FlacFrameHeader next;
        if (*crc == ((p[*k] << 8) | p[*k + 1]) &&
            (lastByte || (parseHeader(p + e, available - e, &next) && follows(header, next)))) {
            frame->size = e;
            return true;
        }
    }
    if (stop >= *k + 2) {
        *crc = FLACCrc16Continue(*crc, p + *k, stop - 1 - *k);
        *k = stop - 1;
    }
    return false;
}

status_t FLACFrameScanner::findFrame(off64_t from, FLACFrame* frame) {
    mReadError = OK;
    mBudget = kScanBudget;
    from = std::max(from, mFirstFrame);
    // Give up on a region without a frame this long: no frame is larger.
    const off64_t searchSpan = static_cast<off64_t>(2 * kMaxFrameBound);
    const off64_t searchEnd = mEnd - from > searchSpan ? from + searchSpan : mEnd;
    off64_t at = from;
    while (at < mEnd && at < searchEnd) {
        size_t n;
        const uint8_t* p = window(at, kReadSize, &n);
        if (p == nullptr) return mReadError;
        if (n < 2) break;
        const uint8_t* sync = nullptr;
        for (size_t i = 0; i + 1 < n; ++i) {
            if (p[i] == 0xFF && (p[i + 1] & 0xFE) == 0xF8) {
                sync = p + i;
                break;
            }
        }
        if (sync == nullptr) {
            at += static_cast<off64_t>(n - 1);
            continue;
        }
        at += sync - p;
        FlacFrameHeader header;
        if (headerAt(at, &header)) {
            frame->offset = at;
            frame->firstSample = firstSampleOf(header);
            frame->blockSize = header.blockSize;
            if (findEnd(header, frame)) {
                if (at != from) ALOGW("skipped %lld bytes to the next whole frame", (long long)(at - from));
                return OK;
            }
            if (mReadError != OK) return mReadError;
            if (mBudget == 0) {
                ALOGW("no whole frame found near %lld", (long long)at);
                return ERROR_MALFORMED;
            }
        }
        ++at;
    }
    if (mReadError != OK) return mReadError;
    return at < mEnd && at >= searchEnd ? ERROR_MALFORMED : ERROR_END_OF_STREAM;
}

status_t FLACFrameScanner::copyFrame(const FLACFrame& frame, uint8_t* out) {
    size_t n;
    const uint8_t* p = window(frame.offset, frame.size, &n);
    if (p == nullptr) return mReadError;
    if (n != frame.size) return ERROR_MALFORMED;
    memcpy(out, p, n);
    return OK;
}

}  // namespace android
