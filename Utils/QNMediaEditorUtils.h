#ifndef QN_MEDIA_EDITOR_UTILS_H
#define QN_MEDIA_EDITOR_UTILS_H

#include <cstddef>
#include <cstdint>

#include <media/MediaCodecBuffer.h>
#include <media/stagefright/MetaData.h>
#include <media/stagefright/foundation/ABitReader.h>
#include <media/stagefright/foundation/ABuffer.h>
#include <media/stagefright/foundation/AMessage.h>
#include <utils/Errors.h>

namespace android {
namespace qnmediaeditor {

// Stateless operations on Annex-B streams, parameter sets, codec
// configuration records and PCM buffers. The instance operations read no
// state; any instance serves. Failures answer -1001 (ERROR_NOT_CONNECTED)
// unless stated otherwise.
class QNMediaEditorUtils {
public:
    QNMediaEditorUtils();
    virtual ~QNMediaEditorUtils();

    // --- Annex-B NAL units and AVC codec configuration ---

    // Takes the next NAL unit from *data/*size (which must begin with a start
    // code): *unitStart/*unitSize get the unit without start code and trailing
    // zeros, and the position moves to the next start code (null and 0 once
    // the data is used up). With endTerminatesUnit false a unit that no start
    // code follows is not returned. ERROR_MALFORMED when the data does not
    // begin with a start code.
    static status_t getNextNALUnit(const uint8_t** data, size_t* size, const uint8_t** unitStart,
                                   size_t* unitSize, bool endTerminatesUnit);
    // A copy of the first unit of this nal_unit_type, or null.
    sp<ABuffer> FindNAL(const uint8_t* data, size_t size, unsigned type);
    // Appends 00 00 00 01 and the unit, growing the buffer when needed
    // (NO_MEMORY when it cannot).
    status_t copyNALUToABuffer(sp<ABuffer>* buffer, const uint8_t* unit, size_t length);
    // The avcC under kEditorKeyAVCC into "csd-0" (sequence parameter sets)
    // and "csd-1" (picture parameter sets); an empty message without it.
    status_t convertMetaDataToMessageAVCCSD(const sp<MetaData>& meta, sp<AMessage>* format);
    static bool IsAVCReferenceFrame(const sp<MediaCodecBuffer>& accessUnit);
    // MPEG-4 descriptor size field (ISO/IEC 14496-1 expandable size).
    int bytesForSize(unsigned size);
    void storeSize(uint8_t* out, unsigned& offset, unsigned size);
    // The platform conversion, plus "bits-per-sample" from the device's
    // "bit-per-sample".
    static status_t ConvertMetaDataToMessage(const sp<MetaData>& meta, sp<AMessage>* format);

    // --- AVC sequence parameter set ---

    unsigned parseUE(ABitReader* reader);
    // sps: NAL header byte then payload. Displayed (cropped) size.
    void FindAVCDimensions(const sp<ABuffer>& sps, int* width, int* height);
    // Coded size (whole macroblocks) and displayed size.
    void FindAVCDimensions(const sp<ABuffer>& sps, int* width, int* height, int* cropWidth, int* cropHeight);
    // Builds an avcC from Annex-B or 16-bit length-prefixed SPS and PPS and
    // stores it with the picture size; input that is neither is stored as the
    // record itself. size is never changed.
    status_t setAVCCSeqHeader(uint8_t* data, int& size, sp<MetaData>& meta);

    // --- HEVC parameter sets ---

    // The sequence parameter set in a "csd-0" of units behind 00 00 00 01.
    static status_t getHEVCSPSPosition(const sp<ABuffer>& csd0, size_t* offset, size_t* length);
    static status_t FindHEVCDimensions(const sp<ABuffer>& csd0, int* width, int* height, int* cropWidth,
                                       int* cropHeight);

    // --- PCM packing ---

    // 32-bit samples to 24-bit packed: floats rounded (halves away from zero)
    // and clipped, integers keep their top 24 bits. flag false writes the
    // least significant byte first (the library's layout), true the most
    // significant first. in and out may be the same address. Always OK.
    static status_t ConvertXto24packed(float* in, uint8_t* out, int count, bool flag);
    static status_t ConvertXto24packed(unsigned int* in, uint8_t* out, int count, bool flag);
    // In place over the buffer's range, which becomes (0, 3 * samples).
    // ERROR_UNSUPPORTED for encodings other than 32-bit integer and float.
    static status_t ConvertXto24packed(const sp<ABuffer>& buffer, int encoding);
    static status_t ConvertXto24packed(const sp<MediaCodecBuffer>& buffer, int encoding);
    // True for 32-bit integer or float PCM, after rewriting the metadata to
    // describe 24-bit packed PCM; the original encoding goes to *pcmType.
    static bool IsNeedConvert32To24(sp<MetaData>& meta, int* pcmType);
};

}  // namespace qnmediaeditor
}  // namespace android

#endif
