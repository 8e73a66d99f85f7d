#ifndef FUZZ_EXTRACTOR_TARGET_H
#define FUZZ_EXTRACTOR_TARGET_H

// Any bytes as a media file through the extractor wrapper, driven the way the
// editor drives it: open, file and track formats (with and without the raw
// FLAC switch), every track selected, every sample read through all three
// read forms, then seeks in every mode.
#include <strings.h>
#include <unistd.h>

#include <media/MediaCodecBuffer.h>
#include <media/MediaTrack.h>
#include <media/stagefright/MediaDefs.h>
#include <media/stagefright/foundation/ABuffer.h>
#include <media/stagefright/foundation/AMessage.h>
#include <media/stagefright/foundation/AString.h>

#include "FuzzInput.h"
#include "QNMediaEditorDefs.h"
#include "QNMediaExtractorWrapper.h"

namespace fuzztargets {

struct WrapperRun {
    android::status_t open = android::UNKNOWN_ERROR;
    size_t tracks = 0;
    size_t samples = 0;  // consumed before the first seek
    bool flac = false;   // a FLAC file: worth a second run with raw frames
};

// maxSamples bounds the reading, not the library: a file may truly hold more.
inline WrapperRun exerciseWrapper(int fd, int64_t length, bool flacRaw, int maxSamples) {
    using namespace android;
    using namespace android::qnmediaeditor;
    typedef MediaTrack::ReadOptions RO;
    WrapperRun run;
    sp<QNMediaExtractorWrapper> w = new QNMediaExtractorWrapper();
    run.open = w->setDataSource(fd, 0, length);
    if (run.open != OK) return run;
    if (flacRaw) {
        w->setFlacRaw(true);
        w->setOutputFormatFlag(kEditorExtractorOutputFormat_FlacRaw);
    }
    sp<AMessage> format;
    AString mime;
    if (w->getFileFormat(&format) == OK && format->findString("mime", &mime)) {
        run.flac = !strcasecmp(mime.c_str(), MEDIA_MIMETYPE_AUDIO_FLAC);
    }
    run.tracks = w->countTracks();
    int64_t durationUs = 0;
    for (size_t i = 0; i < run.tracks && i < 16; ++i) {
        if (w->getTrackFormat(i, &format) == OK && format != nullptr) {
            int64_t d;
            if (format->findInt64("durationUs", &d) && d > durationUs) durationUs = d;
        }
        w->getTrackMeta(i, 0);
        w->selectTrack(i);
    }
    w->selectTrack(run.tracks);  // one past the end is refused

    sp<ABuffer> small = new ABuffer(64);
    sp<MediaCodecBuffer> codec = new MediaCodecBuffer(new AMessage, new ABuffer(1 << 16));
    for (int n = 0; n < maxSamples; ++n) {
        int64_t time;
        size_t track;
        sp<MetaData> meta;
        if (w->getSampleTime(&time) != OK) break;
        w->getSampleTrackIndex(&track);
        w->getSampleMeta(&meta);
        sp<ABuffer> fresh;
        switch (n % 3) {
            case 0: w->readSampleData(&fresh); break;
            case 1: w->readSampleData(small); break;
            default: w->readSampleData(codec); break;
        }
        if (w->advance() != OK) break;
        ++run.samples;
        // Dropping and taking back a track half-way must not upset the merge.
        if (n == maxSamples / 2 && run.tracks > 1) {
            w->unselectTrack(0);
            w->selectTrack(0);
        }
    }

    const RO::SeekMode modes[] = {RO::SEEK_PREVIOUS_SYNC, RO::SEEK_NEXT_SYNC, RO::SEEK_CLOSEST_SYNC,
                                  RO::SEEK_CLOSEST};
    const int64_t targets[] = {0, durationUs / 3, durationUs * 2 / 3, durationUs + 1000000};
    for (int i = 0; i < 4; ++i) {
        if (w->seekTo(targets[i], modes[i]) != OK) continue;
        sp<ABuffer> fresh;
        for (int n = 0; n < 8 && w->readSampleData(&fresh) == OK; ++n) w->advance();
    }
    int64_t bitrate;
    w->getTotalBitrate(&bitrate);
    return run;
}

inline void fuzzExtractor(const uint8_t* data, size_t size) {
    const int fd = fuzzFd(data, size);
    if (fd < 0) return;
    if (exerciseWrapper(fd, static_cast<int64_t>(size), false, 20000).flac) {
        exerciseWrapper(fd, static_cast<int64_t>(size), true, 20000);
    }
    close(fd);
}

}  // namespace fuzztargets

#endif
