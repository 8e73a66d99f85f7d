#define LOG_TAG "OggExtractor"
#include "ogg/OggPageReader.h"

#include <log/log.h>
#include <media/stagefright/MediaErrors.h>

namespace android {

namespace {
constexpr long kReadSize = 16 * 1024;
}

OggPageReader::OggPageReader(const sp<DataSource>& source)
    : mSource(source), mSize(INT64_MAX), mReadPos(0), mPagePos(0) {
    ogg_sync_init(&mSync);
    off64_t size;
    if (mSource->getSize(&size) == OK && size >= 0) mSize = size;
}

OggPageReader::~OggPageReader() { ogg_sync_clear(&mSync); }

void OggPageReader::seek(off64_t offset) {
    ogg_sync_reset(&mSync);
    mReadPos = mPagePos = offset;
}

status_t OggPageReader::nextPage(ogg_page* page, off64_t* offset) {
    for (;;) {
        const long n = ogg_sync_pageseek(&mSync, page);
        if (n > 0) {
            *offset = mPagePos;
            mPagePos += n;
            return OK;
        }
        if (n < 0) {
            mPagePos += -n;  // not a page, or a page whose CRC fails
            continue;
        }
        if (mReadPos >= mSize) return ERROR_END_OF_STREAM;
        char* buffer = ogg_sync_buffer(&mSync, kReadSize);
        if (buffer == nullptr) return NO_MEMORY;
        const ssize_t got = mSource->readAt(mReadPos, buffer, kReadSize);
        if (got < 0) return static_cast<status_t>(got);
        if (got == 0) {
            mSize = mReadPos;
            return ERROR_END_OF_STREAM;
        }
        ogg_sync_wrote(&mSync, got);
        mReadPos += got;
    }
}

}  // namespace android
