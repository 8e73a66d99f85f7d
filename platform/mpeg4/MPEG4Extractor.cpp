#define LOG_TAG "MPEG4Extractor"
#include "mpeg4/MPEG4Extractor.h"

#include <algorithm>

#include <log/log.h>
#include <media/stagefright/ExtractorRefusal.h>
#include <media/stagefright/MediaDefs.h>
#include <media/stagefright/MediaErrors.h>

#include "extractor/Sniffers.h"
#include "mpeg4/MPEG4Box.h"
#include "mpeg4/MPEG4Source.h"
#include "mpeg4/MPEG4UserData.h"

namespace android {

using mpeg4::FourCC;

namespace {

// The index is held in memory while it is parsed; real ones stay far below.
constexpr uint64_t kMaxIndexBytes = 256 * 1024 * 1024;
constexpr uint64_t kMaxUuidBytes = 16 * 1024 * 1024;
// Files are a handful of boxes at the top, and a fragmented one two more per
// fragment (about two weeks of one-second fragments); a longer run of them
// is not an MP4.
constexpr int kMaxTopLevelBoxes = 4096;
constexpr size_t kMaxFragments = 1u << 20;

bool ReadMovieHeader(ByteReader r, uint32_t* timescale) {
    uint8_t version;
    uint32_t flags;
    return mpeg4::ReadFullBoxHeader(&r, &version, &flags) && r.skip(version == 1 ? 16 : 8) && r.be32(timescale);
}

}  // namespace

MPEG4Extractor::MPEG4Extractor(const sp<DataSource>& source) : mDataSource(source) {
    mInitCheck = readFile();
}

status_t MPEG4Extractor::readFile() {
    if (mDataSource->getSize(&mFileSize) != OK || mFileSize <= 0) {
        ALOGE("the source is empty or has no known size");
        return ERROR_UNSUPPORTED;
    }
    bool haveMovie = false;
    std::vector<std::pair<off64_t, mpeg4::BoxHeader>> fragments;  // each 'moof': where, how long
    off64_t offset = 0;
    for (int boxes = 0; boxes < kMaxTopLevelBoxes && mFileSize - offset >= 8;) {
        mpeg4::BoxHeader box;
        status_t err = mpeg4::ReadTopLevelBoxHeader(mDataSource, offset, mFileSize, &box);
        if (err != OK) {
            if (haveMovie) break;
            ALOGW("unreadable box at %lld", (long long)offset);
            return ERROR_MALFORMED;
        }
        const bool truncated = box.size > uint64_t(mFileSize - offset);
        if (box.type == FourCC('m', 'o', 'o', 'v') && !haveMovie) {
            if (truncated || box.payloadSize() > kMaxIndexBytes) {
                ALOGW("movie box of %llu bytes at %lld does not fit", (unsigned long long)box.size, (long long)offset);
                return ERROR_MALFORMED;
            }
            std::vector<uint8_t> moov(box.payloadSize());
            if (!mDataSource->readExactly(offset + box.headerSize, moov.data(), moov.size())) return ERROR_IO;
            if ((err = readMovie(ByteReader(moov.data(), moov.size()))) != OK) return err;
            haveMovie = true;
        } else if (box.type == FourCC('m', 'o', 'o', 'f') && !truncated) {
            if (fragments.size() == kMaxFragments) {
                ALOGW("more than %zu movie fragments", kMaxFragments);
                return ERROR_MALFORMED;
            }
            fragments.emplace_back(offset, box);
        } else if (box.type == FourCC('u', 'u', 'i', 'd') && !truncated && mpeg4::IsSphereViewUuid(box.userType)) {
            readSphereView(offset + box.headerSize, box.payloadSize());
        }
        // Fragments and their media data are not counted as stray boxes.
        if (box.type != FourCC('m', 'o', 'o', 'f') && box.type != FourCC('m', 'd', 'a', 't')) ++boxes;
        if (truncated) break;
        offset += static_cast<off64_t>(box.size);
    }
    if (!haveMovie) {
        ALOGW("no movie box");
        return ERROR_MALFORMED;
    }
    status_t err = OK;
    if (mFragments != nullptr && (err = readFragments(fragments)) != OK) return err;
    return finishTracks();
}

status_t MPEG4Extractor::readFragments(const std::vector<std::pair<off64_t, mpeg4::BoxHeader>>& fragments) {
    std::vector<uint8_t> moof;
    for (const auto& f : fragments) {
        if (f.second.payloadSize() > kMaxIndexBytes) {
            setRefusalReason("damaged MP4 fragment at byte %lld", (long long)f.first);
            return ERROR_MALFORMED;
        }
        moof.resize(f.second.payloadSize());
        if (!mDataSource->readExactly(f.first + f.second.headerSize, moof.data(), moof.size())) return ERROR_IO;
        const status_t err = mFragments->addFragment(ByteReader(moof.data(), moof.size()), f.first, mTracks);
        if (err == ERROR_END_OF_STREAM) {
            ALOGW("the file ends inside the media data of the fragment at %lld", (long long)f.first);
            break;
        }
        if (err != OK) {
            setRefusalReason("damaged MP4 fragment at byte %lld", (long long)f.first);
            return err;
        }
    }
    return OK;
}

status_t MPEG4Extractor::finishTracks() {
    int64_t durationUs = 0;
    for (const auto& track : mTracks) {
        const status_t err = mpeg4::FinishTrack(mMovieTimescale, uint64_t(mFileSize), track.get());
        if (err != OK) return err;
        int64_t trackUs;
        if (track->meta->findInt64(kKeyDuration, &trackUs)) durationUs = std::max(durationUs, trackUs);
        if (track->isAudio) mItems.publishTrackItems(track->meta.get());
    }
    mFileMeta->setCString(kKeyMIMEType, MEDIA_MIMETYPE_CONTAINER_MPEG4);
    mFileMeta->setInt64(kKeyDuration, durationUs);
    return OK;
}

void MPEG4Extractor::readSphereView(off64_t offset, uint64_t size) {
    if (size > kMaxUuidBytes) {
        ALOGW("sphere view data of %llu bytes ignored", (unsigned long long)size);
        return;
    }
    std::vector<uint8_t> data(size);
    if (!mDataSource->readExactly(offset, data.data(), data.size())) return;
    mpeg4::SetSphereView(mFileMeta.get(), data.data(), data.size());
}

status_t MPEG4Extractor::readMovie(const ByteReader& moov) {
    ByteReader box(nullptr, 0);
    if (!mpeg4::FindChild(moov, FourCC('m', 'v', 'h', 'd'), &box) || !ReadMovieHeader(box, &mMovieTimescale)) {
        ALOGW("no usable movie header");
        return ERROR_MALFORMED;
    }
    mpeg4::BoxIterator it(moov);
    while (it.next()) {
        if (it.header().type != FourCC('t', 'r', 'a', 'k')) continue;
        auto track = std::make_shared<mpeg4::Track>();
        const status_t err = mpeg4::ParseTrack(it.payload(), track.get());
        if (err == ERROR_UNSUPPORTED) continue;
        if (err != OK) return err;
        mTracks.push_back(track);
    }
    if (it.malformed()) return ERROR_MALFORMED;
    if (mTracks.empty()) {
        ALOGW("no track this extractor can hand out");
        return ERROR_UNSUPPORTED;
    }
    // Samples that follow in movie fragments.
    if (mpeg4::FindChild(moov, FourCC('m', 'v', 'e', 'x'), &box)) {
        std::vector<mpeg4::TrackExtends> defaults;
        if (!mpeg4::ReadMovieExtends(box, &defaults)) {
            ALOGW("unusable fragment defaults");
            return ERROR_MALFORMED;
        }
        mFragments.reset(new mpeg4::FragmentReader(std::move(defaults), uint64_t(mFileSize)));
    }
    if (mpeg4::FindChild(moov, FourCC('u', 'd', 't', 'a'), &box)) {
        mpeg4::ParseUserData(box, mFileMeta.get(), &mItems);
    }
    return OK;
}

size_t MPEG4Extractor::countTracks() { return mTracks.size(); }

sp<IMediaSource> MPEG4Extractor::getTrack(size_t index) {
    if (index >= mTracks.size()) return nullptr;
    return new MPEG4Source(mDataSource, mTracks[index], mFileSize);
}

sp<MetaData> MPEG4Extractor::getTrackMetaData(size_t index, uint32_t) {
    if (index >= mTracks.size()) return nullptr;
    return mTracks[index]->meta;
}

sp<MetaData> MPEG4Extractor::getMetaData() { return mFileMeta; }

float SniffMPEG4(const sp<DataSource>& source) {
    uint8_t header[8];
    if (source == nullptr || !source->readExactly(0, header, sizeof(header))) return 0.0f;
    ByteReader r(header, sizeof(header));
    uint32_t size, type;
    r.be32(&size);
    r.be32(&type);
    if (type == FourCC('f', 't', 'y', 'p')) return size >= 8 ? 0.5f : 0.0f;
    // Files without a file-type box start straight with one of these.
    switch (type) {
        case FourCC('m', 'o', 'o', 'v'):
        case FourCC('m', 'd', 'a', 't'):
        case FourCC('f', 'r', 'e', 'e'):
        case FourCC('s', 'k', 'i', 'p'):
        case FourCC('w', 'i', 'd', 'e'):
            return (size == 0 || size == 1 || size >= 8) ? 0.2f : 0.0f;
        default:
            return 0.0f;
    }
}

sp<IMediaExtractor> CreateMPEG4Extractor(const sp<DataSource>& source) {
    if (source == nullptr) return nullptr;
    sp<MPEG4Extractor> extractor = new MPEG4Extractor(source);
    if (extractor->initCheck() != OK) return nullptr;
    return extractor;
}

}  // namespace android
