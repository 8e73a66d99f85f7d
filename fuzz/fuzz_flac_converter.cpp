// FLAC frames of any bytes through the frame converter, with and without a
// stream header.
#include <media/stagefright/foundation/ABuffer.h>
#include <media/stagefright/foundation/AMessage.h>

#include "FuzzInput.h"
#include "QNMediaFlacFrameConverter.h"

using namespace android;
using namespace android::qnmediaeditor;

extern "C" int LLVMFuzzerTestOneInput(const uint8_t* data, size_t size) {
    quietLogs();
    FuzzInput in(data, size);
    sp<AMessage> format = new AMessage;
    const uint8_t csdSize = in.u8();
    if (csdSize >= 42) {
        size_t got;
        const uint8_t* csd = in.take(csdSize, &got);
        if (got >= 42) format->setBuffer("csd-0", ABuffer::CreateAsCopy(csd, got));
    }
    sp<QNMediaFlacFrameConverter> converter = new QNMediaFlacFrameConverter(format);
    sp<ABuffer> header;
    converter->getCSDBuffer(&header, 0);
    for (int i = 0; i < 64; ++i) {
        const size_t frameSize = in.u8() | (size_t(in.u8()) << 8);
        size_t got;
        const uint8_t* frame = in.take(frameSize, &got);
        if (got == 0) break;
        sp<ABuffer> input = ABuffer::CreateAsCopy(frame, got);
        input->meta()->setInt64("timeUs", i);
        sp<ABuffer> output;
        converter->convert(input, &output);
    }
    return 0;
}
