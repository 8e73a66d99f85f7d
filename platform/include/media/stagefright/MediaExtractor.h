#ifndef MEDIA_EXTRACTOR_H_
#define MEDIA_EXTRACTOR_H_

#include <media/IMediaExtractor.h>
#include <media/stagefright/MediaErrors.h>

namespace android {

// Base of the platform's extractors: remembers the output-format flag and
// gives the common defaults.
class MediaExtractor : public IMediaExtractor {
public:
    uint32_t flags() const override { return CAN_SEEK_BACKWARD | CAN_SEEK_FORWARD | CAN_PAUSE | CAN_SEEK; }
    status_t setOutputFormatFlag(uint32_t flag) override {
        mOutputFormatFlag = flag;
        return OK;
    }

protected:
    MediaExtractor() = default;
    ~MediaExtractor() override = default;
    uint32_t outputFormatFlag() const { return mOutputFormatFlag; }

private:
    uint32_t mOutputFormatFlag = 0;
};

}  // namespace android

#endif
