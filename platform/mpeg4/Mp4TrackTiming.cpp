#define LOG_TAG "Mp4TrackTiming"
#include "mpeg4/Mp4TrackTiming.h"

#include <algorithm>

#include <log/log.h>
#include <media/stagefright/MediaErrors.h>

#include "mpeg4/Mp4BoxWriter.h"

namespace android {

namespace {

// value * to / from, rounded to nearest (halves away from zero); the split
// into quotient and remainder keeps every product within 64 bits.
int64_t rescale(int64_t value, uint64_t from, uint64_t to) {
    const bool negative = value < 0;
    const uint64_t a = negative ? 0 - static_cast<uint64_t>(value) : static_cast<uint64_t>(value);
    const uint64_t scaled = (a / from) * to + ((a % from) * to + from / 2) / from;
    return negative ? -static_cast<int64_t>(scaled) : static_cast<int64_t>(scaled);
}

// stts and ctts: entry count, then (sample count, value) pairs.
void writeRuns(Mp4BoxWriter& w, const char type[4], const std::vector<Mp4TrackTiming::Run>& runs) {
    w.beginFullBox(type, 0, 0);
    w.be32(static_cast<uint32_t>(runs.size()));
    for (const Mp4TrackTiming::Run& r : runs) {
        w.be32(r.count);
        w.be32(r.value);
    }
    w.endBox();
}

template <typename T>
void appendRun(std::vector<Mp4TrackTiming::Run>* runs, T value) {
    const uint32_t v = static_cast<uint32_t>(value);
    if (!runs->empty() && runs->back().value == v) {
        ++runs->back().count;
    } else {
        runs->push_back({1, v});
    }
}

}  // namespace

int64_t Mp4UsToTicks(int64_t us, uint32_t timescale) { return rescale(us, 1000000, timescale); }
int64_t Mp4TicksToUs(int64_t ticks, uint32_t timescale) { return rescale(ticks, timescale, 1000000); }

status_t Mp4TrackTiming::compute(const std::vector<int64_t>& dtsUs, const std::vector<int64_t>& ptsUs,
                                 const std::vector<uint32_t>& candidates, int64_t lastDurationUs,
                                 const Mp4TrackBounds& bounds) {
    if (dtsUs.empty() || dtsUs.size() != ptsUs.size() || candidates.empty()) return BAD_VALUE;
    bool usable = true;
    for (size_t i = 0; i < dtsUs.size() && usable; ++i) {
        usable = dtsUs[i] <= ptsUs[i] && (i == 0 || dtsUs[i] > dtsUs[i - 1]);
    }
    std::vector<int64_t> rebuilt;
    rebuiltDecodingTimes = !usable;
    if (rebuiltDecodingTimes) {
        rebuilt = ptsUs;
        std::sort(rebuilt.begin(), rebuilt.end());
    }
    const std::vector<int64_t>& dts = rebuiltDecodingTimes ? rebuilt : dtsUs;
    for (bool exact : {true, false}) {
        for (uint32_t ts : candidates) {
            if (tryTimescale(dts, ptsUs, ts, lastDurationUs, bounds, exact)) return OK;
        }
    }
    ALOGE("sample times span more than the track tables can hold");
    return ERROR_OUT_OF_RANGE;
}

bool Mp4TrackTiming::tryTimescale(const std::vector<int64_t>& dtsUs, const std::vector<int64_t>& ptsUs,
                                  uint32_t ts, int64_t lastDurationUs, const Mp4TrackBounds& bounds,
                                  bool requireExact) {
    const size_t n = dtsUs.size();
    std::vector<int64_t> d(n), p(n);
    for (size_t i = 0; i < n; ++i) {
        d[i] = Mp4UsToTicks(dtsUs[i], ts);
        p[i] = Mp4UsToTicks(ptsUs[i], ts);
        if (requireExact && (Mp4TicksToUs(d[i], ts) != dtsUs[i] || Mp4TicksToUs(p[i], ts) != ptsUs[i])) {
            return false;
        }
        // Rounding may merge two decoding times; each sample needs its own.
        if (i > 0 && d[i] <= d[i - 1]) d[i] = d[i - 1] + 1;
    }
    std::vector<int64_t> durations(n);
    for (size_t i = 0; i + 1 < n; ++i) durations[i] = d[i + 1] - d[i];
    durations[n - 1] = n > 1 ? durations[n - 2] : std::max<int64_t>(1, Mp4UsToTicks(lastDurationUs, ts));

    int64_t shift = 0;
    int64_t firstShown = p[0];
    int64_t firstFromZero = INT64_MAX;
    int64_t end = p[0];
    for (size_t i = 0; i < n; ++i) {
        if (durations[i] > UINT32_MAX) return false;
        shift = std::max(shift, d[i] - p[i]);
        firstShown = std::min(firstShown, p[i]);
        if (p[i] >= 0) firstFromZero = std::min(firstFromZero, p[i]);
        end = std::max(end, p[i] + durations[i]);
    }
    std::vector<Run> decoding, offsets;
    bool anyOffset = false;
    uint64_t total = 0;
    for (size_t i = 0; i < n; ++i) {
        const int64_t offset = p[i] - d[i] + shift;
        if (offset > UINT32_MAX) return false;
        anyOffset = anyOffset || offset != 0;
        appendRun(&decoding, durations[i]);
        appendRun(&offsets, offset);
        total += static_cast<uint64_t>(durations[i]);
    }
    timescale = ts;
    stts = std::move(decoding);
    ctts = anyOffset ? std::move(offsets) : std::vector<Run>();
    mediaDuration = total;
    int64_t shownStart = std::max<int64_t>(0, firstShown);
    if (bounds.startsOnSample && firstFromZero != INT64_MAX) shownStart = firstFromZero;
    const int64_t endTicks = bounds.endUs >= 0 ? Mp4UsToTicks(bounds.endUs, ts) : end;
    // Only a track that ends as a trim leaves it, its last stored sample shown
    // before the bound, is cut there; a longer track (a format's duration
    // carried over from elsewhere) is shown whole.
    const bool clipped = endTicks > shownStart && endTicks < end && p[n - 1] < endTicks;
    if (clipped) end = endTicks;
    startUs = Mp4TicksToUs(shownStart, ts);
    mediaTime = shownStart - d[0] + shift;
    shownTicks = end > shownStart ? static_cast<uint64_t>(end - shownStart) : 0;
    needsEdit = shownStart > 0 || mediaTime != 0 || clipped;
    return true;
}

void Mp4TrackTiming::writeDecodingTimes(Mp4BoxWriter& w) const { writeRuns(w, "stts", stts); }

void Mp4TrackTiming::writeCompositionOffsets(Mp4BoxWriter& w) const {
    if (!ctts.empty()) writeRuns(w, "ctts", ctts);
}

void Mp4TrackTiming::writeEdits(Mp4BoxWriter& w, uint32_t movieTimescale) const {
    if (!needsEdit) return;
    const uint64_t empty = static_cast<uint64_t>(Mp4UsToTicks(startUs, movieTimescale));
    const uint64_t shown = static_cast<uint64_t>(rescale(static_cast<int64_t>(shownTicks), timescale, movieTimescale));
    const bool wide = empty > UINT32_MAX || shown > UINT32_MAX || mediaTime > INT32_MAX;
    auto entry = [&](uint64_t duration, int64_t time) {
        if (wide) {
            w.be64(duration);
            w.be64(static_cast<uint64_t>(time));
        } else {
            w.be32(static_cast<uint32_t>(duration));
            w.be32(static_cast<uint32_t>(static_cast<int32_t>(time)));
        }
        w.be16(1);  // media rate 1.0
        w.be16(0);
    };
    w.beginBox("edts");
    w.beginFullBox("elst", wide ? 1 : 0, 0);
    w.be32(startUs > 0 ? 2 : 1);
    if (startUs > 0) entry(empty, -1);
    entry(shown, mediaTime);
    w.endBox();
    w.endBox();
}

uint64_t Mp4TrackTiming::presentedDuration(uint32_t movieTimescale) const {
    if (!needsEdit) return static_cast<uint64_t>(rescale(static_cast<int64_t>(mediaDuration), timescale, movieTimescale));
    return static_cast<uint64_t>(Mp4UsToTicks(startUs, movieTimescale)) +
           static_cast<uint64_t>(rescale(static_cast<int64_t>(shownTicks), timescale, movieTimescale));
}

}  // namespace android
