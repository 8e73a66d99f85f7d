#ifndef PLATFORM_OGG_OGG_PAGE_READER_H_
#define PLATFORM_OGG_OGG_PAGE_READER_H_

#include <ogg/ogg.h>

#include <media/stagefright/DataSource.h>

namespace android {

// Pages of an Ogg physical stream, each with its file offset. libogg finds
// the capture pattern and checks each page's CRC; damaged bytes are skipped
// up to the next good page. Holds at most about one page of data.
class OggPageReader {
public:
    explicit OggPageReader(const sp<DataSource>& source);
    ~OggPageReader();

    // Pages from `offset` on.
    void seek(off64_t offset);
    // The next good page; it stays valid until the next call. ERROR_END_OF_STREAM
    // at the end of the data, or the read error.
    status_t nextPage(ogg_page* page, off64_t* offset);
    // Where the next unexamined byte is.
    off64_t position() const { return mPagePos; }
    off64_t size() const { return mSize; }

private:
    const sp<DataSource> mSource;
    ogg_sync_state mSync;
    off64_t mSize;
    off64_t mReadPos;  // next byte to hand to libogg
    off64_t mPagePos;  // first byte libogg has not examined

    OggPageReader(const OggPageReader&) = delete;
    OggPageReader& operator=(const OggPageReader&) = delete;
};

}  // namespace android

#endif
