#define LOG_TAG "AMRWriter"
#include <media/stagefright/AMRWriter.h>

#include <cstring>

#include <log/log.h>
#include <media/stagefright/MediaDefs.h>
#include <media/stagefright/MediaErrors.h>

#include "amr/AMRFrames.h"
#include "writer/SingleSourceWriter.h"

namespace android {

namespace {
const char kMagicNarrowband[] = "#!AMR\n";
const char kMagicWideband[] = "#!AMR-WB\n";
}  // namespace

struct AMRWriter::Impl : public SingleSourceWriter::Format {
    explicit Impl(int fd) : fd(fd), core(fd, "AMRWriter", this) {}
    ~Impl() override { core.stop(); }

    status_t checkSource(const sp<MetaData>& format) override;
    status_t writeHeader(ByteSink& sink, const sp<MetaData>& format) override;
    status_t writeSample(ByteSink& sink, MediaBufferBase& buffer) override;
    status_t finish(ByteSink& sink) override;

    bool isWellFormed(const uint8_t* data, size_t size) const;

    const int fd;
    bool wideband = false;
    size_t dropped = 0;
    SingleSourceWriter core;  // last: stopped before the rest goes
};

status_t AMRWriter::Impl::checkSource(const sp<MetaData>& format) {
    const char* mime = nullptr;
    format->findCString(kKeyMIMEType, &mime);
    if (mime != nullptr && strcasecmp(mime, MEDIA_MIMETYPE_AUDIO_AMR_NB) == 0) {
        wideband = false;
    } else if (mime != nullptr && strcasecmp(mime, MEDIA_MIMETYPE_AUDIO_AMR_WB) == 0) {
        wideband = true;
    } else {
        ALOGE("only AMR and AMR-WB can be written (got %s)", mime ? mime : "no MIME type");
        return ERROR_UNSUPPORTED;
    }
    return OK;
}

status_t AMRWriter::Impl::writeHeader(ByteSink& sink, const sp<MetaData>&) {
    const char* magic = wideband ? kMagicWideband : kMagicNarrowband;
    return sink.write(magic, strlen(magic));
}

bool AMRWriter::Impl::isWellFormed(const uint8_t* data, size_t size) const {
    size_t pos = 0;
    while (pos < size) {
        const size_t frame = AMRFrameSize(wideband, data[pos]);
        if (frame == 0 || frame > size - pos) return false;
        pos += frame;
    }
    return true;
}

status_t AMRWriter::Impl::writeSample(ByteSink& sink, MediaBufferBase& buffer) {
    const uint8_t* data = static_cast<const uint8_t*>(buffer.data()) + buffer.range_offset();
    const size_t size = buffer.range_length();
    // One bad frame would make every later frame unreadable: keep it out.
    if (!isWellFormed(data, size)) {
        ++dropped;
        ALOGW("dropped a malformed sample of %zu bytes (frame type %u)", size, (data[0] >> 3) & 0x0F);
        return OK;
    }
    return sink.write(data, size);
}

status_t AMRWriter::Impl::finish(ByteSink&) {
    if (dropped > 0) ALOGW("%zu malformed samples were dropped", dropped);
    return OK;
}

AMRWriter::AMRWriter(int fd) : mImpl(new Impl(fd)) {}
AMRWriter::~AMRWriter() {}

status_t AMRWriter::initCheck() const { return mImpl->fd >= 0 ? OK : NO_INIT; }
status_t AMRWriter::addSource(const sp<MediaSource>& source) { return mImpl->core.addSource(source); }
status_t AMRWriter::start(MetaData*) { return mImpl->core.start(); }
status_t AMRWriter::stop() { return mImpl->core.stop(); }
status_t AMRWriter::pause() { return mImpl->core.pause(); }
bool AMRWriter::reachedEOS() { return mImpl->core.reachedEOS(); }

}  // namespace android
