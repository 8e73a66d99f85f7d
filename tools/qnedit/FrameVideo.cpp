#include "FrameVideo.h"

#include <cstring>
#include <unistd.h>

#include <media/stagefright/FileSource.h>
#include <media/stagefright/MediaBufferBase.h>
#include <media/stagefright/MediaErrors.h>
#include <media/stagefright/MediaExtractorFactory.h>
#include <media/stagefright/Utils.h>

#include "Cli.h"
#include "FramePicture.h"
#include "Input.h"
#include "Interrupt.h"

using namespace android;

namespace qnedit {

namespace {

bool isVideoTrack(const sp<IMediaExtractor>& extractor, size_t i) {
    const sp<MetaData> meta = extractor->getTrackMetaData(i);
    const char* mime = nullptr;
    return meta != nullptr && meta->findCString(kKeyMIMEType, &mime) && strncasecmp(mime, "video/", 6) == 0;
}

}  // namespace

VideoPictures::VideoPictures(const std::string& path, long track) : mPath(path) {
    close(openRegularFile(path));  // refuses FIFOs and devices without blocking
    sp<IMediaExtractor> extractor = MediaExtractorFactory::Create(new FileSource(path.c_str()));
    if (extractor == nullptr) inputError(path + ": not a media file this editor reads");
    const size_t count = extractor->countTracks();
    size_t chosen = count;
    if (track >= 0) {
        if (size_t(track) >= count || !isVideoTrack(extractor, size_t(track))) {
            inputError(path + ": track " + std::to_string(track) + " is not a video track");
        }
        chosen = size_t(track);
    }
    for (size_t i = 0; chosen == count && i < count; ++i) {
        if (isVideoTrack(extractor, i)) chosen = i;
    }
    if (chosen == count) inputError(path + ": no video track");
    mDecoder = VideoDecoderSource::Create(extractor->getTrack(chosen));
    if (mDecoder == nullptr) inputError(path + ": track " + std::to_string(chosen) + " cannot be decoded");
    const status_t err = mDecoder->start();
    if (err != OK) inputError(path + ": " + describeStatus(err));
    const sp<MetaData> format = mDecoder->getFormat();
    format->findInt32(kKeyRotation, &mRotation);
    format->findInt64(kKeyDuration, &mDurationUs);
}

VideoPictures::~VideoPictures() {
    if (mDecoder != nullptr) mDecoder->stop();
}

RgbImage VideoPictures::at(int64_t timeUs, int64_t* shownUs) {
    MediaSource::ReadOptions seek;
    seek.setSeekTo(timeUs, MediaSource::ReadOptions::SEEK_CLOSEST);
    MediaBufferBase* buffer = nullptr;
    status_t err;
    // A change of picture size is announced once, before the picture.
    while ((err = mDecoder->read(&buffer, &seek)) == INFO_FORMAT_CHANGED) seek.clearSeekTo();
    checkInterrupted();
    if (err == ERROR_END_OF_STREAM) {
        inputError(mPath + ": no picture at or after " + formatSeconds(timeUs) + " (the video lasts " +
                   formatSeconds(mDurationUs) + ")");
    }
    if (err != OK) inputError(mPath + ": " + describeStatus(err));
    *shownUs = timeUs;
    buffer->meta_data().findInt64(kKeyTime, shownUs);
    sp<AMessage> format;
    convertMetaDataToMessage(mDecoder->getFormat(), &format);
    try {
        RgbImage image = framePicture(format, static_cast<const uint8_t*>(buffer->data()) + buffer->range_offset(),
                                      mRotation, mPath);
        buffer->release();
        return image;
    } catch (...) {
        buffer->release();
        throw;
    }
}

}  // namespace qnedit
