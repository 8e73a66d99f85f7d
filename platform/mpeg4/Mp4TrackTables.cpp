#define LOG_TAG "Mp4TrackTables"
#include "mpeg4/Mp4TrackTables.h"

#include "mpeg4/Mp4BoxWriter.h"

namespace android {

void Mp4TrackTables::putVarint(std::vector<uint8_t>* out, int64_t value) {
    uint64_t zz = (static_cast<uint64_t>(value) << 1) ^ static_cast<uint64_t>(value >> 63);
    while (zz >= 0x80) {
        out->push_back(static_cast<uint8_t>(zz | 0x80));
        zz >>= 7;
    }
    out->push_back(static_cast<uint8_t>(zz));
}

void Mp4TrackTables::addSample(uint64_t offset, uint32_t size, int64_t dtsUs, int64_t ptsUs,
                               bool sync, bool continuesChunk) {
    const int64_t previous = mSizes.empty() ? 0 : mLastDtsUs;
    putVarint(&mTimeLog, static_cast<int64_t>(static_cast<uint64_t>(dtsUs) - static_cast<uint64_t>(previous)));
    putVarint(&mTimeLog, static_cast<int64_t>(static_cast<uint64_t>(ptsUs) - static_cast<uint64_t>(dtsUs)));
    mLastDtsUs = dtsUs;
    mSizes.push_back(size);
    if (sync) mSyncSamples.push_back(static_cast<uint32_t>(mSizes.size()));
    if (!continuesChunk || mChunkOffsets.empty()) {
        mChunkOffsets.push_back(offset);
        mChunkSamples.push_back(0);
    }
    ++mChunkSamples.back();
    mTotalBytes += size;
}

void Mp4TrackTables::times(std::vector<int64_t>* dtsUs, std::vector<int64_t>* ptsUs) const {
    dtsUs->clear();
    ptsUs->clear();
    dtsUs->reserve(mSizes.size());
    ptsUs->reserve(mSizes.size());
    size_t pos = 0;
    auto next = [&]() {
        uint64_t zz = 0;
        for (int shift = 0; pos < mTimeLog.size() && shift < 64; shift += 7) {
            const uint8_t b = mTimeLog[pos++];
            zz |= uint64_t(b & 0x7F) << shift;
            if ((b & 0x80) == 0) break;
        }
        return static_cast<int64_t>((zz >> 1) ^ (~(zz & 1) + 1));
    };
    uint64_t dts = 0;
    for (size_t i = 0; i < mSizes.size(); ++i) {
        dts += static_cast<uint64_t>(next());
        dtsUs->push_back(static_cast<int64_t>(dts));
        ptsUs->push_back(static_cast<int64_t>(dts + static_cast<uint64_t>(next())));
    }
}

void Mp4TrackTables::writeSyncSamples(Mp4BoxWriter& w) const {
    if (mSyncSamples.size() == mSizes.size()) return;
    w.beginFullBox("stss", 0, 0);
    w.be32(static_cast<uint32_t>(mSyncSamples.size()));
    for (uint32_t n : mSyncSamples) w.be32(n);
    w.endBox();
}

void Mp4TrackTables::writeSampleSizes(Mp4BoxWriter& w) const {
    bool uniform = !mSizes.empty();
    for (uint32_t s : mSizes) uniform = uniform && s == mSizes[0];
    w.beginFullBox("stsz", 0, 0);
    w.be32(uniform ? mSizes[0] : 0);
    w.be32(static_cast<uint32_t>(mSizes.size()));
    if (!uniform) {
        for (uint32_t s : mSizes) w.be32(s);
    }
    w.endBox();
}

void Mp4TrackTables::writeChunks(Mp4BoxWriter& w) const {
    // stsc holds one entry per run of chunks with the same sample count.
    w.beginFullBox("stsc", 0, 0);
    std::vector<uint32_t> firstChunks;
    for (size_t i = 0; i < mChunkSamples.size(); ++i) {
        if (i == 0 || mChunkSamples[i] != mChunkSamples[i - 1]) firstChunks.push_back(static_cast<uint32_t>(i));
    }
    w.be32(static_cast<uint32_t>(firstChunks.size()));
    for (uint32_t i : firstChunks) {
        w.be32(i + 1);
        w.be32(mChunkSamples[i]);
        w.be32(1);  // sample description index
    }
    w.endBox();

    bool wide = false;
    for (uint64_t o : mChunkOffsets) wide = wide || o > UINT32_MAX;
    w.beginFullBox(wide ? "co64" : "stco", 0, 0);
    w.be32(static_cast<uint32_t>(mChunkOffsets.size()));
    for (uint64_t o : mChunkOffsets) {
        if (wide) {
            w.be64(o);
        } else {
            w.be32(static_cast<uint32_t>(o));
        }
    }
    w.endBox();
}

}  // namespace android
