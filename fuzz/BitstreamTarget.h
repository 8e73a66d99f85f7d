#ifndef FUZZ_BITSTREAM_TARGET_H
#define FUZZ_BITSTREAM_TARGET_H

// The bitstream parsers over any bytes: NAL units, AVC configuration records,
// setAVCCSeqHeader, both dimension walks, the HEVC search, and 24-bit packing
// of ranges of any length.
#include <media/MediaCodecBuffer.h>
#include <media/stagefright/MetaData.h>
#include <media/stagefright/foundation/ABuffer.h>

#include "FuzzInput.h"
#include "QNMediaEditorDefs.h"
#include "QNMediaEditorUtils.h"

namespace fuzztargets {

inline void fuzzBitstream(const uint8_t* data, size_t size) {
    using namespace android;
    using namespace android::qnmediaeditor;
    QNMediaEditorUtils utils;
    FuzzInput in(data, size);
    const uint8_t selector = in.u8();
    size_t n;
    const uint8_t* bytes = in.rest(&n);

    const uint8_t* pos = bytes;
    size_t left = n;
    const uint8_t* unit;
    size_t unitSize;
    sp<ABuffer> units = new ABuffer(16);
    units->setRange(0, 0);
    for (int i = 0; i < 4096 && pos != nullptr &&
                    QNMediaEditorUtils::getNextNALUnit(&pos, &left, &unit, &unitSize, selector & 1) == OK;
         ++i) {
        utils.copyNALUToABuffer(&units, unit, unitSize);
    }
    sp<ABuffer> copy = ABuffer::CreateAsCopy(bytes, n);
    if (copy == nullptr) return;
    utils.FindNAL(copy->data(), copy->size(), selector & 0x1F);
    QNMediaEditorUtils::IsAVCReferenceFrame(new MediaCodecBuffer(new AMessage, copy));

    sp<MetaData> meta = new MetaData;
    meta->setData(kEditorKeyAVCC, kEditorTypeAVCC, bytes, n);
    sp<AMessage> format;
    utils.convertMetaDataToMessageAVCCSD(meta, &format);

    int size32 = static_cast<int>(n);
    sp<MetaData> out = new MetaData;
    utils.setAVCCSeqHeader(copy->data(), size32, out);

    int w, h, cw, ch;
    utils.FindAVCDimensions(copy, &w, &h);
    utils.FindAVCDimensions(copy, &w, &h, &cw, &ch);
    QNMediaEditorUtils::FindHEVCDimensions(copy, &w, &h, &cw, &ch);
    size_t offset, length;
    QNMediaEditorUtils::getHEVCSPSPosition(copy, &offset, &length);

    // Packing works in place on whatever range it is given.
    const int encoding = (selector & 0x20) ? kEditorAudioEncodingPcmFloat : kEditorAudioEncodingPcm32bit;
    sp<ABuffer> pcm = ABuffer::CreateAsCopy(bytes, n);
    if (pcm != nullptr) QNMediaEditorUtils::ConvertXto24packed(pcm, encoding);
}

}  // namespace fuzztargets

#endif
