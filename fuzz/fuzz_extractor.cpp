// Any bytes as a media file through the extractor wrapper: open, formats with
// and without raw FLAC, every track selected, every sample read, some seeks.
#include <unistd.h>

#include <media/MediaTrack.h>
#include <media/stagefright/foundation/ABuffer.h>

#include "FuzzInput.h"
#include "QNMediaEditorDefs.h"
#include "QNMediaExtractorWrapper.h"

using namespace android;
using namespace android::qnmediaeditor;

namespace {
void readAll(int fd, size_t size, bool flacRaw) {
    sp<QNMediaExtractorWrapper> w = new QNMediaExtractorWrapper();
    if (w->setDataSource(fd, 0, static_cast<int64_t>(size)) != OK) return;
    if (flacRaw) {
        w->setFlacRaw(true);
        w->setOutputFormatFlag(kEditorExtractorOutputFormat_FlacRaw);
    }
    sp<AMessage> format;
    w->getFileFormat(&format);
    const size_t tracks = w->countTracks();
    for (size_t i = 0; i < tracks && i < 16; ++i) {
        w->getTrackFormat(i, &format);
        w->getTrackMeta(i, 0);
        w->selectTrack(i);
    }
    sp<ABuffer> buffer;
    int64_t time;
    for (int n = 0; n < 20000 && w->getSampleTime(&time) == OK; ++n) {
        if (w->readSampleData(&buffer) != OK) break;
        if (w->advance() != OK) break;
    }
    const MediaTrack::ReadOptions::SeekMode modes[] = {
        MediaTrack::ReadOptions::SEEK_PREVIOUS_SYNC, MediaTrack::ReadOptions::SEEK_NEXT_SYNC,
        MediaTrack::ReadOptions::SEEK_CLOSEST_SYNC, MediaTrack::ReadOptions::SEEK_CLOSEST};
    for (int i = 0; i < 4; ++i) {
        if (w->seekTo(int64_t(i) * 700000, modes[i]) != OK) continue;
        for (int n = 0; n < 8 && w->readSampleData(&buffer) == OK; ++n) w->advance();
    }
    int64_t bitrate;
    w->getTotalBitrate(&bitrate);
}
}  // namespace

extern "C" int LLVMFuzzerTestOneInput(const uint8_t* data, size_t size) {
    quietLogs();
    const int fd = fuzzFd(data, size);
    if (fd < 0) return 0;
    readAll(fd, size, false);
    readAll(fd, size, true);
    close(fd);
    return 0;
}
