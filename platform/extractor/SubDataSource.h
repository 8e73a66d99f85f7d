#ifndef PLATFORM_EXTRACTOR_SUB_DATA_SOURCE_H_
#define PLATFORM_EXTRACTOR_SUB_DATA_SOURCE_H_

#include <media/stagefright/DataSource.h>

namespace android {

// The bytes of another source from `offset` on, as a source of their own:
// a stream behind a tag reads to a codec library as if the tag were absent.
class SubDataSource : public DataSource {
public:
    SubDataSource(const sp<DataSource>& source, off64_t offset) : mSource(source), mOffset(offset) {}

    status_t initCheck() const override { return mOffset >= 0 ? mSource->initCheck() : BAD_VALUE; }
    ssize_t readAt(off64_t offset, void* data, size_t size) override {
        if (offset < 0 || offset > INT64_MAX - mOffset) return BAD_VALUE;
        return mSource->readAt(mOffset + offset, data, size);
    }
    status_t getSize(off64_t* size) override {
        off64_t whole;
        const status_t err = mSource->getSize(&whole);
        if (err != OK) return err;
        *size = whole > mOffset ? whole - mOffset : 0;
        return OK;
    }

private:
    const sp<DataSource> mSource;
    const off64_t mOffset;
};

}  // namespace android

#endif
