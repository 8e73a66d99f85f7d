// The bitstream parsers over any bytes: NAL units, AVC configuration records,
// setAVCCSeqHeader, both dimension walks and the HEVC search.
#include <media/MediaCodecBuffer.h>
#include <media/stagefright/MetaData.h>
#include <media/stagefright/foundation/ABuffer.h>

#include "FuzzInput.h"
#include "QNMediaEditorDefs.h"
#include "QNMediaEditorUtils.h"

using namespace android;
using namespace android::qnmediaeditor;

extern "C" int LLVMFuzzerTestOneInput(const uint8_t* data, size_t size) {
    quietLogs();
    QNMediaEditorUtils utils;
    FuzzInput in(data, size);
    const uint8_t selector = in.u8();
    size_t n;
    const uint8_t* bytes = in.rest(&n);

    const uint8_t* pos = bytes;
    size_t left = n;
    const uint8_t* unit;
    size_t unitSize;
    for (int i = 0; i < 4096 && QNMediaEditorUtils::getNextNALUnit(&pos, &left, &unit, &unitSize, selector & 1) == OK; ++i) {
        if (pos == nullptr) break;
    }
    sp<ABuffer> copy = ABuffer::CreateAsCopy(bytes, n);
    if (copy == nullptr) return 0;
    utils.FindNAL(copy->data(), copy->size(), selector & 0x1F);
    QNMediaEditorUtils::IsAVCReferenceFrame(new MediaCodecBuffer(new AMessage, copy));

    sp<MetaData> meta = new MetaData;
    meta->setData(kEditorKeyAVCC, kEditorTypeAVCC, bytes, n);
    sp<AMessage> format;
    utils.convertMetaDataToMessageAVCCSD(meta, &format);

    int size32 = static_cast<int>(n);
    sp<MetaData> out = new MetaData;
    utils.setAVCCSeqHeader(copy->data(), size32, out);

    if (n >= 2) {
        int w, h, cw, ch;
        utils.FindAVCDimensions(copy, &w, &h);
        utils.FindAVCDimensions(copy, &w, &h, &cw, &ch);
    }
    int w, h, cw, ch;
    QNMediaEditorUtils::FindHEVCDimensions(copy, &w, &h, &cw, &ch);
    size_t offset, length;
    QNMediaEditorUtils::getHEVCSPSPosition(copy, &offset, &length);
    return 0;
}
