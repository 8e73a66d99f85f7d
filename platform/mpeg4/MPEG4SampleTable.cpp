#define LOG_TAG "MPEG4SampleTable"
#include "mpeg4/MPEG4SampleTable.h"

#include <algorithm>

#include <log/log.h>
#include <media/stagefright/MediaErrors.h>

#include "mpeg4/MPEG4Box.h"

namespace android {
namespace mpeg4 {

namespace {

// Decoding times are kept well inside int64 so that adding composition
// offsets and edit shifts cannot overflow.
constexpr int64_t kMaxTicks = INT64_MAX / 4;

// Full-box header and a 32-bit entry count, then `entryBytes` per entry.
bool ReadTableHeader(ByteReader* r, uint32_t* count, uint64_t entryBytes) {
    uint8_t version;
    uint32_t flags;
    if (!ReadFullBoxHeader(r, &version, &flags) || !r->be32(count)) return false;
    return r->has(uint64_t(*count) * entryBytes);
}

// Calls `each` with the fields of every entry of a table of kFields 32-bit
// fields; `each` answers false for an entry that cannot be right. `runs`
// is sized for the entries up front: grown by doubling, it would hold up to
// twice the table.
template <size_t kFields, typename Run, typename Each>
bool ForEachEntry(ByteReader r, std::vector<Run>* runs, Each each) {
    uint32_t count;
    if (!ReadTableHeader(&r, &count, 4 * kFields)) return false;
    runs->reserve(runs->size() + count);
    for (uint32_t i = 0; i < count; ++i) {
        uint32_t fields[kFields] = {};
        for (uint32_t& f : fields) r.be32(&f);
        if (!each(fields)) return false;
    }
    return true;
}

status_t Malformed(const char* what) {
    ALOGW("malformed sample table: %s", what);
    return ERROR_MALFORMED;
}

}  // namespace

status_t SampleTable::setSampleSizes(uint32_t type, ByteReader r) {
    uint8_t version;
    uint32_t flags;
    if (!ReadFullBoxHeader(&r, &version, &flags)) return Malformed("short size table");
    if (type == FourCC('s', 't', 'z', '2')) {
        uint8_t reserved[3], fieldSize;
        if (!r.read(reserved, 3) || !r.u8(&fieldSize) || !r.be32(&mCount)) return Malformed("short stz2");
        if (fieldSize != 4 && fieldSize != 8 && fieldSize != 16) return Malformed("stz2 field size");
        mSizeBits = fieldSize;
    } else {
        if (!r.be32(&mFixedSize) || !r.be32(&mCount)) return Malformed("short stsz");
        mSizeBits = mFixedSize == 0 ? 32 : 0;
    }
    const uint64_t bytes = (uint64_t(mCount) * mSizeBits + 7) / 8;
    if (!r.has(bytes)) return Malformed("more sample sizes than the box holds");
    mSizes.assign(r.current(), r.current() + bytes);
    mHaveSizes = true;
    return OK;
}

status_t SampleTable::setChunkOffsets(uint32_t type, ByteReader r) {
    mChunkOffsetBytes = type == FourCC('c', 'o', '6', '4') ? 8 : 4;
    if (!ReadTableHeader(&r, &mChunkCount, mChunkOffsetBytes)) {
        return Malformed("more chunk offsets than the box holds");
    }
    mChunkOffsets.assign(r.current(), r.current() + uint64_t(mChunkCount) * mChunkOffsetBytes);
    mHaveChunks = true;
    return OK;
}

status_t SampleTable::setSampleToChunk(ByteReader r) {
    uint32_t previous = 0;
    const bool ok = ForEachEntry<3>(r, &mChunkRuns, [&](const uint32_t* e) {
        // First chunk numbers start at 1 and rise.
        if (e[0] <= previous) return false;
        previous = e[0];
        mChunkRuns.push_back({0, e[0] - 1, 0, e[1]});
        return true;
    });
    if (!ok) return Malformed("sample-to-chunk entries that do not fit or are out of order");
    mHaveSampleToChunk = true;
    return OK;
}

status_t SampleTable::setTimeToSample(ByteReader r) {
    const bool ok = ForEachEntry<2>(r, &mTimeRuns, [&](const uint32_t* e) {
        if (e[0] > 0) mTimeRuns.push_back({0, 0, e[0], e[1]});
        return true;
    });
    if (!ok) return Malformed("more time-to-sample entries than the box holds");
    mHaveTimes = true;
    return OK;
}

status_t SampleTable::setCompositionOffsets(ByteReader r) {
    // Version 0 declares the offsets unsigned, but writers store negative
    // ones there too; an offset of 2^31 ticks or more is never meant.
    const bool ok = ForEachEntry<2>(r, &mOffsetRuns, [&](const uint32_t* e) {
        if (e[0] > 0) mOffsetRuns.push_back({0, e[0], static_cast<int32_t>(e[1])});
        return true;
    });
    return ok ? OK : Malformed("more composition offsets than the box holds");
}

status_t SampleTable::setSyncSamples(ByteReader r) {
    const bool ok = ForEachEntry<1>(r, &mSyncSamples, [&](const uint32_t* e) {
        if (e[0] > 0) mSyncSamples.push_back(e[0] - 1);
        return true;
    });
    if (!ok) return Malformed("more sync samples than the box holds");
    mHaveSyncTable = true;
    return OK;
}

uint32_t SampleTable::sampleSize(uint32_t i) const {
    const uint8_t* p = mSizes.data();
    switch (mSizeBits) {
        case 32:
            p += size_t(i) * 4;
            return (uint32_t(p[0]) << 24) | (uint32_t(p[1]) << 16) | (uint32_t(p[2]) << 8) | p[3];
        case 16:
            p += size_t(i) * 2;
            return (uint32_t(p[0]) << 8) | p[1];
        case 8:
            return p[i];
        case 4:
            return (i & 1) ? (p[i / 2] & 0x0F) : (p[i / 2] >> 4);
        default:
            return mFixedSize;
    }
}

uint64_t SampleTable::chunkOffset(uint32_t chunk) const {
    const uint8_t* p = mChunkOffsets.data() + size_t(chunk) * mChunkOffsetBytes;
    uint64_t v = 0;
    for (uint32_t i = 0; i < mChunkOffsetBytes; ++i) v = (v << 8) | p[i];
    return v;
}

status_t SampleTable::indexTimes() {
    uint64_t sample = 0;
    int64_t dts = 0;
    size_t kept = 0;
    for (; kept < mTimeRuns.size() && sample < mCount; ++kept) {
        TimeRun& run = mTimeRuns[kept];
        run.firstSample = static_cast<uint32_t>(sample);
        run.firstDts = dts;
        const uint64_t span = uint64_t(run.count) * run.delta;
        if (span > uint64_t(kMaxTicks - dts)) return Malformed("decoding times overflow");
        sample += run.count;
        dts += static_cast<int64_t>(span);
    }
    mTimeRuns.resize(kept);
    if (sample < mCount) {
        // Fewer durations than samples: the last one goes on.
        if (mTimeRuns.empty()) return Malformed("no sample durations");
        TimeRun& last = mTimeRuns.back();
        const uint64_t missing = mCount - sample;
        if (missing * last.delta > uint64_t(kMaxTicks - dts)) return Malformed("decoding times overflow");
        ALOGW("time-to-sample table covers %llu of %u samples", (unsigned long long)sample, mCount);
        last.count += static_cast<uint32_t>(missing);
        dts += static_cast<int64_t>(missing * last.delta);
        sample = mCount;
    }
    // Runs may list more samples than the size table; the end is the last sample's.
    if (!mTimeRuns.empty()) {
        const TimeRun& last = mTimeRuns.back();
        mEndDts = last.firstDts + static_cast<int64_t>((mCount - last.firstSample) * uint64_t(last.delta));
        mLastDts = mEndDts - last.delta;
    }

    sample = 0;
    kept = 0;
    for (; kept < mOffsetRuns.size() && sample < mCount; ++kept) {
        OffsetRun& run = mOffsetRuns[kept];
        run.firstSample = static_cast<uint32_t>(sample);
        sample += run.count;
        mMinCtsOffset = std::min(mMinCtsOffset, run.offset);
        mMaxCtsOffset = std::max(mMaxCtsOffset, run.offset);
    }
    mOffsetRuns.resize(kept);
    return OK;
}

status_t SampleTable::indexChunks() {
    // Runs are kept in place: the one written never passes the one read.
    uint64_t sample = 0;
    size_t kept = 0;
    for (size_t i = 0; i < mChunkRuns.size() && sample < mCount; ++i) {
        ChunkRun run = mChunkRuns[i];
        if (run.firstChunk >= mChunkCount) break;
        run.chunkEnd = i + 1 < mChunkRuns.size() ? std::min(mChunkRuns[i + 1].firstChunk, mChunkCount)
                                                 : mChunkCount;
        if (run.samplesPerChunk == 0) continue;
        run.firstSample = static_cast<uint32_t>(sample);
        sample += uint64_t(run.chunkEnd - run.firstChunk) * run.samplesPerChunk;
        mChunkRuns[kept++] = run;
    }
    if (sample < mCount) return Malformed("chunks hold fewer samples than the size table lists");
    mChunkRuns.resize(kept);
    return OK;
}

status_t SampleTable::finish() {
    if (!mHaveSizes) return Malformed("no sample sizes");
    if (mCount == 0) {
        mChunkRuns.clear();
        mTimeRuns.clear();
        mOffsetRuns.clear();
        mSyncSamples.clear();
        return OK;
    }
    if (!mHaveChunks || !mHaveSampleToChunk || !mHaveTimes) return Malformed("a table is missing");
    status_t err = indexTimes();
    if (err != OK) return err;
    err = indexChunks();
    if (err != OK) return err;

    if (mSizeBits == 0) {
        mMaxSize = mFixedSize;
        mTotalBytes = uint64_t(mFixedSize) * mCount;
    } else {
        for (uint32_t i = 0; i < mCount; ++i) {
            const uint32_t size = sampleSize(i);
            mMaxSize = std::max(mMaxSize, size);
            mTotalBytes += size;
        }
    }
    if (mHaveSyncTable) {
        std::sort(mSyncSamples.begin(), mSyncSamples.end());
        mSyncSamples.erase(std::unique(mSyncSamples.begin(), mSyncSamples.end()), mSyncSamples.end());
        mSyncSamples.erase(std::lower_bound(mSyncSamples.begin(), mSyncSamples.end(), mCount),
                           mSyncSamples.end());
    }
    return OK;
}

uint32_t SampleTable::syncPositionFrom(uint32_t index) const {
    if (!mHaveSyncTable) return std::min(index, mCount);
    return static_cast<uint32_t>(std::lower_bound(mSyncSamples.begin(), mSyncSamples.end(), index) -
                                 mSyncSamples.begin());
}

uint32_t SampleTable::syncAtOrBefore(uint32_t index) const {
    if (!mHaveSyncTable) return index;
    auto it = std::upper_bound(mSyncSamples.begin(), mSyncSamples.end(), index);
    // Without a sync sample before it, decoding can only start at the top.
    return it == mSyncSamples.begin() ? 0 : *(it - 1);
}

uint32_t SampleTable::firstAtOrAfterDts(int64_t dts) const {
    // Runs hold ascending times; within a run the time is linear.
    auto it = std::upper_bound(mTimeRuns.begin(), mTimeRuns.end(), dts,
                               [](int64_t t, const TimeRun& run) { return t < run.firstDts; });
    if (it == mTimeRuns.begin()) return 0;
    const TimeRun& run = *(it - 1);
    const uint64_t runEnd = it == mTimeRuns.end() ? mCount : it->firstSample;
    uint64_t k = run.delta == 0 ? (dts > run.firstDts ? runEnd - run.firstSample : 0)
                                : (uint64_t(dts - run.firstDts) + run.delta - 1) / run.delta;
    return static_cast<uint32_t>(std::min<uint64_t>(run.firstSample + k, runEnd));
}

// Fragments add to the tables in the widest form: 32-bit sizes, 64-bit
// chunk offsets.
void SampleTable::widenForAppending() {
    if (mSizeBits != 32) {
        std::vector<uint8_t> sizes;
        sizes.reserve(size_t(mCount) * 4);
        for (uint32_t i = 0; i < mCount; ++i) {
            const uint32_t v = sampleSize(i);
            const uint8_t b[4] = {uint8_t(v >> 24), uint8_t(v >> 16), uint8_t(v >> 8), uint8_t(v)};
            sizes.insert(sizes.end(), b, b + 4);
        }
        mSizes.swap(sizes);
        mSizeBits = 32;
    }
    if (mChunkOffsetBytes != 8) {
        std::vector<uint8_t> offsets;
        offsets.reserve(size_t(mChunkCount) * 8);
        for (uint32_t c = 0; c < mChunkCount; ++c) {
            const uint64_t v = chunkOffset(c);
            for (int shift = 56; shift >= 0; shift -= 8) offsets.push_back(uint8_t(v >> shift));
        }
        mChunkOffsets.swap(offsets);
        mChunkOffsetBytes = 8;
    }
}

void SampleTable::appendTimes(uint32_t first, int64_t dts, const std::vector<FragmentSample>& samples) {
    // A run of the movie box's table may list more samples than there are.
    if (!mTimeRuns.empty()) {
        TimeRun& last = mTimeRuns.back();
        last.count = static_cast<uint32_t>(std::min<uint64_t>(last.count, first - last.firstSample));
    }
    for (size_t i = 0; i < samples.size(); ++i) {
        const uint32_t delta = samples[i].duration;
        TimeRun* last = mTimeRuns.empty() ? nullptr : &mTimeRuns.back();
        if (last != nullptr && last->delta == delta &&
            last->firstDts + int64_t(uint64_t(last->count) * delta) == dts) {
            ++last->count;
        } else {
            mTimeRuns.push_back({dts, static_cast<uint32_t>(first + i), 1, delta});
        }
        mLastDts = dts;
        dts += delta;
    }
    mEndDts = dts;
}

void SampleTable::appendOffsets(uint32_t first, const std::vector<FragmentSample>& samples) {
    uint64_t covered = 0;
    if (!mOffsetRuns.empty()) {
        OffsetRun& last = mOffsetRuns.back();
        last.count = static_cast<uint32_t>(std::min<uint64_t>(last.count, first - last.firstSample));
        covered = uint64_t(last.firstSample) + last.count;
    }
    bool any = !mOffsetRuns.empty();
    for (const FragmentSample& s : samples) any = any || s.ctsOffset != 0;
    if (!any) return;
    // Samples the movie box's table leaves out have no offset.
    if (covered < first) {
        mOffsetRuns.push_back({static_cast<uint32_t>(covered), static_cast<uint32_t>(first - covered), 0});
    }
    for (size_t i = 0; i < samples.size(); ++i) {
        const int32_t offset = samples[i].ctsOffset;
        OffsetRun* last = mOffsetRuns.empty() ? nullptr : &mOffsetRuns.back();
        if (last != nullptr && last->offset == offset && uint64_t(last->firstSample) + last->count == first + i) {
            ++last->count;
        } else {
            mOffsetRuns.push_back({static_cast<uint32_t>(first + i), 1, offset});
        }
        mMinCtsOffset = std::min(mMinCtsOffset, offset);
        mMaxCtsOffset = std::max(mMaxCtsOffset, offset);
    }
}

void SampleTable::appendSyncs(uint32_t first, const std::vector<FragmentSample>& samples) {
    bool allSync = true;
    for (const FragmentSample& s : samples) allSync = allSync && s.sync;
    if (!mHaveSyncTable) {
        if (allSync) return;
        // Every sample so far was a sync sample; now the list is needed.
        mSyncSamples.resize(first);
        for (uint32_t i = 0; i < first; ++i) mSyncSamples[i] = i;
        mHaveSyncTable = true;
    }
    for (size_t i = 0; i < samples.size(); ++i) {
        if (samples[i].sync) mSyncSamples.push_back(static_cast<uint32_t>(first + i));
    }
}

status_t SampleTable::appendRun(uint64_t offset, int64_t dts, const std::vector<FragmentSample>& samples) {
    if (samples.empty()) return OK;
    if (samples.size() > kMaxSamples - mCount) return Malformed("more samples than are held in memory");
    uint64_t span = 0;
    for (const FragmentSample& s : samples) span += s.duration;
    if (mCount > 0 && dts <= mLastDts) dts = mEndDts;
    if (dts < 0 || dts > kMaxTicks || span > uint64_t(kMaxTicks - dts)) return Malformed("decoding times overflow");
    widenForAppending();

    const uint32_t first = mCount;
    appendTimes(first, dts, samples);
    appendOffsets(first, samples);
    appendSyncs(first, samples);

    const uint32_t perChunk = static_cast<uint32_t>(samples.size());
    ChunkRun* last = mChunkRuns.empty() ? nullptr : &mChunkRuns.back();
    if (last != nullptr && last->samplesPerChunk == perChunk && last->chunkEnd == mChunkCount &&
        last->firstSample + uint64_t(mChunkCount - last->firstChunk) * perChunk == first) {
        ++last->chunkEnd;
    } else {
        mChunkRuns.push_back({first, mChunkCount, mChunkCount + 1, perChunk});
    }
    for (int shift = 56; shift >= 0; shift -= 8) mChunkOffsets.push_back(uint8_t(offset >> shift));
    ++mChunkCount;

    for (const FragmentSample& s : samples) {
        const uint8_t b[4] = {uint8_t(s.size >> 24), uint8_t(s.size >> 16), uint8_t(s.size >> 8), uint8_t(s.size)};
        mSizes.insert(mSizes.end(), b, b + 4);
        mMaxSize = std::max(mMaxSize, s.size);
        mTotalBytes += s.size;
    }
    mCount += perChunk;
    mHaveSizes = mHaveChunks = mHaveSampleToChunk = mHaveTimes = true;
    return OK;
}

namespace {
// The last run starting at or before `sample`.
template <typename Run>
size_t FindRun(const std::vector<Run>& runs, uint64_t sample) {
    auto it = std::upper_bound(runs.begin(), runs.end(), sample,
                               [](uint64_t s, const Run& run) { return s < run.firstSample; });
    return static_cast<size_t>(it - runs.begin()) - 1;
}
}  // namespace

bool SampleCursor::seek(uint32_t index) {
    mIndex = index;
    if (!valid()) return false;
    const SampleTable& t = mTable;

    mTimeRun = FindRun(t.mTimeRuns, index);
    const SampleTable::TimeRun& time = t.mTimeRuns[mTimeRun];
    mTimeInRun = static_cast<uint32_t>(index - time.firstSample);
    mInfo.dts = time.firstDts + static_cast<int64_t>(uint64_t(mTimeInRun) * time.delta);

    mOffsetRun = t.mOffsetRuns.empty() ? 0 : FindRun(t.mOffsetRuns, index);
    mOffsetInRun = 0;
    mInfo.ctsOffset = 0;
    if (mOffsetRun < t.mOffsetRuns.size()) {
        const SampleTable::OffsetRun& run = t.mOffsetRuns[mOffsetRun];
        if (index - run.firstSample < run.count) {
            mOffsetInRun = static_cast<uint32_t>(index - run.firstSample);
            mInfo.ctsOffset = run.offset;
        } else {
            mOffsetRun = t.mOffsetRuns.size();
        }
    }

    mChunkRun = FindRun(t.mChunkRuns, index);
    const SampleTable::ChunkRun& chunks = t.mChunkRuns[mChunkRun];
    const uint64_t relative = index - chunks.firstSample;
    mChunk = chunks.firstChunk + static_cast<uint32_t>(relative / chunks.samplesPerChunk);
    mInChunk = static_cast<uint32_t>(relative % chunks.samplesPerChunk);
    mInfo.offset = t.chunkOffset(mChunk);
    for (uint32_t i = index - mInChunk; i < index; ++i) mInfo.offset += t.sampleSize(i);
    mInfo.size = t.sampleSize(index);

    mSyncPos = static_cast<size_t>(std::lower_bound(t.mSyncSamples.begin(), t.mSyncSamples.end(), index) -
                                   t.mSyncSamples.begin());
    loadSync();
    return true;
}

void SampleCursor::advance() {
    if (!valid()) return;
    const SampleTable& t = mTable;
    ++mIndex;
    if (!valid()) return;

    // Fragments start runs at their own decoding times, and a run of the
    // movie box may list more samples than it holds before a fragment's.
    const SampleTable::TimeRun* time = &t.mTimeRuns[mTimeRun];
    mInfo.dts += time->delta;
    if (mTimeRun + 1 < t.mTimeRuns.size() &&
        (++mTimeInRun == time->count || t.mTimeRuns[mTimeRun + 1].firstSample == mIndex)) {
        time = &t.mTimeRuns[++mTimeRun];
        mTimeInRun = 0;
        mInfo.dts = time->firstDts;
    }

    if (mOffsetRun < t.mOffsetRuns.size() && ++mOffsetInRun == t.mOffsetRuns[mOffsetRun].count) {
        ++mOffsetRun;
        mOffsetInRun = 0;
    }
    mInfo.ctsOffset = mOffsetRun < t.mOffsetRuns.size() ? t.mOffsetRuns[mOffsetRun].offset : 0;

    const SampleTable::ChunkRun* chunks = &t.mChunkRuns[mChunkRun];
    if (mChunkRun + 1 < t.mChunkRuns.size() && t.mChunkRuns[mChunkRun + 1].firstSample == mIndex) {
        chunks = &t.mChunkRuns[++mChunkRun];
        mInChunk = 0;
        mChunk = chunks->firstChunk;
        mInfo.offset = t.chunkOffset(mChunk);
    } else if (++mInChunk == chunks->samplesPerChunk) {
        mInChunk = 0;
        if (++mChunk == chunks->chunkEnd) {
            chunks = &t.mChunkRuns[++mChunkRun];
            mChunk = chunks->firstChunk;
        }
        mInfo.offset = t.chunkOffset(mChunk);
    } else {
        mInfo.offset += mInfo.size;
    }
    mInfo.size = t.sampleSize(mIndex);

    while (mSyncPos < t.mSyncSamples.size() && t.mSyncSamples[mSyncPos] < mIndex) ++mSyncPos;
    loadSync();
}

void SampleCursor::loadSync() {
    mInfo.sync = !mTable.mHaveSyncTable ||
                 (mSyncPos < mTable.mSyncSamples.size() && mTable.mSyncSamples[mSyncPos] == mIndex);
}

}  // namespace mpeg4
}  // namespace android
