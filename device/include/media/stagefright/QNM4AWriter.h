#ifndef QN_M4A_WRITER_H_
#define QN_M4A_WRITER_H_

#include <media/stagefright/MPEG4Writer.h>
#include <media/stagefright/foundation/AMessage.h>
#include <utils/String8.h>

namespace android {

// Audio-only MP4 ("M4A " brand) with the device's items.
class QNM4AWriter : public MPEG4Writer {
public:
    explicit QNM4AWriter(int fd);

    status_t setUserMessage(const uint8_t* message);
    status_t setAudioRecodingMeta(int kind, const String8& text);
    status_t setRecodingParams(const sp<AMessage>& params);

protected:
    ~QNM4AWriter() override;
};

}  // namespace android

#endif
