#ifndef QN_MEDIA_FLAC_FRAME_CONVERTER_H
#define QN_MEDIA_FLAC_FRAME_CONVERTER_H

#include <cstdint>

#include <media/stagefright/foundation/ABuffer.h>
#include <media/stagefright/foundation/AMessage.h>
#include <utils/RefBase.h>

namespace android {
namespace qnmediaeditor {

// Renumbers the frames of a trimmed FLAC stream (0, 1, 2, ... in the order
// given) with fresh CRCs, and builds the stream header that goes before them.
// One instance per output stream, driven by one thread.
class QNMediaFlacFrameConverter : public RefBase {
public:
    struct ConvertInfo {
        uint32_t utf8Pos;
        uint32_t utf8Size;
        uint32_t extraSize;
        uint32_t crc8Pos;
        uint32_t crc16Pos;
        uint8_t variableBlockSize;
    };

    // Cuts the caller's "csd-0" to its first 42 bytes (marker + STREAMINFO).
    explicit QNMediaFlacFrameConverter(sp<AMessage>& format);
    virtual ~QNMediaFlacFrameConverter();

    bool getCSDBuffer(sp<ABuffer>* buffer, int64_t timeUs);
    bool convert(sp<ABuffer>& inBuffer, sp<ABuffer>* outBuf);

    bool getFrameHeaderInfo(sp<ABuffer>& inBuffer, ConvertInfo& info);
    bool setFrameHeaderInfo(sp<ABuffer>& inBuffer, sp<ABuffer>* outBuf, ConvertInfo& info);

    // Reads at most 7 bytes; the caller guarantees them.
    bool readUTF8UCS2(unsigned char* data, uint64_t* value, uint32_t* size, unsigned char allow36Bits);
    // Reads no further than data[avail - 1]: a code running past it is refused.
    bool readUTF8UCS2(const unsigned char* data, uint32_t avail, uint64_t* value, uint32_t* size,
                      unsigned char allow36Bits);
    bool makeUTF8UCS2(uint64_t value, unsigned char* out, uint32_t* size, unsigned char allow36Bits);

    // The plain one-look-up-per-byte sums.
    static uint8_t crc8(const unsigned char* data, uint32_t size);
    static uint16_t crc16(const unsigned char* data, uint32_t size);
    // The same CRC-16, sixteen bytes per step; used on frame bodies.
    static uint16_t crc16Sliced(const unsigned char* data, uint32_t size);

private:
    uint64_t mFrameNumber;
    sp<ABuffer> mCSDBuffer;

    DISALLOW_EVIL_CONSTRUCTORS(QNMediaFlacFrameConverter);
};

}  // namespace qnmediaeditor
}  // namespace android

#endif
