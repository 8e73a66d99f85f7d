#ifndef AMR_WRITER_H_
#define AMR_WRITER_H_

#include <memory>

#include <media/stagefright/MediaWriter.h>

namespace android {

// AMR storage file ("#!AMR\n" or "#!AMR-WB\n") from one AMR-NB or AMR-WB source.
class AMRWriter : public MediaWriter {
public:
    explicit AMRWriter(int fd);

    status_t initCheck() const;
    status_t addSource(const sp<MediaSource>& source) override;
    status_t start(MetaData* params = nullptr) override;
    status_t stop() override;
    status_t pause() override;
    bool reachedEOS() override;

protected:
    ~AMRWriter() override;

private:
    struct Impl;
    std::unique_ptr<Impl> mImpl;
};

}  // namespace android

#endif
